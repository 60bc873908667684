// CatalogueTranslator: gives the toolkit our texts. A window description holds keys; the toolkit
// asks for their texts when it loads one, and also for the writing direction
// ("QT_LAYOUT_DIRECTION").

#pragma once

#include <QTranslator>

namespace vlm::platform::qt {

class CatalogueTranslator final : public QTranslator {
public:
    bool isEmpty() const override { return false; }

    // The null text for what is no key of ours: the toolkit's own texts stay.
    QString translate(const char* context, const char* sourceText, const char* disambiguation,
                      int n) const override;
};

}  // namespace vlm::platform::qt
