#include "platform/binary_property_list_output.h"

#include <algorithm>

#include "platform/utf.h"

namespace vlm::platform::binary_format {

bool putText(Cursor& output, const std::string& text) {
    if (isAscii(text)) {
        output.putCount(Kind::Ascii, text.size());
        output.putBytes(text.data(), text.size());
        return true;
    }
    const auto units = utf8ToUtf16(text);
    if (!units) return false;
    output.putCount(Kind::Utf16, units->size());
    for (const char16_t unit : *units) output.putNumber(unit, 2);
    return true;
}

}  // namespace vlm::platform::binary_format
