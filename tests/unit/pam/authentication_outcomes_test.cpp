#include <gtest/gtest.h>
#include <security/pam_modules.h>

#include "authentication_fixture.h"

namespace vlm::pam {
namespace {

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
        {"no unlock key",
         card(),
         letIn(),
         "123456",
         false,
         PAM_SUCCESS,
         {"info: No key is stored."}},
        {"no unlock key, no reason",
         card(),
         numbered(0),
         "123456",
         false,
         PAM_SUCCESS,
         {"info: The login keyring will ask for its password."}},
        {"no card", refusal(-2018), {}, {}, false, PAM_AUTHINFO_UNAVAIL, silently},
        {"card required",
         refusal(-2019, "Insert it."),
         {},
         {},
         false,
         PAM_AUTH_ERR,
         {"error: Insert it."}},
        {"certificate refused",
         refusal(-2020, "Expired."),
         {},
         {},
         false,
         PAM_AUTH_ERR,
         {"error: Expired."}},
        {"PIN locked before",
         refusal(-2009, "Locked."),
         {},
         {},
         false,
         PAM_MAXTRIES,
         {"error: Locked."}},
        {"service down", silence(), {}, {}, false, PAM_AUTHINFO_UNAVAIL, silently},
        {"service down, card required",
         silence(),
         {},
         {},
         true,
         PAM_AUTH_ERR,
         {"error: Only a smart card lets you in here, and the service for smart cards does not "
          "answer."}},
        {"caller not permitted", refusal(-2001), {}, {}, false, PAM_AUTHINFO_UNAVAIL, silently},
        {"session elsewhere", refusal(-2016), {}, {}, false, PAM_AUTHINFO_UNAVAIL, silently},
        {"service busy, card required",
         refusal(-2015),
         {},
         {},
         true,
         PAM_AUTH_ERR,
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
        {"empty PIN, card required",
         card(kRequired),
         {},
         "",
         false,
         PAM_AUTH_ERR,
         {"error: Only a smart card lets you in here."}},
        {"PIN dismissed", card(), {}, {}, false, PAM_AUTH_ERR, silently},
        {"PIN too long",
         card(),
         {},
         std::string(257, '1'),
         false,
         PAM_AUTH_ERR,
         {"error: No card has a PIN as long as that."}},
        {"wrong PIN",
         card(),
         refusal(-2008, "Wrong."),
         "000000",
         false,
         PAM_AUTH_ERR,
         {"error: Wrong."}},
        {"PIN locked by this try",
         card(),
         refusal(-2009, "Locked."),
         "000000",
         false,
         PAM_MAXTRIES,
         {"error: Locked."}},
        {"card pulled",
         card(),
         refusal(-2004, "Pulled."),
         "123456",
         false,
         PAM_AUTH_ERR,
         {"error: Pulled."}},
        {"key gone",
         card(),
         refusal(-2005, "Gone."),
         "123456",
         false,
         PAM_AUTH_ERR,
         {"error: Gone."}},
        {"card failed",
         card(),
         refusal(-2010, "Failed."),
         "123456",
         false,
         PAM_AUTH_ERR,
         {"error: Failed."}},
        {"signature of another key",
         card(),
         refusal(-2011, "Beware."),
         "123456",
         false,
         PAM_AUTH_ERR,
         {"error: Beware."}},
        {"unpaired meanwhile",
         card(),
         refusal(-2018, "None."),
         "123456",
         false,
         PAM_AUTH_ERR,
         {"error: None."}},
        {"expired meanwhile",
         card(),
         refusal(-2020, "Expired."),
         "123456",
         false,
         PAM_AUTH_ERR,
         {"error: Expired."}},
        {"service dies over the PIN",
         card(),
         silence(),
         "123456",
         false,
         PAM_AUTH_ERR,
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
        EXPECT_EQ(transaction.givenToken,
                  row.answered && row.answered->contains("dat1") ? "pw" : "");
    }
}

}  // namespace
}  // namespace vlm::pam
