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

    _proofs.useUp(1000, hashOf(1));

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

    _proofs.useUp(1000, hashOf(2));
    EXPECT_EQ(_proofs.timeLeft(), 30s);
    _now += 60'000;
    EXPECT_EQ(_proofs.timeLeft(), 0ms);
}

}  // namespace
}  // namespace vlm::service
