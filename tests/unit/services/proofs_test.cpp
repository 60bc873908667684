#include "services/hints/proofs.h"

#include <gtest/gtest.h>

#include "cards.h"

namespace vlm::service {
namespace {

using namespace std::chrono_literals;

class ProofsTest : public testing::Test {
protected:
    std::int64_t _now = 5'000;
    Proofs _proofs{[this] { return _now; }};
};

TEST_F(ProofsTest, HoldForTheUserAndTheKeyThatWereProved) {
    _proofs.remember(1000, hashOf(1));

    EXPECT_TRUE(_proofs.hold(1000, hashOf(1)));
    EXPECT_FALSE(_proofs.hold(1001, hashOf(1)));
    EXPECT_FALSE(_proofs.hold(1000, hashOf(2)));
}

TEST_F(ProofsTest, AreUsedUpOnce) {
    _proofs.remember(1000, hashOf(1));

    _proofs.hold(1000, hashOf(1))->useUp();

    EXPECT_FALSE(_proofs.hold(1000, hashOf(1)));
}

TEST_F(ProofsTest, EndAfterAMinute) {
    _proofs.remember(1000, hashOf(1));

    _now += 59'999;
    EXPECT_TRUE(_proofs.hold(1000, hashOf(1)));
    _now += 1;
    EXPECT_FALSE(_proofs.hold(1000, hashOf(1)));
}

TEST_F(ProofsTest, BeginAnewWhenTheKeyIsProvedAgain) {
    _proofs.remember(1000, hashOf(1));
    _now += 50'000;
    _proofs.remember(1000, hashOf(1));

    _now += 50'000;

    EXPECT_TRUE(_proofs.hold(1000, hashOf(1)));
}

TEST_F(ProofsTest, TellHowLongTheLastOfThemStillHolds) {
    EXPECT_EQ(_proofs.timeLeft(), 0ms);
    _proofs.remember(1000, hashOf(1));
    _now += 10'000;
    _proofs.remember(1000, hashOf(2));
    _now += 20'000;
    EXPECT_EQ(_proofs.timeLeft(), 40s);

    _proofs.hold(1000, hashOf(2))->useUp();
    EXPECT_EQ(_proofs.timeLeft(), 30s);
    _now += 60'000;
    EXPECT_EQ(_proofs.timeLeft(), 0ms);
}

TEST_F(ProofsTest, ServeOneAtATime) {
    _proofs.remember(1000, hashOf(1));

    const auto held = _proofs.hold(1000, hashOf(1));

    ASSERT_TRUE(held);
    EXPECT_FALSE(_proofs.hold(1000, hashOf(1)));
}

TEST_F(ProofsTest, CountAgainForTheRestOfTheirMinuteWhenNothingBecameOfThem) {
    _proofs.remember(1000, hashOf(1));
    auto held = _proofs.hold(1000, hashOf(1));
    _now += 59'999;

    held.reset();

    EXPECT_TRUE(_proofs.hold(1000, hashOf(1)));
    _now += 1;
    EXPECT_FALSE(_proofs.hold(1000, hashOf(1)));
}

TEST_F(ProofsTest, GivenBackShortenNoneThatCameMeanwhile) {
    _proofs.remember(1000, hashOf(1));
    auto held = _proofs.hold(1000, hashOf(1));
    _now += 30'000;
    _proofs.remember(1000, hashOf(1));

    held.reset();
    _now += 45'000;

    EXPECT_TRUE(_proofs.hold(1000, hashOf(1)));
}

}  // namespace
}  // namespace vlm::service
