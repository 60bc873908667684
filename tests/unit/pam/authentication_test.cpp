#include "services/pam/authentication.h"

#include <gmock/gmock.h>
#include <security/pam_modules.h>

#include "fake_transaction.h"
#include "pam_replies.h"
#include "platform_test.h"

namespace vlm::pam {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

constexpr std::uint64_t kSearch = 11;
constexpr std::uint64_t kLogin = 12;
constexpr std::int64_t kRequired = 8;

class AuthenticationTest : public fakes::PlatformTest {
protected:
    AuthenticationTest() {
        accounts().add("root", 0);
        accounts().add("alice", 1000);
    }

    int run() {
        return Authentication({transaction, service.exchange(), std::chrono::seconds(5),
                               [this](const std::string&) { return isCardRequired; }})
            .run();
    }

    fakes::FakeTransaction transaction;
    ScriptedService service;
    bool isCardRequired = false;  // by the settings, when the service does not say
};

// docs/login.md has the same table for people.
struct Row {
    const char* why;
    Reply found;
    Reply answered;
    std::optional<std::string> typed;
    bool isCardRequired;
    int result;
    std::vector<std::string> told;
};

TEST_F(AuthenticationTest, AnswersEachOutcomeAsInTheTable) {
    const std::vector<std::string> silently;
    const auto unmeant = platform::Message();
    auto noHash = card();
    noHash->set("dat1", platform::Bytes(31, 1));
    auto noName = card();
    noName->set("str3", std::int64_t{3});
    auto nobody = card();
    nobody->set("str1", std::string());
    const std::vector<std::string> unclear{
        "error: The service for smart cards gave an unclear answer."};
    const Row rows[] = {
        {"card and PIN", card(), letInWith("pw"), "123456", false, PAM_SUCCESS, silently},
        {"no unlock key", card(), letIn(), "123456", false, PAM_SUCCESS,
         {"info: No key is stored."}},
        {"no unlock key, no reason", card(), numbered(0), "123456", false, PAM_SUCCESS,
         {"info: The login keyring will ask for its password."}},
        {"no card", refusal(-2018), {}, {}, false, PAM_AUTHINFO_UNAVAIL, silently},
        {"card required", refusal(-2019, "Insert it."), {}, {}, false, PAM_AUTH_ERR,
         {"error: Insert it."}},
        {"certificate refused", refusal(-2020, "Expired."), {}, {}, false, PAM_AUTH_ERR,
         {"error: Expired."}},
        {"PIN locked before", refusal(-2009, "Locked."), {}, {}, false, PAM_MAXTRIES,
         {"error: Locked."}},
        {"service down", silence(), {}, {}, false, PAM_AUTHINFO_UNAVAIL, silently},
        {"service down, card required", silence(), {}, {}, true, PAM_AUTH_ERR,
         {"error: Only a smart card lets you in here, and the service for smart cards does not "
          "answer."}},
        {"caller not permitted", refusal(-2001), {}, {}, false, PAM_AUTHINFO_UNAVAIL, silently},
        {"session elsewhere", refusal(-2016), {}, {}, false, PAM_AUTHINFO_UNAVAIL, silently},
        {"service busy, card required", refusal(-2015), {}, {}, true, PAM_AUTH_ERR,
         {"error: Only a smart card lets you in here, and the service for smart cards does not "
          "answer."}},
        {"pairings unreadable", refusal(-2013), {}, {}, false, PAM_AUTHINFO_UNAVAIL, silently},
        {"older service", refusal(-2000), {}, {}, false, PAM_AUTHINFO_UNAVAIL, silently},
        {"empty reply", unmeant, {}, {}, false, PAM_SYSTEM_ERR, unclear},
        {"a status above zero", numbered(1), {}, {}, false, PAM_SYSTEM_ERR, unclear},
        {"success without a card", numbered(0), {}, {}, false, PAM_SYSTEM_ERR, unclear},
        {"a hash too short", noHash, {}, {}, false, PAM_SYSTEM_ERR, unclear},
        {"a name of another type", noName, {}, {}, false, PAM_SYSTEM_ERR, unclear},
        {"an account without a name", nobody, {}, {}, false, PAM_SYSTEM_ERR, unclear},
        {"empty PIN", card(), {}, "", false, PAM_AUTHINFO_UNAVAIL, silently},
        {"empty PIN, card required", card(kRequired), {}, "", false, PAM_AUTH_ERR,
         {"error: Only a smart card lets you in here."}},
        {"PIN dismissed", card(), {}, {}, false, PAM_AUTH_ERR, silently},
        {"PIN too long", card(), {}, std::string(257, '1'), false, PAM_AUTH_ERR,
         {"error: No card has a PIN as long as that."}},
        {"wrong PIN", card(), refusal(-2008, "Wrong."), "000000", false, PAM_AUTH_ERR,
         {"error: Wrong."}},
        {"PIN locked by this try", card(), refusal(-2009, "Locked."), "000000", false, PAM_MAXTRIES,
         {"error: Locked."}},
        {"card pulled", card(), refusal(-2004, "Pulled."), "123456", false, PAM_AUTH_ERR,
         {"error: Pulled."}},
        {"key gone", card(), refusal(-2005, "Gone."), "123456", false, PAM_AUTH_ERR,
         {"error: Gone."}},
        {"card failed", card(), refusal(-2010, "Failed."), "123456", false, PAM_AUTH_ERR,
         {"error: Failed."}},
        {"signature of another key", card(), refusal(-2011, "Beware."), "123456", false,
         PAM_AUTH_ERR, {"error: Beware."}},
        {"unpaired meanwhile", card(), refusal(-2018, "None."), "123456", false, PAM_AUTH_ERR,
         {"error: None."}},
        {"expired meanwhile", card(), refusal(-2020, "Expired."), "123456", false, PAM_AUTH_ERR,
         {"error: Expired."}},
        {"service dies over the PIN", card(), silence(), "123456", false, PAM_AUTH_ERR,
         {"error: The service for smart cards has not answered. Take the card out and try again."}},
        {"unclear answer to the PIN", card(), unmeant, "123456", false, PAM_SYSTEM_ERR, silently},
        {"a status above zero to the PIN", card(), numbered(7), "123456", false, PAM_SYSTEM_ERR,
         silently},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(row.why);
        transaction = fakes::FakeTransaction();
        transaction.name("alice");
        if (row.typed) transaction.willType(*row.typed);
        service = ScriptedService();
        service.answer(kSearch, row.found);
        service.answer(kLogin, row.answered);
        isCardRequired = row.isCardRequired;

        EXPECT_EQ(run(), row.result);

        EXPECT_EQ(transaction.told, row.told);
        EXPECT_EQ(transaction.remembered().has_value(), row.result == PAM_SUCCESS);
        EXPECT_NE(row.result, PAM_IGNORE);
        EXPECT_EQ(transaction.givenToken, row.answered && row.answered->contains("dat1") ? "pw" : "");
    }
}

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
        {"required, but not of this account", refusal(-2019), refusal(-2018),
         PAM_AUTHINFO_UNAVAIL},
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
        EXPECT_THAT(transaction.prompts,
                    ElementsAre("PIN of the card \"PIV Card\": ", "(name)"));
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
        {"root", "/dev/tty1", "", true},      {"root", "tty12", "", true},
        {"root", "/dev/console", "", true},   {"root", "/dev/pts/0", "", false},
        {"root", "/dev/ttyS0", "", false},    {"root", "tty", "", false},
        {"root", ":0", "", false},            {"root", "", "", false},
        {"root", "tty1", "far.away", false},  {"alice", "/dev/tty1", "", false},
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
