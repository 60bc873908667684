#include "services/hints/token_lookout.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "fake_daemon_link.h"
#include "platform_test.h"
#include "services/hints/reply.h"
#include "services/hints/status.h"

namespace vlm::service {
namespace {

using namespace std::chrono_literals;
using platform::PropertyList;
using testing::ElementsAre;
using testing::IsEmpty;

// A lookout in a time that the test moves.
class TokenLookoutTest : public fakes::PlatformTest {
protected:
    // The daemon answers the look that is under way.
    void answer(const std::vector<std::string>& tokens,
                LookAgain lookAgain = LookAgain::OnCardEvent) {
        PropertyList::Dictionary names;
        for (const auto& token : tokens) names.set(token, "Card");
        auto reply = *tokenInfoReply(PropertyList::Dictionary{{"ftn", std::move(names)}});
        reply.set("num1", static_cast<std::int64_t>(lookAgain));
        daemon.answer(std::move(reply));
    }
    // The look that was under way is answered, and the one for the watcher has begun.
    void beWatched() {
        lookout.setWatched(true);
        if (daemon.requests.size() == 1) answer({});
    }
    void refuse() { daemon.answer(Refusal{status::kUnreachable, "nobody is there"}); }

    void advanceBy(std::chrono::milliseconds time) {
        _now += time;
        const auto timer = _timer.lock();
        if (!timer || _now < timer->due) return;
        _timer.reset();
        timer->call();
    }
    bool isTimerArmed() const { return !_timer.expired(); }
    // How long until it looks again; and then it does.
    std::chrono::milliseconds skipPause() {
        const auto timer = _timer.lock();
        if (!timer) return 0ms;
        const auto pause = timer->due - _now;
        advanceBy(pause);
        return pause;
    }
    bool isLooking() const { return daemon.open() > 0; }

    struct Timer {
        std::chrono::milliseconds due;
        std::function<void()> call;
    };

