// How a pinentry program is asked for the password of a login keyring.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "pinentry_conversation.h"
#include "services/hints/pinentry_dialog.h"

namespace vlm::service {
namespace {

using Outcome = PinAnswer::Outcome;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;

PinentryForm passwordTwice() {
    PasswordQuestion question{"PIV Card", "alice"};
    question.isTypedTwice = true;
    return passwordForm(question);
}

TEST(PinentryPasswordTest, AsksForThePasswordOfAKeyringAndNamesCardAndAccount) {
    PinentryDialog dialog(passwordForm({"PIV Card", "alice"}), std::nullopt);

    EXPECT_THAT(
        sayAll(dialog),
        ElementsAre("OPTION lc-ctype=C.UTF-8\n", "SETTIMEOUT 600\n", "SETTITLE Login keyring\n",
                    "SETDESC Enter the password of your login keyring, once, so that the "
                    "card \"PIV Card\" can open it from now on when alice logs in with "
                    "it. As a rule it is your login password.\n",
                    "SETPROMPT Password:\n", "GETPIN\n"));
}

TEST(PinentryPasswordTest, SaysThatThePasswordBeforeWasWrong) {
    PasswordQuestion again{"PIV Card", "alice"};
    again.wasRefused = true;
    PinentryDialog dialog(passwordForm(again), std::nullopt);

    EXPECT_THAT(sayAll(dialog),
                Contains("SETERROR This password does not open your login keyring.\n"));
}

TEST(PinentryPasswordTest, LetsAPasswordThatNothingChecksBeTypedTwice) {
    PinentryDialog dialog(passwordTwice(), std::nullopt);

    const auto said = sayAll(dialog);
    EXPECT_THAT(said, Contains("SETREPEAT Again:\n"));
    EXPECT_THAT(said, Contains(HasSubstr("asked for twice")));

    dialog.take("D secret");
    dialog.take("S PIN_REPEATED");
    dialog.take("OK");
    EXPECT_EQ(dialog.takeAnswer().pin.text(), "secret");
}

TEST(PinentryPasswordTest, TakesNoPasswordFromAProgramThatCannotAskTwice) {
    PinentryDialog dialog(passwordTwice(), std::nullopt);
    sayAll(dialog);

    dialog.take("D secret");
    dialog.take("OK");

    const auto answer = dialog.takeAnswer();
    EXPECT_EQ(answer.outcome, Outcome::Unavailable);
    EXPECT_TRUE(answer.pin.empty());
    EXPECT_THAT(answer.reason, HasSubstr("does not ask twice"));
}

TEST(PinentryPasswordTest, TakesAPasswordThatIsLongerThanAnyPin) {
    PinentryDialog dialog(passwordForm({"PIV Card", "alice"}), std::nullopt);
    sayAll(dialog);

    dialog.take("D " + std::string(900, 'x'));
    dialog.take("D " + std::string(124, 'y'));
    dialog.take("OK");

    EXPECT_EQ(dialog.takeAnswer().pin.text().size(), 1024u);
}

TEST(PinentryPasswordTest, TakesNoPasswordThatIsTooLong) {
    PinentryDialog dialog(passwordForm({"PIV Card", "alice"}), std::nullopt);
    sayAll(dialog);

    dialog.take("D " + std::string(900, 'x'));
    dialog.take("D " + std::string(125, 'y'));
    dialog.take("OK");

    EXPECT_EQ(dialog.takeAnswer().outcome, Outcome::Unavailable);
}

}  // namespace
}  // namespace vlm::service
