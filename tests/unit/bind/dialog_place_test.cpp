#include "bind/dialog_place.h"

#include <gtest/gtest.h>

#include <atomic>
#include <thread>
#include <vector>

namespace vlm {
namespace {

class NoDialog final : public PairingDialog {
    bool showWindow() override { return true; }
    void refreshIdentities() override {}
    void close() override {}
    void showAlert(const platform::Alert&, std::function<void()>) override {}
};

const auto makeDialog = [] { return std::make_shared<NoDialog>(); };

TEST(DialogPlace, IsFreeAtFirst) {
    DialogPlace place;

    EXPECT_FALSE(place.isTaken());
    EXPECT_EQ(place.get(), nullptr);
    EXPECT_EQ(place.letGo(), nullptr);
    EXPECT_FALSE(place.isTaken()) << "nothing was let go";
}

TEST(DialogPlace, KeepsTheFirstDialogOnly) {
    const auto first = makeDialog();
    DialogPlace place;

    place.keep(first);
    place.keep(makeDialog());

    EXPECT_TRUE(place.isTaken());
    EXPECT_EQ(place.get(), first);
}

TEST(DialogPlace, StaysTakenWhenItsDialogWasLetGo) {
    const auto dialog = makeDialog();
    DialogPlace place;
    place.keep(dialog);

    EXPECT_EQ(place.letGo(), dialog);
    place.keep(makeDialog());

    EXPECT_TRUE(place.isTaken());
    EXPECT_EQ(place.get(), nullptr);
    EXPECT_EQ(dialog.use_count(), 1);
}

TEST(DialogPlace, TakesNoDialogOnceItWasClosed) {
    DialogPlace place;

    EXPECT_TRUE(place.closeIfFree());
    EXPECT_FALSE(place.closeIfFree());
    place.keep(makeDialog());

    EXPECT_EQ(place.get(), nullptr);
}

TEST(DialogPlace, IsNotClosedWhileItHasADialog) {
    const auto dialog = makeDialog();
    DialogPlace place;
    place.keep(dialog);

    EXPECT_FALSE(place.closeIfFree());

    EXPECT_EQ(place.get(), dialog);
}

TEST(DialogPlace, IsSetToAnyDialogAndFreedByNone) {
    const auto dialog = makeDialog();
    DialogPlace place;
    place.keep(makeDialog());

    place.set(dialog);
    EXPECT_EQ(place.get(), dialog);

    place.set(nullptr);
    EXPECT_FALSE(place.isTaken());
    EXPECT_EQ(dialog.use_count(), 1);
}

TEST(DialogPlace, IsWonByOneOnlyOfAllWhoWantIt) {
    for (int round = 0; round < 100; ++round) {
        DialogPlace place;
        std::atomic<int> closed = 0;
        std::vector<std::thread> threads;
        threads.emplace_back([&] { place.keep(makeDialog()); });
        for (int i = 0; i < 2; ++i)
            threads.emplace_back([&] { closed += place.closeIfFree() ? 1 : 0; });
        for (auto& thread : threads) thread.join();

        EXPECT_EQ(closed, place.get() ? 0 : 1);
    }
}

}  // namespace
}  // namespace vlm
