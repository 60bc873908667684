#include "platform/linux/qt/qt_windowing.h"

#include "platform/linux/qt/qt_window.h"
#include "platform/linux/qt/window_loader.h"
#include "platform/system_log.h"
#include "platform/token_framework.h"

namespace vlm::platform::qt {

namespace {

constexpr Log kLog(kTokenFramework, "windowing");

// X comes first, since only there a window can float above all others and choose its place.
constexpr const char* kScreens = "xcb;wayland";

// A screen that nobody sees. It is tried last, also where the environment knows better than we do
// what to try: the toolkit would end the process when it can reach no screen at all.
constexpr const char* kNoScreen = "offscreen";

std::string wantedScreens() {
    const auto wanted = qgetenv("QT_QPA_PLATFORM").toStdString();
    return wanted.empty() ? kScreens : wanted;
}

// A program's arguments, in the shape that the toolkit takes them.
class Arguments {
public:
    explicit Arguments(std::vector<std::string> words)
        : count(static_cast<int>(words.size())), _words(std::move(words)) {
        for (auto& word : _words) _pointers.push_back(word.data());
        _pointers.push_back(nullptr);
    }
    Arguments(const Arguments&) = delete;
    Arguments& operator=(const Arguments&) = delete;

    int count;
    char** pointers() { return _pointers.data(); }

private:
    std::vector<std::string> _words;
    std::vector<char*> _pointers;
};

std::vector<std::string> startOnAScreen() {
    return {"vlmbind", "-platform", wantedScreens() + ';' + kNoScreen};
}

// Unseen by anybody but whoever asked for just that.
bool isScreenReached() {
    return QGuiApplication::platformName() != kNoScreen ||
           wantedScreens().find(kNoScreen) != std::string::npos;
}

// A theme that the environment names is loaded on any screen, also on the one that nobody sees, and
// may end the process there. So a screen is looked for without that theme first.
bool isScreenThereForTheme() {
    if (qEnvironmentVariableIsEmpty("QT_QPA_PLATFORMTHEME")) return true;
    auto words = startOnAScreen();
    words.insert(words.end(), {"-platformtheme", "none"});
    Arguments arguments(words);
    const QGuiApplication trial(arguments.count, arguments.pointers());
    return isScreenReached();
}

}  // namespace

bool QtWindowing::start() {
    if (!qApp) {
        if (!isScreenThereForTheme()) return false;
        // They have to last as long as the toolkit, which is for ever.
        static auto& arguments = *new Arguments(startOnAScreen());
        new QApplication(arguments.count, arguments.pointers());
        QCoreApplication::installTranslator(&_texts);
        QApplication::setQuitOnLastWindowClosed(false);
    }
    return isScreenReached();
}

std::unique_ptr<Window> QtWindowing::loadWindow(std::string_view description) {
    if (!start()) {
        kLog.error("loading the window {}: there is no screen to show it on",
                   std::string(description));
        return nullptr;
    }
    auto dialog = WindowLoader().load(description);
    return dialog ? std::make_unique<QtWindow>(std::move(dialog)) : nullptr;
}

// A window manager may refuse to take the focus from somebody who types; then the window asks for
// attention.
void QtWindowing::activateIgnoringOthers() {
    if (!qApp) return;
    for (auto* window : QApplication::topLevelWidgets()) {
        if (!window->isVisible() || !window->isWindow()) continue;
        window->activateWindow();
        QApplication::alert(window);
    }
}

}  // namespace vlm::platform::qt
