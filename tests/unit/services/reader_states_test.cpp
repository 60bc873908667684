#include "services/hints/reader_states.h"

#include <gtest/gtest.h>
#include <winscard.h>

namespace vlm::service {
namespace {

// A state after so many insertions and removals.
ReaderStates::State after(unsigned events, ReaderStates::State flags) {
    return (ReaderStates::State{events} << 16U) | flags | SCARD_STATE_CHANGED;
}

class ReaderStatesTest : public testing::Test {
protected:
    ReaderStatesTest() {
        states.setReaders({"reader"});
        states.see("reader", after(0, SCARD_STATE_EMPTY));
    }

    ReaderStates states;
};

TEST_F(ReaderStatesTest, AnEmptyReaderIsNoEvent) { EXPECT_FALSE(states.takeCardEvent()); }

TEST_F(ReaderStatesTest, ACardThatComesOrGoesIsOneEvent) {
    states.see("reader", after(1, SCARD_STATE_PRESENT));
    EXPECT_TRUE(states.takeCardEvent());
    EXPECT_FALSE(states.takeCardEvent());

    states.see("reader", after(2, SCARD_STATE_EMPTY));
    EXPECT_TRUE(states.takeCardEvent());
}

TEST_F(ReaderStatesTest, ACardThatWasThereForAMomentOnlyIsAnEvent) {
    states.see("reader", after(2, SCARD_STATE_EMPTY));

    EXPECT_TRUE(states.takeCardEvent());
}

TEST_F(ReaderStatesTest, ACardThatLeavesAReaderIsPulled) {
    states.see("reader", after(1, SCARD_STATE_PRESENT));
    EXPECT_FALSE(states.takeCardPulled());

    states.see("reader", after(2, SCARD_STATE_EMPTY));

    EXPECT_TRUE(states.takeCardPulled());
    EXPECT_FALSE(states.takeCardPulled());
}

TEST_F(ReaderStatesTest, ACardThatIsBackBeforeAnybodyLooksWasPulled) {
    states.see("reader", after(1, SCARD_STATE_PRESENT));

    states.see("reader", after(3, SCARD_STATE_PRESENT));

    EXPECT_TRUE(states.takeCardPulled());
}

TEST_F(ReaderStatesTest, ACardThatGoesWithItsReaderIsNotPulled) {
    states.see("reader", after(1, SCARD_STATE_PRESENT));

    states.see("reader", SCARD_STATE_UNKNOWN | SCARD_STATE_UNAVAILABLE);
    states.setReaders({});

    EXPECT_FALSE(states.takeCardPulled());
    EXPECT_TRUE(states.takeCardEvent());
}

TEST_F(ReaderStatesTest, ACardThatIsUsedIsNoEvent) {
    states.see("reader", after(1, SCARD_STATE_PRESENT));
    states.takeCardEvent();

    for (const ReaderStates::State use :
         {SCARD_STATE_INUSE, SCARD_STATE_EXCLUSIVE, SCARD_STATE_UNPOWERED, 0}) {
        states.see("reader", after(1, SCARD_STATE_PRESENT | use));
        EXPECT_FALSE(states.takeCardEvent()) << use;
    }
}

TEST_F(ReaderStatesTest, WaitsForOtherStatesThanTheOneSeen) {
    states.see("reader", after(1, SCARD_STATE_PRESENT | SCARD_STATE_INUSE));

    EXPECT_EQ(states.seen().at("reader"),
              (ReaderStates::State{1} << 16U) | SCARD_STATE_PRESENT | SCARD_STATE_INUSE);
}

TEST_F(ReaderStatesTest, AReaderThatComesWithACardIsAnEvent) {
    EXPECT_TRUE(states.setReaders({"other", "reader"}));
    EXPECT_FALSE(states.takeCardEvent());

    states.see("other", after(0, SCARD_STATE_PRESENT));

    EXPECT_TRUE(states.takeCardEvent());
}

TEST_F(ReaderStatesTest, AReaderThatGoesWithItsCardIsAnEvent) {
    states.see("reader", after(1, SCARD_STATE_PRESENT));
    states.takeCardEvent();

    EXPECT_TRUE(states.setReaders({}));

    EXPECT_TRUE(states.takeCardEvent());
    EXPECT_TRUE(states.seen().empty());
}

TEST_F(ReaderStatesTest, AnEmptyReaderThatGoesIsNoEvent) {
    EXPECT_TRUE(states.setReaders({}));

    EXPECT_FALSE(states.takeCardEvent());
}

TEST_F(ReaderStatesTest, TheSameReadersAreNoOthers) {
    EXPECT_FALSE(states.setReaders({"reader"}));
    EXPECT_TRUE(states.setReaders({"renamed"}));
}

}  // namespace
}  // namespace vlm::service
