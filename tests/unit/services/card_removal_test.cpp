#include "services/hints/card_removal.h"

#include <gmock/gmock.h>

namespace vlm::service {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

class CardRemovalTest : public testing::Test {
protected:
    void waitForReaders() {
        const auto timer = _timer.lock();
        ASSERT_TRUE(timer) << "nobody waits for readers";
        (*timer)();
    }

    std::vector<std::string> removed;

private:
    std::weak_ptr<std::function<void()>> _timer;

protected:
    CardRemoval removal{{.removed = [this](const std::string& token) { removed.push_back(token); },
                         .callAfter =
                             [this](CardRemoval::Duration, std::function<void()> call) {
                                 auto timer =
                                     std::make_shared<std::function<void()>>(std::move(call));
                                 _timer = timer;
                                 return timer;
                             }}};
};

TEST_F(CardRemovalTest, IsToldOnceWhenAPulledCardIsCertainlyGone) {
    removal.looked({"a", "b"}, true);

    removal.cardMoved();
    removal.looked({"b"}, false);
    EXPECT_THAT(removed, IsEmpty()) << "the first look may be from before";
    removal.looked({"b"}, true);
    removal.looked({"b"}, true);

    EXPECT_THAT(removed, ElementsAre("a"));
}

TEST_F(CardRemovalTest, KnowsACardThatWasListedOnlyOnce) {
    removal.looked({"a"}, false);

    removal.cardMoved();
    removal.looked({}, true);

    EXPECT_THAT(removed, ElementsAre("a"));
}

TEST_F(CardRemovalTest, IsNoneWhenAListedCardIsMissingAndNothingMoved) {
    removal.looked({"a"}, true);

    removal.looked({}, true);
    removal.looked({"a"}, true);

    EXPECT_THAT(removed, IsEmpty()) << "its module failed, or the daemon was started anew";
}

TEST_F(CardRemovalTest, IsNoneOfTheCardsThatStayWhenAnotherMoves) {
    removal.looked({"a"}, true);

    removal.cardMoved();
    removal.looked({}, false);
    removal.looked({"a", "b"}, true);
    removal.looked({}, true);

    EXPECT_THAT(removed, IsEmpty());
}

TEST_F(CardRemovalTest, IsNoneWhilePcscdIsAwayAndComesBack) {
    removal.looked({"a", "b"}, true);

    removal.cardMoved();  // the readers go first
    removal.pcscdWent();
    removal.looked({}, true);
    removal.pcscdCame();
    removal.cardMoved();
    removal.looked({"b"}, true);
    removal.looked({"a", "b"}, true);
    waitForReaders();
    removal.looked({"a", "b"}, true);

    EXPECT_THAT(removed, IsEmpty());
}

TEST_F(CardRemovalTest, IsToldAgainOnceTheReadersAreBack) {
    removal.looked({"a"}, true);
    removal.pcscdWent();
    removal.looked({}, true);
    removal.pcscdCame();
    removal.looked({"a"}, true);
    waitForReaders();

    removal.cardMoved();
    removal.looked({}, true);

    EXPECT_THAT(removed, ElementsAre("a")) << "also when nobody looked in between";
}

TEST_F(CardRemovalTest, IsToldForEachTimeThatACardIsPulled) {
    for (int i = 0; i < 2; ++i) {
        removal.cardMoved();
        removal.looked({"a"}, true);
        removal.cardMoved();
        removal.looked({}, true);
    }

    EXPECT_THAT(removed, ElementsAre("a", "a"));
}

}  // namespace
}  // namespace vlm::service
