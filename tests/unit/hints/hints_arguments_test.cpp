// Arguments that are missing or cannot be sent: no service hears of them.

#include <ostream>

#include "hints/hints_client.h"
#include "hints/status.h"
#include "hints_test.h"

namespace vlm::hints {
namespace {

struct Row {
    const char* why;
    std::function<std::string()> call;
    std::string answer;
    std::vector<std::string> lines;

    friend void PrintTo(const Row& row, std::ostream* out) { *out << row.why; }
};

constexpr auto kNone = std::nullopt;

const Row kRows[] = {
    {"a login with no hash",
     [] { return shown(VLPerformLogin(1000, "card", kNone, kNone, kNone, nullptr)); },
     "-1003",
     {"debug: VLPerformLogin", "error: VLPerformLogin wrong params"}},
    {"a login with no token",
     [] { return shown(VLPerformLogin(1000, kNone, kHash, "1234", "more", nullptr)); },
     "-1003",
     {"debug: VLPerformLogin", "error: VLPerformLogin wrong params"}},
    {"a login whose token cannot be sent",
     [] { return shown(VLPerformLogin(1000, unsendable(), kHash, "1234", "more", nullptr)); },
     "-1001",
     {"debug: VLPerformLogin", "error: VLPerformLogin problem during string (1) processing"}},
    {"a login whose second text cannot be sent",
     [] { return shown(VLPerformLogin(1000, "card", kHash, unsendable(), "more", nullptr)); },
     "-1002",
     {"debug: VLPerformLogin", "error: VLPerformLogin problem during string (2) processing"}},
    {"a login whose third text cannot be sent",
     [] { return shown(VLPerformLogin(1000, "card", kHash, kNone, unsendable(), nullptr)); },
     "-1003",
     {"debug: VLPerformLogin", "error: VLPerformLogin problem during string (3) processing"}},
    {"a login of which no text can be sent stops at the first",
     [] {
         return shown(
             VLPerformLogin(1000, unsendable(), kHash, unsendable(), unsendable(), nullptr));
     },
     "-1001",
     {"debug: VLPerformLogin", "error: VLPerformLogin problem during string (1) processing"}},
    {"a query that no property list can hold",
     [] {
         return shown(VLCopyAvailableTokensInfo(1000, PropertyList::Dictionary{{"tokid", "\xFF"}}));
     },
     "none",
     {"debug: VLCopyAvailableTokensInfo for uid 1000"}},
    {"pairing nobody",
     [] { return shown(VLBindUser(kNone, kHash, nullptr)); },
     "-1001",
     {"debug: binderWorker", "error: binderWorker wrong params"}},
    {"pairing with nothing",
     [] { return shown(VLBindUser("alice", kNone, nullptr)); },
     "-1001",
     {"debug: binderWorker", "error: binderWorker wrong params"}},
    {"pairing a name that cannot be sent",
     [] { return shown(VLBindUser(unsendable(), kHash, nullptr)); },
     "-1001",
     {"debug: binderWorker", "error: binderWorker problem during string (1) processing"}},
    {"unpairing nobody",
     [] { return shown(VLUnbindUser(kNone, kHash, nullptr)); },
     "-1001",
     {"debug: binderWorker", "error: binderWorker wrong params"}},
    {"unpairing from nothing",
     [] { return shown(VLUnbindUser("alice", kNone, nullptr)); },
     "-1001",
     {"debug: binderWorker", "error: binderWorker wrong params"}},
    {"unpairing a name that cannot be sent",
     [] { return shown(VLUnbindUser(unsendable(), kHash, nullptr)); },
     "-1001",
     {"debug: binderWorker", "error: binderWorker problem during string (1) processing"}},
    {"nobody's pairings",
     [] { return shown(VLCopyLegacyBindings(kNone, true)); },
     "none",
     {"debug: VLCopyLegacyBindings", "error: VLCopyLegacyBindings wrong params"}},
    {"the pairings of a name that cannot be sent",
     [] { return shown(VLCopyLegacyBindings(unsendable(), true)); },
     "none",
     {"debug: VLCopyLegacyBindings",
      "error: VLCopyLegacyBindings problem during string (1) processing"}},
    {"the key bag of user 0",
     [] { return shown(VLUnlockKeybag(0, "text")); },
     "-1001",
     {"debug: VLUnlockKeybag for 0", "error: VLUnlockKeybag wrong params"}},
    {"a key bag without a text is a failed conversion",
     [] { return shown(VLUnlockKeybag(1000, kNone)); },
     "-1000",
     {"debug: VLUnlockKeybag for 1000",
      "error: VLUnlockKeybag problem during string (1) processing"}},
    {"a key bag with a text that cannot be sent",
     [] { return shown(VLUnlockKeybag(1000, unsendable())); },
     "-1000",
     {"debug: VLUnlockKeybag for 1000",
      "error: VLUnlockKeybag problem during string (1) processing"}},
    {"nobody is not paired",
     [] { return shown(VLIsUserBound(kNone)); },
     "false",
     {"debug: VLIsUserBound", "error: VLIsUserBound wrong params"}},
    {"a name that cannot be sent counts as paired",
     [] { return shown(VLIsUserBound(unsendable())); },
     "true",
     {"debug: VLIsUserBound", "error: VLIsUserBound problem during string (1) processing"}},
};

class BadArguments : public HintsTest, public testing::WithParamInterface<Row> {};

TEST_P(BadArguments, AreRefusedWithoutAConnection) {
    EXPECT_EQ(GetParam().call(), GetParam().answer);
    EXPECT_EQ(logged(), GetParam().lines);
    EXPECT_EQ(ipc().connections, 0);
}

INSTANTIATE_TEST_SUITE_P(Table, BadArguments, testing::ValuesIn(kRows));

class PerformLogin : public HintsTest {};

TEST_F(PerformLogin, WithNoHashHasWrongParams) {
    EXPECT_EQ(VLPerformLogin(1000, "card", kNone, kNone, kNone, nullptr), -1003);
    EXPECT_TRUE(log().has(LogLevel::Error, "VLPerformLogin wrong params"));
}

TEST_F(HintsTest, LeavesTheErrorPlaceAloneWhenArgumentsAreMissing) {
    std::optional<Error> error = refusal();

    VLBindUser(kNone, kHash, &error);
    VLPerformLogin(1000, kNone, kHash, kNone, kNone, &error);

    EXPECT_EQ(error, refusal());
}

TEST(StatusNumbers, AreTheOnesThatCallersKnow) {
    EXPECT_EQ(kNoStatus, -1000);
    EXPECT_EQ(kFirstStringRefused, -1001);
    EXPECT_EQ(kSecondStringRefused, -1002);
    EXPECT_EQ(kThirdStringRefused, -1003);
}

}  // namespace
}  // namespace vlm::hints
