#include "services/pam/authentication.h"

#include <gmock/gmock.h>
#include <security/pam_modules.h>

#include "authentication_fixture.h"

namespace vlm::pam {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

TEST_F(AuthenticationTest, AsksForThePinOfTheCardAndGivesTheUnlockKeyOnly) {
    transaction.name("alice");
    transaction.willType("123456");
    service.answer(kSearch, card());
    service.answer(kLogin, letInWith("pw-alice"));

    EXPECT_EQ(run(), PAM_SUCCESS);

    EXPECT_THAT(transaction.prompts, ElementsAre("PIN of the card \"PIV Card\": "));
    EXPECT_EQ(transaction.givenToken, "pw-alice");
    ASSERT_EQ(service.requests.size(), 2u);
    EXPECT_EQ(*service.requests[0].text("str1"), "alice");
    EXPECT_EQ(*service.requests[1].text("str1"), "alice");
    EXPECT_EQ(*service.requests[1].text("str2"), "pkcs11:token=a");
    EXPECT_EQ(*service.requests[1].bytes("dat1"), platform::Bytes(32, 1));
    EXPECT_EQ(service::secretIn(*service.requests[1].endpoint("dat2"))->text(), "123456");
    EXPECT_THAT(service.patiences, ElementsAre(std::chrono::seconds(5), std::chrono::seconds(90)));
    EXPECT_EQ(transaction.remembered()->tokenIdentifier, "pkcs11:token=a");
}

TEST_F(AuthenticationTest, LeavesTheTokenAloneWithoutAnUnlockKey) {
    transaction.name("alice");
    transaction.willType("123456");
    service.answer(kSearch, card());
    service.answer(kLogin, letIn());

    EXPECT_EQ(run(), PAM_SUCCESS);
    EXPECT_EQ(transaction.givenToken, "");
}

TEST_F(AuthenticationTest, LetsInWithAnUnlockKeyThatNobodyCanRead) {
    transaction.name("alice");
    transaction.willType("123456");
    service.answer(kSearch, card());
    auto reply = letInWith("pw");
    service::secretIn(*reply->endpoint("dat1"));
    service.answer(kLogin, reply);

    EXPECT_EQ(run(), PAM_SUCCESS);
    EXPECT_EQ(transaction.givenToken, "");
    EXPECT_THAT(transaction.told,
                ElementsAre("info: The login keyring will ask for its password."));
}

TEST_F(AuthenticationTest, SendsWhoHasAReaderWithAPadToIt) {
    transaction.name("alice");
    service.answer(kSearch, card(1));
    service.answer(kLogin, letInWith("pw"));

    EXPECT_EQ(run(), PAM_SUCCESS);

    EXPECT_THAT(transaction.prompts, IsEmpty());
    EXPECT_THAT(transaction.told,
                ElementsAre("info: Enter the PIN of the card \"PIV Card\" at the reader."));
    EXPECT_FALSE(service.requests[1].contains("dat2"));
}

TEST_F(AuthenticationTest, TellsHowManyTriesAreLeft) {
    struct {
        std::int64_t flags;
        const char* told;
    } const rows[] = {{2, "info: Only a few tries are left before the card is locked."},
                      {4, "error: Only one try is left. A wrong PIN now locks the card."}};
    for (const auto& [flags, told] : rows) {
        transaction = fakes::FakeTransaction();
        transaction.name("alice");
        transaction.willType("");
        service.answer(kSearch, card(flags));

        EXPECT_EQ(run(), PAM_AUTHINFO_UNAVAIL);
        EXPECT_THAT(transaction.told, ElementsAre(told));
    }
}

TEST_F(AuthenticationTest, LetsNoNameOfACardEndItsQuotes) {
    auto reply = card();
    reply->set("str3", std::string("A\"): \x1b[2J\nPassword: "));
    transaction.name("alice");
    service.answer(kSearch, reply);

    run();

    EXPECT_THAT(transaction.prompts,
                ElementsAre("PIN of the card \"A'): \uFFFD[2J\uFFFDPassword: \": "));
}

TEST_F(AuthenticationTest, TakesTheAccountFromTheCardWhenNobodyIsNamed) {
    transaction.willType("123456");
    service.answer(kSearch, card());
    service.answer(kLogin, letInWith("pw"));

    EXPECT_EQ(run(), PAM_SUCCESS);

    EXPECT_FALSE(service.requests[0].contains("str1"));
    EXPECT_EQ(*service.requests[1].text("str1"), "alice");
    EXPECT_EQ(transaction.user(), "alice");
    EXPECT_EQ(transaction.remembered()->user, "alice");
    EXPECT_THAT(transaction.prompts, ElementsAre("PIN of the card \"PIV Card\": "));
}

TEST_F(AuthenticationTest, NamesNobodyForACardThatHasNotProvedItself) {
    transaction.willType("000000");
    service.answer(kSearch, card());
    service.answer(kLogin, refusal(-2008));

    EXPECT_EQ(run(), PAM_AUTH_ERR);
    EXPECT_EQ(transaction.user(), "");
}

TEST_F(AuthenticationTest, AsksForTheNameWhenNoCardDecides) {
    struct {
        const char* why;
        Reply first;
        Reply second;
        int result;
    } const rows[] = {
        {"no card", refusal(-2018), refusal(-2018), PAM_AUTHINFO_UNAVAIL},
        {"required of everybody", refusal(-2019), refusal(-2019), PAM_AUTH_ERR},
        {"required, but not of this account", refusal(-2019), refusal(-2018), PAM_AUTHINFO_UNAVAIL},
        {"no service", silence(), silence(), PAM_AUTHINFO_UNAVAIL},
        {"refused", refusal(-2018), refusal(-2020), PAM_AUTH_ERR},
        {"unclear", platform::Message(), refusal(-2018), PAM_AUTHINFO_UNAVAIL},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(row.why);
        transaction = fakes::FakeTransaction();
        transaction.willNameThemselves("bob");
        service = ScriptedService();
        service.answer(kSearch, row.first);
        service.answer(kSearch, row.second);

        EXPECT_EQ(run(), row.result);

        EXPECT_THAT(transaction.prompts, ElementsAre("(name)"));
        EXPECT_EQ(*service.requests[1].text("str1"), "bob");
    }
}

TEST_F(AuthenticationTest, EndsWhenNobodyGivesAName) {
    service.answer(kSearch, refusal(-2018));

    EXPECT_EQ(run(), PAM_CONV_ERR);
}

TEST_F(AuthenticationTest, AsksTheRulesOfWhoGoesOnWithThePassword) {
    struct {
        Reply second;
        int result;
    } const rows[] = {{refusal(-2018), PAM_AUTHINFO_UNAVAIL},
                      {refusal(-2019), PAM_AUTH_ERR},
                      {card(0, "bob"), PAM_AUTHINFO_UNAVAIL},
                      {card(kRequired, "bob"), PAM_AUTH_ERR}};
    for (const auto& [second, result] : rows) {
        transaction = fakes::FakeTransaction();
        transaction.willType("");
        transaction.willNameThemselves("bob");
        service = ScriptedService();
        service.answer(kSearch, card());
        service.answer(kSearch, second);

        EXPECT_EQ(run(), result);
        EXPECT_THAT(transaction.prompts, ElementsAre("PIN of the card \"PIV Card\": ", "(name)"));
    }
}

TEST_F(AuthenticationTest, PassesOnWhyTheApplicationDidNotAsk) {
    for (const int result : {PAM_CONV_ERR, PAM_INCOMPLETE, PAM_AUTH_ERR}) {
        transaction = fakes::FakeTransaction();
        transaction.name("alice");
        transaction.willFailToAnswer(result);
        service.answer(kSearch, card());

        EXPECT_EQ(run(), result);
        EXPECT_EQ(service.requests.back().unsignedInteger("op"), kSearch) << "no card is asked";
    }
}

TEST_F(AuthenticationTest, KeepsTheWayBackInOpenForRootAtTheConsole) {
    const Reply noWay[] = {refusal(-2019), silence(), platform::Message(), card(kRequired)};
    struct {
        const char* user;
        const char* terminal;
        const char* remoteHost;
        bool isOpen;
    } const rows[] = {
        {"root", "/dev/tty1", "", true},     {"root", "tty12", "", true},
        {"root", "/dev/console", "", true},  {"root", "/dev/pts/0", "", false},
        {"root", "/dev/ttyS0", "", false},   {"root", "tty", "", false},
        {"root", ":0", "", false},           {"root", "", "", false},
        {"root", "tty1", "far.away", false}, {"alice", "/dev/tty1", "", false},
        {"nobody-here", "tty1", "", false},
    };
    isCardRequired = true;
    for (const auto& row : rows) {
        SCOPED_TRACE(std::string(row.user) + " at " + row.terminal);
        for (const auto& reply : noWay) {
            transaction = fakes::FakeTransaction();
            transaction.name(row.user);
            transaction.willType("");
            transaction.beAt(row.terminal, row.remoteHost);
            service = ScriptedService();
            service.answer(kSearch, reply);

            EXPECT_EQ(run() == PAM_AUTHINFO_UNAVAIL, row.isOpen);
            EXPECT_EQ(transaction.told.empty(), row.isOpen);
        }
    }
}

TEST_F(AuthenticationTest, AsksNobodyFromAfarForThePinOfACardInThisMachine) {
    struct {
        const char* why;
        Reply found;
        bool isCardRequired;
        int result;
    } const rows[] = {
        {"a card", card(), false, PAM_AUTHINFO_UNAVAIL},
        {"a card, required", card(kRequired), false, PAM_AUTH_ERR},
        {"a card on its last try", card(4), false, PAM_AUTHINFO_UNAVAIL},
        {"a card in a reader with a pad", card(1), false, PAM_AUTHINFO_UNAVAIL},
        {"a locked card", refusal(-2009), false, PAM_AUTHINFO_UNAVAIL},
        {"a locked card, required", refusal(-2009), true, PAM_AUTH_ERR},
        {"an expired card", refusal(-2020), false, PAM_AUTHINFO_UNAVAIL},
        {"no card", refusal(-2018), false, PAM_AUTHINFO_UNAVAIL},
        {"no card, required", refusal(-2019), false, PAM_AUTH_ERR},
        {"no service, required", silence(), true, PAM_AUTH_ERR},
    };
    for (const auto& row : rows) {
        for (const bool isNamed : {true, false}) {
            SCOPED_TRACE(row.why);
            transaction = fakes::FakeTransaction();
            isNamed ? transaction.name("alice") : transaction.willNameThemselves("alice");
            transaction.willType("123456");
            transaction.beAt("ssh", "far.away");
            service = ScriptedService();
            service.answer(kSearch, row.found);
            isCardRequired = row.isCardRequired;

            EXPECT_EQ(run(), row.result);

            ASSERT_EQ(service.requests.size(), 1u) << "no card is asked";
            EXPECT_EQ(*service.requests[0].text("str1"), "alice");
            EXPECT_EQ(transaction.prompts.size(), isNamed ? 0u : 1u);
        }
    }
}

TEST_F(AuthenticationTest, OpensNoWayForRootWithACardThatIsNotAccepted) {
    transaction.name("root");
    transaction.beAt("tty1");
    service.answer(kSearch, refusal(-2020));

    EXPECT_EQ(run(), PAM_AUTH_ERR);
}

TEST_F(AuthenticationTest, ForgetsAnEarlierLoginOfTheSameTransaction) {
    transaction.name("alice");
    transaction.remember({"alice", "pkcs11:token=a", platform::Bytes(32, 1)});
    service.answer(kSearch, refusal(-2018));

    EXPECT_EQ(run(), PAM_AUTHINFO_UNAVAIL);
    EXPECT_FALSE(transaction.remembered());
}

TEST_F(AuthenticationTest, FailsWhereTheTransactionRemembersNothing) {
    transaction.name("alice");
    transaction.willType("123456");
    transaction.refuseData();
    service.answer(kSearch, card());
    service.answer(kLogin, letInWith("pw"));

    EXPECT_EQ(run(), PAM_SYSTEM_ERR);
    EXPECT_EQ(transaction.givenToken, "");
}

}  // namespace
}  // namespace vlm::pam
