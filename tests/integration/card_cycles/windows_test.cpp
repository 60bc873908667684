// A thousand cards on the real bus, the real dialog and the real toolkit's loop.

#include <gtest/gtest.h>

#include <QAbstractEventDispatcher>
#include <QApplication>
#include <QComboBox>
#include <QDialog>
#include <QPixmapCache>
#include <algorithm>
#include <mutex>

#include "platform/linux/event_loop_work_queues.h"
#include "platform/linux/loaded_windowing.h"
#include "tests/integration/card_cycles/card_cycles.h"
#include "tests/integration/windowing/screen.h"
#include "ui/bind_dialog.h"

namespace vlm::test {
namespace {

std::vector<QDialog*> windows() {
    std::vector<QDialog*> found;
    if (!qApp) return found;
    for (auto* widget : QApplication::topLevelWidgets())
        if (widget->objectName() == "BindDialog") found.push_back(qobject_cast<QDialog*>(widget));
    return found;
}

class WindowScreen final : public DialogScreen {
public:
    WindowScreen() { windowingOnScreen(); }

    std::shared_ptr<PairingDialog> makeDialog(
        const std::shared_ptr<BindOperation>& operation) override {
        auto made = BindDialog::initWithOperation(operation);
        const std::lock_guard lock(_mutex);
        std::erase_if(_made, [](const auto& each) { return each.expired(); });
        _made.push_back(made);
        return made;
    }

    std::set<std::string> shown() const override {
        std::set<std::string> titles;
        for (const auto* window : windows()) {
            if (!window->isVisible()) continue;
            const auto* box = window->findChild<QComboBox*>("identityPopup");
            for (int i = 0; i < box->count(); ++i)
                if (!box->itemText(i).isEmpty()) titles.insert(box->itemText(i).toStdString());
        }
        return titles;
    }

    int dialogs() const override {
        const std::lock_guard lock(_mutex);
        const auto alive =
            std::ranges::count_if(_made, [](const auto& each) { return !each.expired(); });
        return static_cast<int>(std::max(std::ssize(windows()), alive));
    }

    // The toolkit comes with the first window, and drives the loop from there. Pictures that it
    // drew it keeps up to a limit, which would look like a leak until it is reached.
    void runUntil(const std::function<bool()>& isSo) override {
        const auto& windowing = platform::loadedWindowing();
        auto& loop = platform::mainLoop();
        loop.runWhile([&] { return !isSo() && !windowing.isLoaded(); });
        if (isSo()) return;
        QPixmapCache::clear();
        const auto looking = QObject::connect(QAbstractEventDispatcher::instance(),
                                              &QAbstractEventDispatcher::aboutToBlock, [&] {
                                                  if (isSo()) QCoreApplication::exit();
                                              });
        windowing.drive(loop);
        QObject::disconnect(looking);
    }

private:
    mutable std::mutex _mutex;
    std::vector<std::weak_ptr<BindDialog>> _made;
};

TEST(ThousandWindows, EachCardIsOfferedAlone) {
    WindowScreen screen;
    insertAndPullOneCard(screen);
}

TEST(ThousandWindows, ACardIsOfferedAlsoAfterSomebodyWasHasty) {
    WindowScreen screen;
    insertAndPullOneCardHastily(screen);
}

TEST(ThousandWindows, OneWindowFollowsTwoCards) {
    WindowScreen screen;
    insertAndPullTwoCards(screen);
}

TEST(ThousandWindows, TwoCardsAreOfferedAlsoAfterSomebodyWasHasty) {
    WindowScreen screen;
    insertAndPullTwoCardsHastily(screen);
}

}  // namespace
}  // namespace vlm::test
