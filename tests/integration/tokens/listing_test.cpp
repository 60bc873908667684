// What is listed, on real software cards.

#include <gmock/gmock.h>
#include <sys/wait.h>

#include <algorithm>
#include <ctime>
#include <filesystem>

#include "services/hints/tokens/signature.h"
#include "tests/integration/tokens/tokens_test.h"

namespace vlm::test {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;
using namespace std::chrono_literals;

class ListingTest : public TokensTest {};

TEST_F(ListingTest, IsEmptyWithoutAnyModule) {
    cards.configureModule("softhsm", "module:\n");

    EXPECT_THAT(list(), IsEmpty());
    EXPECT_THAT(warnings(), IsEmpty());
}

TEST_F(ListingTest, SaysWhetherATokenMayComeUnannounced) {
    list();
    EXPECT_EQ(tokens().lookAgain(), service::LookAgain::NowAndThen);

    dropTokens();
    cards.configureModule("softhsm", "module:\n");
    list();

    EXPECT_EQ(tokens().lookAgain(), service::LookAgain::OnCardEvent);
}

TEST_F(ListingTest, LeavesOutAnUninitialisedToken) {
    // The software module always has an empty token in its last slot.
    EXPECT_THAT(list(), IsEmpty());

    cards.add("good", {identity("p256", "Alice")});

    EXPECT_THAT(namesOf(list()), ElementsAre("good"));
    EXPECT_THAT(warnings(), IsEmpty());
}

TEST_F(ListingTest, TellsWhatIsOnACard) {
    cards.add("Alice's card", {identity("rsa2048", "Alice Example")});

    const auto all = list();

    ASSERT_THAT(all, SizeIs(1));
    const Token& token = all[0];
    EXPECT_THAT(token.identifier,
                testing::MatchesRegex("pkcs11:model=SoftHSM%20v2;manufacturer=SoftHSM%20project;"
                                      "serial=[0-9a-f]+;token=Alice%27s%20card"));
    EXPECT_EQ(token.name, "Alice's card");
    EXPECT_FALSE(token.hasPinPad);
    EXPECT_TRUE(token.needsLogin);
    EXPECT_EQ(token.pinState, PinState::Ready);
    ASSERT_THAT(token.identities, SizeIs(1));
    const Identity& identity = token.identities[0];
    EXPECT_EQ(identity.name, "Alice Example");
    EXPECT_EQ(identity.publicKeyHash, service::sha256(identity.publicKeyInfo));
    EXPECT_TRUE(identity.canSign);
    EXPECT_TRUE(identity.validAt(std::time(nullptr)));
    EXPECT_EQ(token.wrapKeyHash, identity.publicKeyHash);
}

TEST_F(ListingTest, SeesCardsComeAndGo) {
    cards.add("first", {identity("p256", "Alice")});
    EXPECT_THAT(namesOf(list()), ElementsAre("first"));

    cards.add("second", {identity("p256", "Bob")});
    EXPECT_THAT(namesOf(list()), ElementsAre("first", "second"));

    cards.remove("first");
    EXPECT_THAT(namesOf(list()), ElementsAre("second"));
    cards.remove("second");
    EXPECT_THAT(list(), IsEmpty());
    EXPECT_THAT(warnings(), IsEmpty());
}

TEST_F(ListingTest, SeesARemovalAtOnceAlsoWhenItDoesNotLookForNewCards) {
    options.lookAgainAfter = 1h;
    cards.add("first", {identity("p256", "Alice")});
    cards.add("second", {identity("p256", "Bob")});
    EXPECT_THAT(namesOf(list()), ElementsAre("first", "second"));

    cards.remove("first");

    EXPECT_THAT(namesOf(list()), ElementsAre("second"));
    EXPECT_THAT(warnings(), IsEmpty());
}

TEST_F(ListingTest, ReadsACardOnceWhileItStays) {
    options.lookAgainAfter = 1h;
    cards.add("card", {identity("p256", "Alice"), identity("rsa2048", "Bob")});
    const auto before = list();
    ASSERT_THAT(before, SizeIs(1));

    // What is on the card can be read no more; the card itself is still there.
    for (const auto& file : std::filesystem::recursive_directory_iterator(cards.folder()))
        if (file.path().extension() == ".object" && file.path().filename() != "token.object")
            std::filesystem::remove(file.path());

    EXPECT_EQ(list(), before);
    dropTokens();
    EXPECT_THAT(tokenCalled("card").identities, IsEmpty()) << "the test took nothing away";
}

TEST_F(ListingTest, IsInTheOrderOfIdentifiersAndHashesHoweverTheModuleOrdersThem) {
    std::vector<Card> mixed;
    for (const char* label : {"c", "a", "b", "e", "d"})
        mixed.push_back({.label = label,
                         .identities = {identity("p256", "One"), identity("p256", "Two"),
                                        identity("p256", "Three"), identity("p384", "Four")}});
    cards.add(mixed);

    const auto all = list();

    ASSERT_THAT(all, SizeIs(5));
    EXPECT_TRUE(std::ranges::is_sorted(all, std::less(), &Token::identifier));
    for (const Token& token : all) {
        EXPECT_THAT(token.identities, SizeIs(4));
        EXPECT_TRUE(
            std::ranges::is_sorted(token.identities, std::less(), &Identity::publicKeyHash));
    }
    dropTokens();
    EXPECT_EQ(list(), all) << "a new worker must list the same";
}

TEST_F(ListingTest, TellsApartTwoCardsWithOneLabel) {
    cards.add("twin", {identity("p256", "Alice")});
    cards.add("twin", {identity("p256", "Bob")});

    const auto all = list();

    ASSERT_THAT(all, SizeIs(2));
    EXPECT_NE(all[0].identifier, all[1].identifier);
    EXPECT_EQ(all[0].name, all[1].name);
}

TEST_F(ListingTest, AnswersAllWhoAskAtTheSameTime) {
    cards.add("card", {identity("p256", "Alice")});
    std::vector<std::vector<Token>> answers;
    for (int i = 0; i < 5; ++i)
        tokens().list([&answers](std::vector<Token> all) { answers.push_back(std::move(all)); });

    runUntil([&answers] { return answers.size() == 5; });

    for (const auto& answer : answers) EXPECT_EQ(answer, answers[0]);
    EXPECT_THAT(answers[0], SizeIs(1));
}

TEST_F(ListingTest, MayBeAskedAgainFromWithinAnAnswer) {
    cards.add("card", {identity("p256", "Alice")});
    std::optional<std::vector<Token>> second;
    tokens().list([&](std::vector<Token>) {
        tokens().list([&second](std::vector<Token> all) { second = std::move(all); });
    });

    runUntil([&second] { return second.has_value(); });

    EXPECT_THAT(*second, SizeIs(1));
}

TEST_F(ListingTest, LetsGoOfAnIdleWorkerAndStartsANewOneWhenNeeded) {
    options.limits.idle = 10ms;
    cards.add("card", {identity("p256", "Alice")});
    EXPECT_THAT(list(), SizeIs(1));

    // The loop reaps the worker that has left, so that no child is there to wait for.
    runUntil([] { return waitid(P_ALL, 0, nullptr, WEXITED | WNOHANG | WNOWAIT) == -1; });

    EXPECT_THAT(list(), SizeIs(1));
    EXPECT_THAT(warnings(), IsEmpty());
}

TEST_F(ListingTest, ShowsACardThatTwoModulesShowOnce) {
    configureModule("counting");
    cards.add("card", {identity("p256", "Alice")});

    EXPECT_THAT(namesOf(list()), ElementsAre("card"));
}

TEST_F(ListingTest, HoldsFiftyCards) {
    std::vector<std::string> labels;
    std::vector<Card> fifty;
    for (int i = 10; i < 60; ++i) {
        labels.push_back("card" + std::to_string(i));
        fifty.push_back({.label = labels.back(),
                         .identities = {identity("p256", "First"), identity("p256", "Second")}});
    }
    cards.add(fifty);

    const auto all = list();

    EXPECT_EQ(namesOf(all), labels);
    for (const Token& token : all) EXPECT_THAT(token.identities, SizeIs(2));
}

}  // namespace
}  // namespace vlm::test
