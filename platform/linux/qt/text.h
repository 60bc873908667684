// Texts on their way into a window.

#pragma once

#include <QString>
#include <string_view>

#include "platform/harmless_text.h"

namespace vlm::platform::qt {

// What a person gets to read of a stranger's text.
inline QString shownText(std::string_view text) {
    return QString::fromStdString(harmlessText(text));
}

inline QString name(std::string_view text) {
    return QString::fromUtf8(text.data(), static_cast<qsizetype>(text.size()));
}

}  // namespace vlm::platform::qt
