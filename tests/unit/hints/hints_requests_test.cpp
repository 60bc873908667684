// What each function sends, to whom, and what it logs on the way.

#include <ostream>

#include "hints/hints_client.h"
#include "hints_test.h"
#include "platform/text.h"

namespace vlm::hints {
namespace {

constexpr auto kDaemon = "org.vlm.token.hints.daemon";
constexpr auto kAgent = "org.vlm.token.hints.agent";

using Lines = std::vector<std::string>;

struct Row {
    const char* why;
    std::function<void()> call;
    std::string request;
    const char* service;
    Lines lines;

    friend void PrintTo(const Row& row, std::ostream* out) { *out << row.why; }
};

const Lines kConsole = {"debug: getUidForAgent", "debug: active session uid: 1000"};

Lines byRule(const std::string& entry) {
    return {"debug: " + entry, kConsole[0], kConsole[1], "debug: setupConnection, forceDaemon 0"};
}

Lines forced(const std::string& entry) {
    return {"debug: " + entry, "debug: setupConnection, forceDaemon 1"};
}

// The console is looked at once for the choice and once more for the user who sits there.
Lines byRuleForTheConsole(const std::string& entry) {
    auto lines = byRule(entry);
    lines.insert(lines.end(), kConsole.begin(), kConsole.end());
    return lines;
}

const PropertyList::Dictionary kQuery = {{"tokid", "card"}};

std::string serialised(const PropertyList& list) {
    return platform::toText(*platform::writeBinaryPropertyList(list));
}

const Row kRows[] = {
    {"a login with everything",
     [] { VLPerformLogin(1001, "card", kHash, "1234", "more", nullptr); },
     R"(op=0u dat1=<AB01> str1="card" str2="1234" str3="more" uid=1001)", kAgent,
     byRule("VLPerformLogin")},
    {"a login without the optional texts",
     [] { VLPerformLogin(1001, "card", kHash, std::nullopt, std::nullopt, nullptr); },
     R"(op=0u dat1=<AB01> str1="card" uid=1001)", kAgent, byRule("VLPerformLogin")},
    {"a login with the third text only",
     [] { VLPerformLogin(1001, "card", kHash, std::nullopt, "more", nullptr); },
     R"(op=0u dat1=<AB01> str1="card" str3="more" uid=1001)", kAgent, byRule("VLPerformLogin")},
    {"a login for whoever is at the console",
     [] { VLPerformLogin(0, "card", kHash, std::nullopt, std::nullopt, nullptr); },
     R"(op=0u dat1=<AB01> str1="card" uid=1000)", kAgent, byRuleForTheConsole("VLPerformLogin")},
    {"a login for nobody",
     [] { VLPerformLogin(platform::kNobody, "card", kHash, std::nullopt, std::nullopt, nullptr); },
     R"(op=0u dat1=<AB01> str1="card" uid=-1)", kAgent, byRule("VLPerformLogin")},
    {"the tokens, without a query, for the user at the console",
     [] { VLCopyAvailableTokensInfo(0, std::nullopt); }, "op=1u uid=1000", kAgent,
     byRuleForTheConsole("VLCopyAvailableTokensInfo for uid 0")},
    {"the tokens that a query asks for", [] { VLCopyAvailableTokensInfo(1001, kQuery); },
     "op=1u dat1=" + serialised(kQuery) + " uid=1001", kAgent,
     byRule("VLCopyAvailableTokensInfo for uid 1001")},
    {"an empty query is a query",
     [] { VLCopyAvailableTokensInfo(1001, PropertyList::Dictionary()); },
     "op=1u dat1=" + serialised(PropertyList::Dictionary()) + " uid=1001", kAgent,
     byRule("VLCopyAvailableTokensInfo for uid 1001")},
    {"the tokens of nobody", [] { VLCopyAvailableTokensInfo(platform::kNobody, std::nullopt); },
     "op=1u uid=-1", kAgent, byRule("VLCopyAvailableTokensInfo for uid -1")},
    {"pairing sends code 2 and no user id", [] { VLBindUser("alice", kHash, nullptr); },
     R"(op=2u dat1=<AB01> str1="alice")", kDaemon, forced("binderWorker")},
    {"unpairing sends code 3 and no user id", [] { VLUnbindUser("alice", kHash, nullptr); },
     R"(op=3u dat1=<AB01> str1="alice")", kDaemon, forced("binderWorker")},
    {"pairings with the flag", [] { VLCopyLegacyBindings("alice", true); },
     R"(op=4u num1=1 str1="alice")", kDaemon, forced("VLCopyLegacyBindings")},
    {"pairings without the flag", [] { VLCopyLegacyBindings("alice", false); },
     R"(op=4u num1=0 str1="alice")", kDaemon, forced("VLCopyLegacyBindings")},
    {"one's own key bag", [] { VLUnlockKeybag(1000, "text"); }, R"(op=5u uid=1000 str1="text")",
     kAgent, byRule("VLUnlockKeybag for 1000")},
    {"another user's key bag", [] { VLUnlockKeybag(1001, "text"); },
     R"(op=5u uid=1001 str1="text")", kDaemon, forced("VLUnlockKeybag for 1001")},
    {"whether a user is paired", [] { VLIsUserBound("alice"); }, R"(op=6u str1="alice")", kDaemon,
     forced("VLIsUserBound")},
    {"a watcher's endpoints", [] { VLCopyTokenEndpoints(1001, nullptr, nullptr, nullptr); },
     "op=7u uid=1001", kDaemon, forced("VLTokenWatcherEndpoint")},
    {"a watcher's endpoints for user 0, who is root here",
     [] { VLCopyTokenEndpoints(0, nullptr, nullptr, nullptr); }, "op=7u uid=0", kDaemon,
     forced("VLTokenWatcherEndpoint")},
};

class Requests : public HintsTest, public testing::WithParamInterface<Row> {};

TEST_P(Requests, AreSentToTheRightInstanceWithTheirKeysInOrder) {
    GetParam().call();

    ASSERT_EQ(ipc().exchanges.size(), 1u);
    EXPECT_EQ(lastRequest(), GetParam().request);
    EXPECT_EQ(ipc().exchanges[0].service, GetParam().service);
    EXPECT_EQ(ipc().exchanges[0].scope,
              GetParam().service == kDaemon ? ServiceScope::Machine : ServiceScope::User);
}

TEST_P(Requests, AreToldToTheLog) {
    GetParam().call();

    EXPECT_EQ(logged(), GetParam().lines);
}

TEST_P(Requests, HaveAConnectionEachThatIsClosedAfterwards) {
    GetParam().call();
    GetParam().call();

    EXPECT_EQ(ipc().connections, 2);
    EXPECT_EQ(ipc().openConnections, 0);
}

INSTANTIATE_TEST_SUITE_P(Table, Requests, testing::ValuesIn(kRows));

class Pairing : public HintsTest {};

TEST_F(Pairing, IsCode2AndUnpairingCode3BothToTheDaemonWithoutAUserId) {
    VLBindUser("alice", kHash, nullptr);
    VLUnbindUser("alice", kHash, nullptr);

    for (const std::size_t i : {0U, 1U}) {
        const auto& exchange = ipc().exchanges.at(i);
        EXPECT_EQ(exchange.request.unsignedInteger("op"), 2 + i);
        EXPECT_EQ(exchange.service, kDaemon);
        EXPECT_FALSE(exchange.request.contains("uid"));
    }
}

class RequestsForTheConsole : public HintsTest {};

TEST_F(RequestsForTheConsole, NameItsUserAndHoldNoDataWithoutAQuery) {
    VLCopyAvailableTokensInfo(0, std::nullopt);

    const auto& request = ipc().exchanges.at(0).request;
    EXPECT_EQ(request.integer("uid"), 1000);
    EXPECT_FALSE(request.contains("dat1"));
}

TEST_F(RequestsForTheConsole, AreForNobodyWhenNobodyIsThere) {
    fakePlatform().fakeConsoleSessions = {};

    VLPerformLogin(0, "card", kHash, std::nullopt, std::nullopt, nullptr);
    EXPECT_EQ(lastRequest(), R"(op=0u dat1=<AB01> str1="card" uid=-1)");

    VLCopyAvailableTokensInfo(0, std::nullopt);
    EXPECT_EQ(lastRequest(), "op=1u uid=-1");
    EXPECT_EQ(ipc().exchanges.back().service, kDaemon);
}

TEST_F(RequestsForTheConsole, KeepTheHighestUserIdsApartFromNobody) {
    VLCopyAvailableTokensInfo(4294967294U, std::nullopt);

    EXPECT_EQ(lastRequest(), "op=1u uid=4294967294");
}

class UnlockKeybag : public HintsTest {};

TEST_F(UnlockKeybag, ComparesWithWhoStartedTheProcess) {
    process().runSetUserId(/*real=*/1000, /*effective=*/1001);

    VLUnlockKeybag(1000, "text");
    VLUnlockKeybag(1001, "text");

    EXPECT_EQ(ipc().exchanges[0].service, kAgent);
    EXPECT_EQ(ipc().exchanges[1].service, kDaemon);
}

TEST_F(UnlockKeybag, AsksTheDaemonForOnesOwnWhenNobodyIsAtTheConsole) {
    fakePlatform().fakeConsoleSessions = {};

    VLUnlockKeybag(1000, "text");

    EXPECT_EQ(ipc().exchanges[0].service, kDaemon);
}

}  // namespace
}  // namespace vlm::hints
