// What the functions that answer by a number make of the service's reply.

#include "hints/hints_client.h"
#include "hints_test.h"

namespace vlm::hints {
namespace {

using Place = platform::ErrorPlace;

constexpr auto kNone = std::nullopt;
constexpr std::int64_t kAboveStatus = std::int64_t{1} << 32;

struct Function {
    const char* name;
    std::function<Status(Place)> call;
};

// These return a status even from a reply that carries an error, which goes to the caller's place.
const Function kTellTheError[] = {
    {"VLPerformLogin",
     [](Place place) { return VLPerformLogin(1000, "card", kHash, kNone, kNone, place); }},
    {"VLBindUser", [](Place place) { return VLBindUser("alice", kHash, place); }},
    {"VLUnbindUser", [](Place place) { return VLUnbindUser("alice", kHash, place); }},
};

struct Row {
    const char* why;
    Message reply;
    Status status;              // of the functions that tell the error
    Status statusUnlessFailed;  // of those that drop it
};

std::vector<Row> rows() {
    return {
        {"success", replyWith(std::int64_t{0}), 0, 0},
        {"the service's own number", replyWith(std::int64_t{-2008}), -2008, -2008},
        {"a number above zero", replyWith(std::int64_t{5}), 5, 5},
        {"an error beside a number", failed(replyWith(std::int64_t{-2008})), -2008, -1000},
        {"an error beside success", failed(replyWith(std::int64_t{0})), 0, -1000},
        {"an error alone", failed(), -1000, -1000},
        {"nothing", {}, -1000, -1000},
        {"bytes are no status", replyWith(Bytes{0}), -1000, -1000},
        {"an unsigned number is no status", replyWith(std::uint64_t{0}), -1000, -1000},
        {"a number that would be cut to success", replyWith(kAboveStatus), -1000, -1000},
        {"the same below zero", replyWith(-kAboveStatus), -1000, -1000},
    };
}

class StatusReplies : public HintsTest {};

TEST_F(StatusReplies, GiveTheStatusEvenBesideAnError) {
    for (const auto& function : kTellTheError) {
        for (const auto& each : rows()) {
            SCOPED_TRACE(std::string(function.name) + ": " + each.why);
            serve(each.reply);
            std::optional<Error> error;

            EXPECT_EQ(function.call(&error), each.status);
            EXPECT_EQ(function.call(nullptr), each.status);
            EXPECT_EQ(error.has_value(), each.reply.contains("err"));
        }
    }
}

TEST_F(StatusReplies, UnlockNothingWhenTheyCarryAnError) {
    for (const auto& each : rows()) {
        SCOPED_TRACE(each.why);
        serve(each.reply);

        EXPECT_EQ(VLUnlockKeybag(1000, "text"), each.statusUnlessFailed);
    }
}

TEST_F(StatusReplies, MeanPairedUnlessTheyAreZeroWithoutAnError) {
    for (const auto& each : rows()) {
        SCOPED_TRACE(each.why);
        serve(each.reply);

        EXPECT_EQ(VLIsUserBound("alice"), each.statusUnlessFailed != 0);
    }
}

TEST_F(StatusReplies, WithoutAStatusMeanPaired) {
    serve({});

    EXPECT_TRUE(VLIsUserBound("alice"));
}

TEST_F(StatusReplies, HandTheErrorToTheCallersPlace) {
    serve(failed());
    for (const auto& function : kTellTheError) {
        SCOPED_TRACE(function.name);
        std::optional<Error> error;

        function.call(&error);

        EXPECT_EQ(error, refusal());
    }
}

TEST_F(StatusReplies, LeaveTheCallersPlaceAloneWithoutAnError) {
    serve(replyWith(std::int64_t{-2008}));
    for (const auto& function : kTellTheError) {
        SCOPED_TRACE(function.name);
        std::optional<Error> error = refusal();

        function.call(&error);

        EXPECT_EQ(error, refusal());
    }
}

TEST_F(StatusReplies, FromAServiceThatIsNotThereHoldNoStatus) {
    ipc().serve(nullptr);
    for (const auto& function : kTellTheError) {
        SCOPED_TRACE(function.name);
        std::optional<Error> error;

        EXPECT_EQ(function.call(&error), -1000);
        EXPECT_TRUE(error);
    }
    EXPECT_EQ(VLUnlockKeybag(1000, "text"), -1000);
    EXPECT_TRUE(VLIsUserBound("alice"));
    EXPECT_EQ(ipc().openConnections, 0);
}

}  // namespace
}  // namespace vlm::hints
