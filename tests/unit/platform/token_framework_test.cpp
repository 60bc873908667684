#include "platform/token_framework.h"

#include <gtest/gtest.h>

#include "platform/property_list.h"

namespace vlm::platform {
namespace {

Message replyWith(const PropertyList& errorEntry) {
    Message reply;
    reply.set("err", writeBinaryPropertyList(errorEntry).value());
    return reply;
}

// The error that the caller gets; none when the reply counts as free of error.
std::optional<Error> decoded(const Message& reply) {
    std::optional<Error> error;
    const bool isFree = decodeReplyError(reply, &error);
    EXPECT_EQ(isFree, !error.has_value());
    return error;
}

std::optional<Error> roundTrip(const Error& error) {
    Message reply;
    encodeReplyError(error, &reply);
    return decoded(reply);
}

PropertyList::Dictionary entry(PropertyList code) {
    return {{"domain", "VLErrorDomain"}, {"code", std::move(code)}, {"description", "text"}};
}

TEST(ReplyErrorTest, IsAbsentFromAReplyWithoutAnErrorEntry) {
    Message reply;
    reply.set("res", std::int64_t{-5});
    std::optional<Error> untouched = Error{"before", 1, std::nullopt};

    EXPECT_TRUE(decodeReplyError(reply, &untouched));

    EXPECT_EQ(untouched, (Error{"before", 1, std::nullopt}));
    EXPECT_TRUE(decodeReplyError(Message(), nullptr));
}

TEST(ReplyErrorTest, ArrivesAsItWasSent) {
    for (const std::int32_t code : {0, -8, 1, -60006, INT32_MAX, INT32_MIN}) {
        const Error error{"VLErrorDomain", code, "the card refused the PIN, 2 tries left"};
        EXPECT_EQ(roundTrip(error), error);
    }
}

TEST(ReplyErrorTest, ArrivesWithoutADescriptionWhenItHasNone) {
    const Error error{"VLErrorDomain", -8, std::nullopt};

    EXPECT_EQ(roundTrip(error), error);
}

TEST(ReplyErrorTest, KeepsTextThatIsNotAscii) {
    const Error error{"VLErrorDomain", -8, "Karte \xE2\x80\x9EPIV\xE2\x80\x9C gesperrt"};

    EXPECT_EQ(roundTrip(error), error);
}

TEST(ReplyErrorTest, IsAlwaysInTheFrameworksDomain) {
    EXPECT_EQ(roundTrip({"SomeLibrary", 42, "text"}), (Error{"VLErrorDomain", 42, "text"}));
    EXPECT_EQ(decoded(replyWith(PropertyList::Dictionary{{"domain", 7}, {"code", 42}})),
              (Error{"VLErrorDomain", 42, std::nullopt}));
}

TEST(ReplyErrorTest, TravelsUnderItsKeyAsABinaryPropertyList) {
    Message reply;
    encodeReplyError({"SomeLibrary", -8, "text"}, &reply);

    ASSERT_NE(reply.bytes("err"), nullptr);
    EXPECT_EQ(readPropertyList(*reply.bytes("err")),
              PropertyList(PropertyList::Dictionary{
                  {"domain", "SomeLibrary"}, {"code", -8}, {"description", "text"}}));
}

TEST(ReplyErrorTest, LeavesTheReplysOtherEntriesAlone) {
    Message reply;
    reply.set("res", std::int64_t{3});

    encodeReplyError({"VLErrorDomain", -8, "text"}, &reply);

    EXPECT_EQ(reply.integer("res"), 3);
}

TEST(ReplyErrorTest, SurvivesADescriptionThatIsNotUtf8) {
    EXPECT_EQ(roundTrip({"VLErrorDomain", -8, "label \xFF"}),
              (Error{"VLErrorDomain", -8, "label \xEF\xBF\xBD"}));
}

TEST(ReplyErrorTest, LosesADescriptionThatIsAbsurdlyLongButStaysAnError) {
    EXPECT_EQ(roundTrip({"VLErrorDomain", -8, std::string(1U << 20U, 'x')}),
              (Error{"VLErrorDomain", -8, std::nullopt}));
}

TEST(ReplyErrorTest, StaysAnErrorWhenNoTextOfItFits) {
    const auto error = roundTrip({std::string(1U << 20U, 'x'), -8, "text"});

    ASSERT_TRUE(error);
    EXPECT_EQ(error->domain, "VLErrorDomain");
}

TEST(ReplyErrorTest, CountsAsFailedWhenNobodyWantsTheError) {
    EXPECT_FALSE(decodeReplyError(replyWith(entry(-8)), nullptr));
}

TEST(ReplyErrorTest, IgnoresADescriptionThatIsNoText) {
    EXPECT_EQ(decoded(replyWith(PropertyList::Dictionary{{"code", -8}, {"description", 5}})),
              (Error{"VLErrorDomain", -8, std::nullopt}));
}

TEST(ReplyErrorTest, CountsAsFailedWithAGenericErrorWhenTheEntryCannotBeRead) {
    Message text;
    text.set("err", "a text");
    Message number;
    number.set("err", std::int64_t{0});
    Message empty;
    empty.set("err", Bytes{});
    Message garbage;
    garbage.set("err", Bytes(200, 0xFF));
    struct {
        const char* why;
        Message reply;
    } const rows[] = {
        {"a text is no list", text},
        {"a number is no list", number},
        {"no bytes at all", empty},
        {"bytes that are no list", garbage},
        {"a list that is no dictionary", replyWith("VLErrorDomain")},
        {"no code", replyWith(PropertyList::Dictionary{{"description", "text"}})},
        {"a code that is a text", replyWith(entry("-8"))},
        {"a code that is a boolean", replyWith(entry(true))},
        {"a code that is a real", replyWith(entry(-8.0))},
        {"a code above the range", replyWith(entry(std::int64_t{INT32_MAX} + 1))},
        {"a code below the range", replyWith(entry(std::int64_t{INT32_MIN} - 1))},
        {"a code above the signed range", replyWith(entry(UINT64_MAX))},
    };
    for (const auto& row : rows)
        EXPECT_EQ(decoded(row.reply), (Error{"VLErrorDomain", -1, std::nullopt})) << row.why;
}

}  // namespace
}  // namespace vlm::platform
