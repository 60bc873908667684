#include "services/hints/idleness.h"

#include <gtest/gtest.h>

#include <optional>

#include "idleness_fixture.h"

namespace vlm::service {
namespace {

class IdlenessTest : public IdlenessFixture {};

TEST_F(IdlenessTest, IsToldOnceWhenItWasQuietForLongEnough) {
    start();

    advanceBy(59'999ms);
    EXPECT_EQ(timesIdle, 0);
    advanceBy(1ms);
    EXPECT_EQ(timesIdle, 1);
    advanceBy(10min);
    EXPECT_EQ(timesIdle, 1);
}

TEST_F(IdlenessTest, BeginsAnewAfterWork) {
    start();
    advanceBy(59s);

    idleness.begin();

    advanceBy(59s);
    EXPECT_EQ(timesIdle, 0);
    advanceBy(1s);
    EXPECT_EQ(timesIdle, 1);
}

TEST_F(IdlenessTest, NeverComesDuringWorkAndHasNoTimerThen) {
    start();
    auto work = idleness.begin();
    const auto copy = work;
    auto other = idleness.begin();

    work.reset();
    EXPECT_FALSE(isTimerArmed());
    advanceBy(1h);
    other.reset();
    EXPECT_FALSE(isTimerArmed());
    advanceBy(1h);

    EXPECT_EQ(timesIdle, 0);
}

TEST_F(IdlenessTest, CountsFromTheEndOfTheLastWork) {
    start();
    auto work = idleness.begin();
    auto other = idleness.begin();
    advanceBy(1h);
    work.reset();
    advanceBy(1h);

    other.reset();

    advanceBy(59s);
    EXPECT_EQ(timesIdle, 0);
    advanceBy(1s);
    EXPECT_EQ(timesIdle, 1);
}

TEST_F(IdlenessTest, CountsFromTheEndOfTheProofsThatWaitForTheirPairing) {
    start();
    auto work = idleness.begin();
    holdProofFor(50s);

    work.reset();

    advanceBy(109s);
    EXPECT_EQ(timesIdle, 0);
    advanceBy(1s);
    EXPECT_EQ(timesIdle, 1);
}

TEST_F(IdlenessTest, ForgetsAProofThatWasUsedUp) {
    start();
    holdProofFor(50s);
    idleness.begin();
    auto pairing = idleness.begin();
    holdProofFor(0s);

    pairing.reset();

    advanceBy(60s);
    EXPECT_EQ(timesIdle, 1);
}

TEST_F(IdlenessTest, NeverComesWhenTheTimeIsZero) {
    Idleness never(partsWith(0ms));

    never.callWhenIdle([this] { ++timesIdle; });
    never.begin();

    EXPECT_FALSE(isTimerArmed());
    advanceBy(24h);
    EXPECT_EQ(timesIdle, 0);
}

TEST_F(IdlenessTest, HasNoTimerBeforeItIsAskedFor) {
    idleness.begin();

    EXPECT_FALSE(isTimerArmed());
}

TEST_F(IdlenessTest, ArmsNoTimerAfterItWasTold) {
    start();
    advanceBy(60s);

    idleness.begin();

    EXPECT_FALSE(isTimerArmed());
}

TEST_F(IdlenessTest, TellsAtOnceThatThereIsNoWork) {
    bool done = false;

    idleness.callWhenDone([&] { done = true; });

    EXPECT_TRUE(done);
}

TEST_F(IdlenessTest, TellsOnceThatTheLastWorkHasEnded) {
    int timesDone = 0;
    auto work = idleness.begin();
    auto other = idleness.begin();
    idleness.callWhenDone([&] { ++timesDone; });

    work.reset();
    EXPECT_EQ(timesDone, 0);
    other.reset();
    EXPECT_EQ(timesDone, 1);
    idleness.begin();
    EXPECT_EQ(timesDone, 1);
}

TEST_F(IdlenessTest, MayBeGoneBeforeTheWork) {
    std::optional<Idleness> shortLived(partsWith(60s));
    shortLived->callWhenIdle([this] { ++timesIdle; });
    auto work = shortLived->begin();
    shortLived.reset();

    work.reset();

    EXPECT_FALSE(isTimerArmed());
}

}  // namespace
}  // namespace vlm::service
