#include "platform/linux/qt/catalogue_translator.h"

#include "platform/localization.h"
#include "platform/platform.h"

namespace vlm::platform::qt {

QString CatalogueTranslator::translate(const char*, const char* sourceText, const char*,
                                       int) const {
    const std::string text = current().localization().text(sourceText);
    return text.empty() ? QString() : QString::fromStdString(text);
}

}  // namespace vlm::platform::qt
