// QtWindowing: windows by Qt. The toolkit starts with the first window.

#pragma once

#include <QApplication>
#include <memory>

#include "platform/linux/qt/catalogue_translator.h"
#include "platform/windowing.h"

namespace vlm::platform::qt {

class QtWindowing final : public Windowing {
public:
    std::unique_ptr<Window> loadWindow(std::string_view description) override;
    void activateIgnoringOthers() override;

    // Starts the toolkit when it does not run yet; false when there is no screen.
    bool start();

private:
    CatalogueTranslator _texts;
};

}  // namespace vlm::platform::qt
