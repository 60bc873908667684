// A thousand cards on the real bus and the real main loop; each dialog is a list of what it offers.

#include <gtest/gtest.h>

#include <atomic>

#include "bind/bind_operation.h"
#include "platform/linux/event_loop_work_queues.h"
#include "tests/integration/card_cycles/card_cycles.h"

namespace vlm::test {
namespace {

class ListScreen final : public DialogScreen {
public:
    std::shared_ptr<PairingDialog> makeDialog(
        const std::shared_ptr<BindOperation>& operation) override {
        return std::make_shared<ListedDialog>(*this, operation);
    }
    std::set<std::string> shown() const override { return _shown; }
    int dialogs() const override { return _dialogs; }
    void runUntil(const std::function<bool()>& isSo) override {
        platform::mainLoop().runWhile([&] { return !isSo(); });
    }

private:
    class ListedDialog final : public PairingDialog {
    public:
        ListedDialog(ListScreen& screen, std::shared_ptr<BindOperation> operation)
            : _screen(screen), _operation(std::move(operation)) {
            ++_screen._dialogs;
        }
        ~ListedDialog() override { --_screen._dialogs; }
        ListedDialog(const ListedDialog&) = delete;
        ListedDialog& operator=(const ListedDialog&) = delete;

        bool showWindow() override {
            refreshIdentities();
            return true;
        }
        void refreshIdentities() override {
            _screen._shown.clear();
            for (const auto& [token, names] : *_operation->unpairedIdentities())
                for (const auto& [hash, name] : names) _screen._shown.insert(name);
        }
        void close() override { _screen._shown.clear(); }
        void showAlert(const platform::Alert&, std::function<void()> dismissed) override {
            ADD_FAILURE() << "nothing fails here";
            dismissed();
        }

    private:
        ListScreen& _screen;
        const std::shared_ptr<BindOperation> _operation;
    };

    std::set<std::string> _shown;
    std::atomic<int> _dialogs = 0;
};

TEST(ThousandCards, EachOneIsOfferedAlone) {
    ListScreen screen;
    insertAndPullOneCard(screen);
}

TEST(ThousandCards, OneIsOfferedAlsoAfterSomebodyWasHasty) {
    ListScreen screen;
    insertAndPullOneCardHastily(screen);
}

TEST(ThousandCards, OneOperationFollowsTwo) {
    ListScreen screen;
    insertAndPullTwoCards(screen);
}

TEST(ThousandCards, TwoAreOfferedAlsoAfterSomebodyWasHasty) {
    ListScreen screen;
    insertAndPullTwoCardsHastily(screen);
}

}  // namespace
}  // namespace vlm::test
