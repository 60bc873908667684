#include "services/hints/new_token_notice.h"

#include <gtest/gtest.h>

namespace vlm::service {
namespace {

using namespace std::chrono_literals;

class NewTokenNoticeTest : public testing::Test {
protected:
    void waitForReaders() {
        const auto timer = _timer.lock();
        ASSERT_TRUE(timer) << "nobody waits for readers";
        _timer.reset();
        (*timer)();
    }
    bool isWaitingForReaders() const { return !_timer.expired(); }

    bool isAtConsole = true;
    int posts = 0;

private:
    std::weak_ptr<std::function<void()>> _timer;

protected:
    NewTokenNotice notice{{.isUserAtConsole = [this] { return isAtConsole; },
                           .post = [this] { ++posts; },
                           .callAfter =
                               [this](NewTokenNotice::Duration, std::function<void()> call) {
                                   auto timer =
                                       std::make_shared<std::function<void()>>(std::move(call));
                                   _timer = timer;
                                   return timer;
                               }}};
};

TEST_F(NewTokenNoticeTest, IsPostedForEachTokenThatIsInAtTheStart) {
    notice.looked({}, true);
    EXPECT_EQ(posts, 0);

    notice.looked({"a", "b"}, true);

    EXPECT_EQ(posts, 2);
}

TEST_F(NewTokenNoticeTest, IsPostedOnceForATokenThatStays) {
    notice.looked({"a"}, false);
    notice.looked({"a"}, true);
    notice.consoleChanged();

    EXPECT_EQ(posts, 1);
}

TEST_F(NewTokenNoticeTest, IsPostedAgainForATokenThatComesBack) {
    notice.looked({"a"}, true);
    notice.looked({}, true);

    notice.looked({"a"}, false);

    EXPECT_EQ(posts, 2);
}

TEST_F(NewTokenNoticeTest, IsPostedAgainForATokenThatIsPulledAndPutBackAtOnce) {
    notice.looked({"a"}, true);
    notice.cardPulled();
    notice.looked({"a"}, false);
    notice.looked({}, false);

    notice.looked({"a"}, false);

    EXPECT_EQ(posts, 2);
}

TEST_F(NewTokenNoticeTest, BelievesThatACardWasPulledUntilItIsCertainWhich) {
    notice.looked({"a", "b"}, true);
    notice.cardPulled();
    notice.looked({"a"}, true);
    notice.looked({}, false);

    notice.looked({"a"}, true);

    EXPECT_EQ(posts, 2);
}

TEST_F(NewTokenNoticeTest, IsPostedForTheOneThatComesOnly) {
    notice.looked({"a"}, true);

    notice.looked({"a", "b"}, true);

    EXPECT_EQ(posts, 2);
}

TEST_F(NewTokenNoticeTest, IsNotPostedAgainForATokenThatADaemonHadNotReadYet) {
    notice.looked({"a"}, true);
    notice.looked({}, false);

    notice.looked({"a"}, true);

    EXPECT_EQ(posts, 1);
}

TEST_F(NewTokenNoticeTest, IsNotPostedAgainWhenPcscdRestarts) {
    notice.looked({"a"}, true);
    notice.pcscdWent();
    notice.looked({}, true);
    notice.pcscdCame();
    notice.looked({}, true);

    notice.looked({"a"}, true);
    waitForReaders();
    notice.looked({"a"}, true);

    EXPECT_EQ(posts, 1);
}

TEST_F(NewTokenNoticeTest, WaitsForTheReadersOfTheLastRestart) {
    notice.looked({"a"}, true);
    notice.pcscdWent();
    notice.pcscdCame();
    ASSERT_TRUE(isWaitingForReaders());

    notice.pcscdWent();

    EXPECT_FALSE(isWaitingForReaders());
    notice.looked({}, true);
    notice.pcscdCame();
    EXPECT_TRUE(isWaitingForReaders());
    notice.looked({"a"}, true);
    EXPECT_EQ(posts, 1);
}

TEST_F(NewTokenNoticeTest, IsPostedForATokenPulledWhilePcscdWasAwayAndPutBackLater) {
    notice.looked({"a"}, true);
    notice.pcscdWent();
    notice.looked({}, true);
    notice.pcscdCame();
    waitForReaders();

    notice.looked({"a"}, false);

    EXPECT_EQ(posts, 2);
}

TEST_F(NewTokenNoticeTest, TakesTheFirstPcscdForNoRestart) {
    notice.pcscdCame();
    notice.looked({"a"}, true);
    notice.looked({}, true);

    notice.looked({"a"}, true);

    EXPECT_EQ(posts, 2);
    EXPECT_FALSE(isWaitingForReaders());
}

TEST_F(NewTokenNoticeTest, WaitsForTheUserToComeToTheConsole) {
    isAtConsole = false;
    notice.looked({"a"}, true);
    notice.consoleChanged();
    EXPECT_EQ(posts, 0);

    isAtConsole = true;
    notice.consoleChanged();
    notice.consoleChanged();

    EXPECT_EQ(posts, 1);
}

TEST_F(NewTokenNoticeTest, IsNotPostedWhenTheUserComesBackAndTheTokenHasGone) {
    isAtConsole = false;
    notice.looked({"a"}, true);
    notice.looked({}, false);

    isAtConsole = true;
    notice.consoleChanged();

    EXPECT_EQ(posts, 0);
}

TEST_F(NewTokenNoticeTest, IsNotPostedAgainWhenTheUserComesBackAndTheTokenHasStayed) {
    notice.looked({"a"}, true);
    isAtConsole = false;
    notice.consoleChanged();

    isAtConsole = true;
    notice.consoleChanged();

    EXPECT_EQ(posts, 1);
}

}  // namespace
}  // namespace vlm::service
