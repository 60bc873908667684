#include "services/hints/pinentry_dialog.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <iterator>

#include "pinentry_conversation.h"

namespace vlm::service {
namespace {

using Outcome = PinAnswer::Outcome;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;

PinentryForm question(PinState state = PinState::Ready) {
    return pinForm({"PIV Card", "Alice", state, "alice", {}});
}

TEST(PinentryDialogTest, SaysItsWishesInOrderAndThenAsksForThePin) {
    PinentryDialog dialog(question(), PinentryTerminal{"/dev/pts/3", "xterm"});

    EXPECT_THAT(
        sayAll(dialog),
        ElementsAre("OPTION ttyname=/dev/pts/3\n", "OPTION ttytype=xterm\n",
                    "OPTION lc-ctype=C.UTF-8\n", "SETTIMEOUT 120\n", "SETTITLE Smart card\n",
                    "SETDESC Enter the PIN of the card \"PIV Card\". The card then proves "
                    "that it holds the identity \"Alice\", so that it can be paired with the "
                    "account alice.\n",
                    "SETPROMPT PIN:\n", "GETPIN\n"));
    EXPECT_FALSE(dialog.isOver());
}

TEST(PinentryDialogTest, NamesNoTerminalOnADesktop) {
    PinentryDialog dialog(question(), std::nullopt);

    EXPECT_THAT(sayAll(dialog), testing::Each(Not(HasSubstr("tty"))));
}

TEST(PinentryDialogTest, NamesNoAccountWhereItMayBeAny) {
    PinentryDialog dialog(pinForm({"PIV Card", "Alice", PinState::Ready, "", {}}), std::nullopt);

    EXPECT_THAT(sayAll(dialog), Contains(HasSubstr("can be paired with an account.\n")));
}

TEST(PinentryDialogTest, SaysWhatTheCardTellsOfTheTriesThatAreLeft) {
    PinentryDialog few(question(PinState::FewTriesLeft), std::nullopt);
    PinentryDialog last(question(PinState::LastTry), std::nullopt);

    EXPECT_THAT(sayAll(few), Contains(HasSubstr("%0A%0AA wrong PIN was entered before")));
    EXPECT_THAT(sayAll(last), Contains(HasSubstr("%0A%0AThis is the last try")));
}

TEST(PinentryDialogTest, AsksForTheLastTryOnlyOfWhoWantsIt) {
    for (const auto state : {PinState::Ready, PinState::FewTriesLeft}) {
        PinentryDialog dialog(question(state), std::nullopt);
        EXPECT_THAT(sayAll(dialog), Not(Contains("CONFIRM\n")));
    }
    PinentryDialog last(question(PinState::LastTry), std::nullopt);

    const auto said = sayAll(last);

    const auto confirm = std::ranges::find(said, "CONFIRM\n");
    ASSERT_NE(confirm, said.end());
    EXPECT_THAT(*std::prev(confirm), HasSubstr("only one try is left"));
    EXPECT_THAT(*std::next(confirm), HasSubstr("SETDESC Enter the PIN"));
    EXPECT_EQ(said.back(), "GETPIN\n");
}

struct Declined {
    const char* line;
    Outcome outcome;
};

TEST(PinentryDialogTest, AsksForNoPinWithoutAYesToTheLastTry) {
    constexpr Declined kDeclined[] = {
        {"ERR 83886179 Operation cancelled <Pinentry>", Outcome::Cancelled},
        {"ERR 83886194 Not confirmed <Pinentry>", Outcome::Cancelled},
        {"ERR 83886142 Timeout <Pinentry>", Outcome::TimedOut},
        {"ERR 536871187 Unknown IPC command <User defined source 1>", Outcome::Unavailable},
    };
    for (const auto& [line, outcome] : kDeclined) {
        SCOPED_TRACE(line);
        PinentryDialog dialog(question(PinState::LastTry), std::nullopt);
        auto said = dialog.take("OK");
        while (said != "CONFIRM\n") said = dialog.take("OK");

        EXPECT_EQ(dialog.take(line), "");

        EXPECT_TRUE(dialog.isOver());
        EXPECT_EQ(dialog.takeAnswer().outcome, outcome);
    }
}

TEST(PinentryDialogTest, LetsNoNameSpeakForIt) {
    const PinQuestion hostile{"A\nGETPIN 100%25\r",
                              std::string(5000, 'x'),
                              PinState::LastTry,
                              std::string(5000, 'y'),
                              {}};
    PinentryDialog dialog(pinForm(hostile), PinentryTerminal{"/dev/pts/3\nBYE", "xterm"});

    for (const auto& line : sayAll(dialog)) {
        EXPECT_LE(line.size(), 1000u);
        EXPECT_EQ(line.find('\n'), line.size() - 1) << line;
        EXPECT_THAT(line, Not(HasSubstr("100%25\"")));
    }
}

struct Conversation {
    const char* why;
    std::vector<std::string> said;  // by the program, after the request for the PIN
    Outcome outcome;
    const char* pin;
};

TEST(PinentryDialogTest, UnderstandsEachAnswer) {
    const Conversation rows[] = {
        {"a PIN", {"D 123456", "OK"}, Outcome::Given, "123456"},
        {"an escaped PIN", {"D a%25b%0Ac%2a", "OK"}, Outcome::Given, "a%b\nc*"},
        {"a per cent sign that escapes nothing", {"D 1%zz%2", "OK"}, Outcome::Given, "1%zz%2"},
        {"a PIN with blanks", {"D 1 2 ", "OK"}, Outcome::Given, "1 2 "},
        {"a PIN in two pieces", {"D 12", "D 34", "OK"}, Outcome::Given, "1234"},
        {"remarks and states", {"# hi", "S PASSWORD_FROM_CACHE", "D 1", "OK"}, Outcome::Given, "1"},
        {"an empty PIN", {"OK"}, Outcome::Cancelled, ""},
        {"cancelled", {"ERR 83886179 Operation cancelled <Pinentry>"}, Outcome::Cancelled, ""},
        {"cancelled by a bare number", {"ERR 99"}, Outcome::Cancelled, ""},
        {"wholly cancelled", {"ERR 83886278 cancelled"}, Outcome::Cancelled, ""},
        {"timed out", {"ERR 83886142 Timeout <Pinentry>"}, Outcome::TimedOut, ""},
        {"another failure", {"ERR 83918950 Inappropriate ioctl"}, Outcome::Unavailable, ""},
        {"a failure without a number", {"ERR"}, Outcome::Unavailable, ""},
        {"a failure after a PIN", {"D 123", "ERR 83886179 cancelled"}, Outcome::Cancelled, ""},
        {"a PIN that is too long", {"D " + std::string(257, '1'), "OK"}, Outcome::Unavailable, ""},
    };
    for (const auto& [why, said, outcome, pin] : rows) {
        SCOPED_TRACE(why);
        PinentryDialog dialog(question(), std::nullopt);
        sayAll(dialog);

        for (const auto& line : said) EXPECT_EQ(dialog.take(line), "");

        EXPECT_TRUE(dialog.isOver());
        const auto answer = dialog.takeAnswer();
        EXPECT_EQ(answer.outcome, outcome);
        EXPECT_EQ(answer.pin.text(), pin);
        EXPECT_EQ(answer.reason.empty(), outcome != Outcome::Unavailable);
    }
}

TEST(PinentryDialogTest, TakesTheLongestPin) {
    PinentryDialog dialog(question(), std::nullopt);
    sayAll(dialog);

    dialog.take("D " + std::string(256, '1'));
    dialog.take("OK");

    EXPECT_EQ(dialog.takeAnswer().pin.text().size(), 256u);
}

TEST(PinentryDialogTest, AsksAlsoWhenTheProgramKnowsNoneOfItsWishes) {
    PinentryDialog dialog(question(), std::nullopt);
    auto line = dialog.take("OK");
    while (line != "GETPIN\n") {
        ASSERT_FALSE(line.empty());
        line = dialog.take("ERR 83886254 Unknown option");
    }

    dialog.take("D 1");
    dialog.take("OK");

    EXPECT_EQ(dialog.takeAnswer().outcome, Outcome::Given);
}

TEST(PinentryDialogTest, TakesNoPinThatItHasNotAskedFor) {
    PinentryDialog dialog(question(), std::nullopt);
    dialog.take("D 666");
    sayAll(dialog);

    dialog.take("D 1");
    dialog.take("OK");

    EXPECT_EQ(dialog.takeAnswer().pin.text(), "1");
}

TEST(PinentryDialogTest, EndsWhenTheProgramGreetsWithAnError) {
    PinentryDialog dialog(question(), std::nullopt);

    EXPECT_EQ(dialog.take("ERR 16 no display\x1b"), "");

    EXPECT_TRUE(dialog.isOver());
    EXPECT_THAT(dialog.takeAnswer().reason, HasSubstr("no display\uFFFD"));
}

TEST(PinentryDialogTest, AnswersNoQuestionsOfTheProgram) {
    PinentryDialog dialog(question(), std::nullopt);
    sayAll(dialog);

    EXPECT_EQ(dialog.take("INQUIRE QUALITY 1234"), "CAN\n");
    EXPECT_FALSE(dialog.isOver());
}

TEST(PinentryDialogTest, KeepsItsAnswerWhateverComesLater) {
    PinentryDialog dialog(question(), std::nullopt);
    sayAll(dialog);
    dialog.take("D 1");
    dialog.take("OK");

    dialog.breakOff("it ended");
    EXPECT_EQ(dialog.take("ERR 83886179 cancelled"), "");

    EXPECT_EQ(dialog.takeAnswer().outcome, Outcome::Given);
}

TEST(PinentryDialogTest, IsBrokenOffWithAReason) {
    PinentryDialog dialog(question(), std::nullopt);

    dialog.breakOff("the program ended");

    EXPECT_TRUE(dialog.isOver());
    const auto answer = dialog.takeAnswer();
    EXPECT_EQ(answer.outcome, Outcome::Unavailable);
    EXPECT_EQ(answer.reason, "the program ended");
}

}  // namespace
}  // namespace vlm::service
