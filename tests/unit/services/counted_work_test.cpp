#include "services/hints/counted_work.h"

#include <gtest/gtest.h>

#include <vector>

#include "cards.h"
#include "fake_tokens.h"
#include "idleness_fixture.h"
#include "services/hints/reply.h"

namespace vlm::service {
namespace {

// Keeps every reply until the test gives or drops it.
class PatientExchanges final : public Exchanges {
public:
    std::vector<Reply> waiting;

    void handle(const Caller&, const IncomingRequest&, Reply reply) override {
        waiting.push_back(std::move(reply));
    }
};

class CountedWorkTest : public IdlenessFixture {
protected:
    CountedWorkTest() { start(); }

    void send() {
        requests.handle({1000, 20, ":1.20"}, {},
                        [this](const platform::Message&) { ++timesAnswered; });
    }
    bool isQuiet() const { return isTimerArmed(); }

    PatientExchanges exchanges;
    CountedExchanges requests{exchanges, idleness};
    fakes::FakeTokens cards;
    CountedTokens tokens{cards, idleness};
    int timesAnswered = 0;
};

TEST_F(CountedWorkTest, IsARequestUntilItIsAnswered) {
    send();
    EXPECT_FALSE(isQuiet());

    exchanges.waiting[0](numberReply(0));
    exchanges.waiting.clear();

    EXPECT_EQ(timesAnswered, 1);
    EXPECT_TRUE(isQuiet());
}

TEST_F(CountedWorkTest, IsARequestUntilItIsGivenUp) {
    send();
    send();

    exchanges.waiting.pop_back();
    EXPECT_FALSE(isQuiet());
    exchanges.waiting.clear();

    EXPECT_TRUE(isQuiet());
}

TEST_F(CountedWorkTest, IsAListingUntilTheCardsHaveAnswered) {
    int listed = 0;
    tokens.list([&](const std::vector<Token>&) { ++listed; });
    EXPECT_FALSE(isQuiet());

    cards.settle();

    EXPECT_EQ(listed, 1);
    EXPECT_TRUE(isQuiet());
}

TEST_F(CountedWorkTest, IsAProofUntilTheCardHasAnswered) {
    int proved = 0;
    tokens.prove({"pkcs11:token=a", hashOf(1), {}, {}}, [&](const Proof&) { ++proved; });
    EXPECT_FALSE(isQuiet());

    cards.settle();

    EXPECT_EQ(proved, 1);
    EXPECT_TRUE(isQuiet());
}

}  // namespace
}  // namespace vlm::service
