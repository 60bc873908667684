#include "bind_dialog_fixture.h"

namespace vlm {
namespace {

class RefreshIdentities : public BindDialogTest {};

TEST_F(RefreshIdentities, SortsTheIdentitiesOfOneTokenByTitle) {
    offer({{blue, {{{1}, "B"}, {{2}, "A"}}}});

    dialog->showWindow();

    EXPECT_EQ(offered(), (Strings{"A", "B"}));
}

TEST_F(RefreshIdentities, SeparatesTheGroupsOfTwoTokens) {
    offer({{blue, {{{1}, "D"}, {{2}, "C"}}}, {red, {{{3}, "B"}, {{4}, "A"}}}});

    dialog->showWindow();

    EXPECT_EQ(offered(), (Strings{"C", "D", "-", "A", "B"}));
}

TEST_F(RefreshIdentities, PutsASeparatorBeforeEachGroupButTheFirst) {
    offer({{"1", {{{1}, "A"}}}, {"2", {{{2}, "B"}}}, {"3", {{{3}, "C"}}}});

    dialog->showWindow();

    EXPECT_EQ(offered(), (Strings{"A", "-", "B", "-", "C"}));
}

TEST_F(RefreshIdentities, ATokenWithoutIdentitiesStartsAGroupToo) {
    offer({{blue, {}}, {red, {{{1}, "A"}}}});

    dialog->showWindow();

    EXPECT_EQ(offered(), (Strings{"-", "A"}));
}

TEST_F(RefreshIdentities, ASecondTokenWithoutIdentitiesAddsALoneSeparator) {
    offer({{blue, {{{1}, "A"}}}, {red, {}}});

    dialog->showWindow();

    EXPECT_EQ(offered(), (Strings{"A", "-"}));
}

TEST_F(RefreshIdentities, ComparesTitlesLiterally) {
    offer({{blue,
            {{{1}, "b"},
             {{2}, "a10"},
             {{3}, "\xC3\xA4"},
             {{4}, "B"},
             {{5}, "a9"},
             {{6}, "-"},
             {{7}, "a"}}}});

    dialog->showWindow();

    EXPECT_EQ(offered(), (Strings{"-", "B", "a", "a10", "a9", "b", "\xC3\xA4"}));
}

TEST_F(RefreshIdentities, KeepsIdentitiesOfOneTitleApart) {
    offer({{blue, {{{2}, "Alice"}, {{1}, "Alice"}}}});

    dialog->showWindow();

    ASSERT_EQ(offered(), (Strings{"Alice", "Alice"}));
    EXPECT_EQ(popUp().items[0].object, Bytes{1});
    EXPECT_EQ(popUp().items[1].object, Bytes{2});
}

TEST_F(RefreshIdentities, TheSeparatorStaysAheadOfAnIdentityWithoutATitle) {
    offer({{blue, {{{1}, "A"}}}, {red, {{{0}, ""}, {{2}, "B"}}}});

    dialog->showWindow();

    ASSERT_EQ(offered(), (Strings{"A", "-", "", "B"}));
}

TEST_F(RefreshIdentities, ItemsCarryTheHashAsItIs) {
    offer({{blue, {{{0, 0xFF, 0x0A}, "A"}}}});

    dialog->showWindow();

    EXPECT_EQ(popUp().items[0].object, (Bytes{0, 0xFF, 0x0A}));
}

TEST_F(RefreshIdentities, SeparatorsCarryNothing) {
    offer({{blue, {}}, {red, {}}});

    dialog->showWindow();

    ASSERT_EQ(popUp().items.size(), 1U);
    EXPECT_TRUE(popUp().items[0].isSeparator);
    EXPECT_EQ(popUp().items[0].title, "");
    EXPECT_EQ(popUp().items[0].object, std::nullopt);
}

TEST_F(RefreshIdentities, WithoutIdentitiesThePopUpIsEmpty) {
    offer({});

    dialog->showWindow();

    EXPECT_EQ(offered(), Strings{});
}

TEST_F(RefreshIdentities, WithoutACacheEmptiesThePopUp) {
    offer({{blue, {{{1}, "A"}}}});
    dialog->showWindow();

    operation->setUnpairedIdentities(std::nullopt);
    dialog->refreshIdentities();

    EXPECT_EQ(offered(), Strings{});
}

TEST_F(RefreshIdentities, RebuildsTheWholePopUpAndSelectsItsFirstItem) {
    offer({{blue, {{{1}, "A"}, {{2}, "B"}}}});
    dialog->showWindow();
    popUp().choose(1);

    offer({{blue, {{{2}, "B"}, {{3}, "C"}}}, {red, {{{4}, "D"}}}});
    dialog->refreshIdentities();

    EXPECT_EQ(offered(), (Strings{"B", "C", "-", "D"}));
    EXPECT_EQ(popUp().selectedItem()->object, Bytes{2});
}

TEST_F(RefreshIdentities, TheFirstGroupOfARebuiltPopUpHasNoSeparator) {
    offer({{blue, {{{1}, "A"}}}});
    dialog->showWindow();

    dialog->refreshIdentities();

    EXPECT_EQ(offered(), Strings{"A"});
}

TEST_F(RefreshIdentities, BeforeTheWindowIsLoadedDoesNothing) {
    offer({{blue, {{{1}, "A"}}}});

    dialog->refreshIdentities();

    EXPECT_TRUE(windowing().record.empty());
}

}  // namespace
}  // namespace vlm