    fakes::FakeDaemonLink daemon;
    std::vector<std::string> told;
    int timesLooked = 0;

private:
    std::chrono::milliseconds _now{0};
    std::weak_ptr<Timer> _timer;

protected:
    TokenLookout lookout{
        {.daemon = daemon,
         .callAfter =
             [this](TokenLookout::Duration delay, std::function<void()> call) {
                 EXPECT_FALSE(isTimerArmed()) << "one timer at most";
                 auto timer = std::make_shared<Timer>(Timer{_now + delay, std::move(call)});
                 _timer = timer;
                 return timer;
             },
         .inserted = [this](const std::string& token) { told.push_back("+" + token); },
         .removed = [this](const std::string& token) { told.push_back("-" + token); },
         .looked = [this] { ++timesLooked; }}};
};

TEST_F(TokenLookoutTest, AsksForTheTokensOfNobodyInParticular) {
    ASSERT_EQ(daemon.requests.size(), 1u);

    EXPECT_EQ(daemon.requests[0].unsignedInteger("op"), 1u);
    EXPECT_EQ(daemon.requests[0].integer("uid"), -1);
}

TEST_F(TokenLookoutTest, TellsDifferencesRemovalsFirst) {
    answer({"a", "b"});
    EXPECT_THAT(told, ElementsAre("+a", "+b"));

    lookout.cardEvent();
    answer({"b", "c"});

    EXPECT_THAT(told, ElementsAre("+a", "+b", "-a", "+c"));
    EXPECT_THAT(lookout.tokens(), ElementsAre("b", "c"));
    EXPECT_EQ(timesLooked, 2);
}

TEST_F(TokenLookoutTest, LooksASecondTimeAndThenWaitsForTheNextEvent) {
    answer({});

    EXPECT_EQ(skipPause(), 1s);
    answer({"a"});

    EXPECT_THAT(told, ElementsAre("+a"));
    EXPECT_FALSE(isTimerArmed());
    EXPECT_FALSE(isLooking());
}

TEST_F(TokenLookoutTest, LooksOnceMoreAfterAnEventInTheMiddleOfALook) {
    lookout.cardEvent();
    lookout.cardEvent();
    EXPECT_EQ(daemon.requests.size(), 1u);

    answer({});

    EXPECT_EQ(daemon.requests.size(), 2u);
    answer({"a"});
    EXPECT_THAT(told, ElementsAre("+a"));
}

TEST_F(TokenLookoutTest, LooksAtOnceAtAnEventInAPause) {
    answer({});
    ASSERT_TRUE(isTimerArmed());

    lookout.cardEvent();

    EXPECT_TRUE(isLooking());
    EXPECT_FALSE(isTimerArmed());
}

TEST_F(TokenLookoutTest, WaitsForACardThatIsBeingReadABoundedNumberOfTimes) {
    answer({}, LookAgain::Soon);
    for (const auto pause : {1s, 2s, 4s, 4s, 4s, 4s, 4s, 4s, 4s, 4s}) {
        EXPECT_EQ(skipPause(), pause);
        answer({}, LookAgain::Soon);
    }

    EXPECT_FALSE(isTimerArmed());
    EXPECT_FALSE(isLooking());

    lookout.cardEvent();
    answer({}, LookAgain::Soon);
    EXPECT_EQ(skipPause(), 1s);
}

TEST_F(TokenLookoutTest, StopsLookingWhenTheCardIsRead) {
    answer({}, LookAgain::Soon);
    skipPause();

    answer({"a"});

    EXPECT_THAT(told, ElementsAre("+a"));
    EXPECT_FALSE(isTimerArmed());
}

TEST_F(TokenLookoutTest, LooksWhenSomebodyBeginsToWatch) {
    answer({});
    skipPause();
    answer({}, LookAgain::NowAndThen);
    ASSERT_FALSE(isLooking());

    lookout.setWatched(true);
    ASSERT_TRUE(isLooking());
    answer({"unannounced"});

    EXPECT_THAT(told, ElementsAre("+unannounced"));
}

TEST_F(TokenLookoutTest, LooksOnlyOnEventsWhileNobodyWatches) {
    answer({}, LookAgain::NowAndThen);
    EXPECT_EQ(skipPause(), 1s);
    answer({}, LookAgain::NowAndThen);
    EXPECT_FALSE(isTimerArmed());

    beWatched();
    answer({}, LookAgain::NowAndThen);
    skipPause();
    answer({}, LookAgain::NowAndThen);
    EXPECT_EQ(skipPause(), 2s);
    lookout.setWatched(false);
    answer({}, LookAgain::NowAndThen);

    EXPECT_FALSE(isTimerArmed());
    EXPECT_FALSE(isLooking());
}

TEST_F(TokenLookoutTest, GivesADaemonThatIsAwayUpUntilTheNextEventWhileNobodyWatches) {
    refuse();
    for (int tries = 0; tries < TokenLookout::kMostTriesUnwatched; ++tries) {
        ASSERT_GT(skipPause(), 0ms);
        refuse();
    }
    EXPECT_FALSE(isTimerArmed());

    lookout.cardEvent();

    EXPECT_TRUE(isLooking());
    refuse();
    EXPECT_TRUE(isTimerArmed());
}

TEST_F(TokenLookoutTest, IsCertainWhenNoLookIsToCome) {
    answer({});
    EXPECT_FALSE(lookout.isCertain()) << "the second look may show more";
    skipPause();
    answer({});
    EXPECT_TRUE(lookout.isCertain());

    lookout.cardEvent();
    answer({"a"});
    EXPECT_FALSE(lookout.isCertain());
    skipPause();
    answer({"a"}, LookAgain::Soon);
    EXPECT_FALSE(lookout.isCertain()) << "a card is being read";
    skipPause();
    lookout.cardEvent();
    answer({"a"});
    EXPECT_FALSE(lookout.isCertain()) << "a card has moved since";
    answer({"a"});
    skipPause();
    answer({"a"}, LookAgain::NowAndThen);
    EXPECT_TRUE(lookout.isCertain());
}

TEST_F(TokenLookoutTest, IsNotCertainOfWhatTheDaemonDoesNotTell) {
    answer({"a"});
    skipPause();
    answer({"a"});
    ASSERT_TRUE(lookout.isCertain());

    lookout.cardEvent();
    refuse();

    EXPECT_FALSE(lookout.isCertain());
}

TEST_F(TokenLookoutTest, LooksNowAndThenWhereNothingIsAnnounced) {
    beWatched();
    answer({}, LookAgain::NowAndThen);
    skipPause();
    for (int i = 0; i < 10; ++i) {
        answer({}, LookAgain::NowAndThen);
        EXPECT_EQ(skipPause(), 2s);
    }

    answer({"a"});

    EXPECT_THAT(told, ElementsAre("+a"));
    EXPECT_FALSE(isTimerArmed()) << "nothing can come unannounced any more";
}

TEST_F(TokenLookoutTest, KeepsWhatItKnowsAndTriesWithoutAnEndWhenTheDaemonIsAway) {
    beWatched();
    answer({"a"});
    skipPause();

    for (const auto pause : {1s, 2s, 4s, 8s, 16s, 30s, 30s, 30s, 30s, 30s, 30s, 30s}) {
        refuse();
        EXPECT_EQ(skipPause(), pause);
    }
    EXPECT_THAT(told, ElementsAre("+a"));
    EXPECT_EQ(timesLooked, 14);
    EXPECT_EQ(log().texts(platform::LogLevel::Error).size(), 1u);
    answer({});

    EXPECT_THAT(told, ElementsAre("+a", "-a"));
}

TEST_F(TokenLookoutTest, TakesARefusalOrNonsenseForADaemonThatIsAway) {
    daemon.answer(refusalReply({status::kNotPermitted, "not you"}));
    EXPECT_EQ(skipPause(), 1s);

    daemon.answer(numberReply(0));

    EXPECT_EQ(skipPause(), 2s);
    EXPECT_THAT(told, IsEmpty());
}

}  // namespace
}  // namespace vlm::service
