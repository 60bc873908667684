#include "services/hints/secret.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <utility>

namespace vlm::service {
namespace {

TEST(SecretTest, HoldsItsTextAndMovesIt) {
    Secret first("1234");
    Secret second(std::move(first));

    EXPECT_EQ(second.text(), "1234");
    EXPECT_TRUE(first.empty());  // NOLINT: what a moved-from secret is, is promised

    Secret third("x");
    third = std::move(second);
    EXPECT_EQ(third.text(), "1234");
    EXPECT_TRUE(second.empty());  // NOLINT
}

TEST(SecretTest, OfNothingIsEmpty) {
    EXPECT_TRUE(Secret().empty());
    EXPECT_TRUE(Secret("").empty());
    EXPECT_TRUE(Secret::ofSize(0).text().empty());
}

TEST(SecretTest, IsFilledInAndShortened) {
    Secret secret = Secret::ofSize(8);
    std::ranges::copy(std::string_view("12345678"), secret.memory().begin());
    const std::span<char> all = secret.memory();

    secret.shorten(4);

    EXPECT_EQ(secret.text(), "1234");
    EXPECT_TRUE(std::ranges::all_of(all.subspan(4), [](char c) { return c == 0; }));
    secret.shorten(100);
    EXPECT_EQ(secret.text(), "1234");
}

TEST(SecretTest, MayBeLongerThanAPage) {
    const std::string text(100'000, 'x');

    EXPECT_EQ(Secret(text).text(), text);
}

TEST(SecretTest, WipingLeavesZeros) {
    std::string text = "secret";

    wipeMemory(text);

    EXPECT_EQ(text, std::string(6, '\0'));
}

}  // namespace
}  // namespace vlm::service
