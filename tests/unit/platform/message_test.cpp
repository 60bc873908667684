#include "platform/message.h"

#include <gtest/gtest.h>

namespace vlm::platform {
namespace {

std::vector<std::string> keysOf(const Message& message) {
    std::vector<std::string> keys;
    for (const auto& [key, value] : message.entries()) keys.push_back(key);
    return keys;
}

Message fullMessage() {
    Message message;
    message.set("op", std::uint64_t{2});
    message.set("uid", std::int64_t{-1});
    message.set("str1", "alice");
    message.set("dat1", Bytes{1, 2, 3});
    return message;
}

TEST(MessageTest, KeepsEveryTypeOfValue) {
    const auto descriptor = std::make_shared<const int>(7);
    Message message = fullMessage();
    message.set("dat2", Endpoint{descriptor});

    EXPECT_EQ(message.unsignedInteger("op"), 2u);
    EXPECT_EQ(message.integer("uid"), -1);
    ASSERT_NE(message.text("str1"), nullptr);
    EXPECT_EQ(*message.text("str1"), "alice");
    ASSERT_NE(message.bytes("dat1"), nullptr);
    EXPECT_EQ(*message.bytes("dat1"), (Bytes{1, 2, 3}));
    EXPECT_EQ(message.endpoint("dat2"), Endpoint{descriptor});
}

TEST(MessageTest, KeepsTheOrderInWhichKeysWereSet) {
    EXPECT_EQ(keysOf(fullMessage()), (std::vector<std::string>{"op", "uid", "str1", "dat1"}));
}

TEST(MessageTest, ReplacesAValueInItsPlace) {
    Message message = fullMessage();

    message.set("op", "now a text");

    EXPECT_EQ(keysOf(message).front(), "op");
    EXPECT_EQ(message.entries().size(), 4u);
    EXPECT_EQ(*message.text("op"), "now a text");
}

TEST(MessageTest, AnswersNothingForAnAbsentKey) {
    const Message message = fullMessage();

    EXPECT_FALSE(message.contains("res"));
    EXPECT_FALSE(message.unsignedInteger("res"));
    EXPECT_FALSE(message.integer("res"));
    EXPECT_EQ(message.text("res"), nullptr);
    EXPECT_EQ(message.bytes("res"), nullptr);
    EXPECT_FALSE(message.endpoint("res"));
}

TEST(MessageTest, AnswersNothingForAValueOfAnotherType) {
    const Message message = fullMessage();

    EXPECT_TRUE(message.contains("op"));
    EXPECT_FALSE(message.integer("op"));
    EXPECT_FALSE(message.unsignedInteger("uid"));
    EXPECT_EQ(message.text("dat1"), nullptr);
    EXPECT_EQ(message.bytes("str1"), nullptr);
    EXPECT_FALSE(message.endpoint("op"));
}

TEST(MessageTest, IsAValueOfItsOwnWhenCopied) {
    const Message original = fullMessage();

    Message copy = original;
    copy.set("str1", "bob");
    Message assigned;
    assigned.set("old", "value");
    assigned = original;

    EXPECT_EQ(*original.text("str1"), "alice");
    EXPECT_EQ(*copy.text("str1"), "bob");
    EXPECT_EQ(assigned, original);
    EXPECT_NE(copy, original);
}

TEST(MessageTest, MovesWithAllItsEntries) {
    Message original = fullMessage();

    Message moved = std::move(original);
    Message assigned;
    assigned.set("old", "value");
    assigned = std::move(moved);

    EXPECT_EQ(assigned, fullMessage());
}

TEST(MessageTest, SurvivesAssignmentToItself) {
    Message message = fullMessage();
    Message& same = message;

    message = same;
    message = std::move(same);

    EXPECT_EQ(message, fullMessage());
}

TEST(MessageTest, HoldsMoreEntriesThanUsual) {
    Message message;
    for (int number = 0; number < 100; ++number)
        message.set("key" + std::to_string(number), "text" + std::to_string(number));

    ASSERT_EQ(message.entries().size(), 100u);
    for (int number = 0; number < 100; ++number)
        EXPECT_EQ(*message.text("key" + std::to_string(number)), "text" + std::to_string(number));
}

TEST(MessageTest, TakesAKeyOutOfItsOwnText) {
    Message message;
    message.set("name", "other");
    for (int number = 0; number < 100; ++number) {
        message.set(*message.text("name"), std::int64_t{number});
        message.set("name", "other" + std::to_string(number));
    }

    EXPECT_EQ(message.integer("other"), 0);
    EXPECT_EQ(message.integer("other98"), 99);
}

TEST(MessageTest, ClosesAnEndpointWithItsLastCopy) {
    const auto descriptor = std::make_shared<const int>(7);
    {
        Message message;
        message.set("dat1", Endpoint{descriptor});
        const Message copy = message;
        EXPECT_EQ(descriptor.use_count(), 3);
    }

    EXPECT_EQ(descriptor.use_count(), 1);
}

}  // namespace
}  // namespace vlm::platform
