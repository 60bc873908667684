// What platform/token_watcher.h promises. Verbs: insert(token), pull(token), and happens(isSo),
// which gives handlers the time to be called until it is so.

#pragma once

#include <atomic>
#include <chrono>
#include <future>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "platform/token_watcher.h"
#include "tests/contracts/contract_test.h"

namespace vlm::contracts {

// What handlers were told, in order; shared with them, since they may outlive a test that fails.
class ToldTokens {
public:
    void add(const std::string& line) {
        const std::lock_guard lock(_mutex);
        _lines.push_back(line);
    }
    std::vector<std::string> lines() const {
        const std::lock_guard lock(_mutex);
        return _lines;
    }

private:
    mutable std::mutex _mutex;
    std::vector<std::string> _lines;
};

template <typename Backend>
class TokenWatcherContract : public ContractTest<Backend> {
protected:
    using Lines = std::vector<std::string>;
    using Handler = platform::TokenWatcher::Handler;

    // Writes down the token, with a mark before it.
    Handler tell(const std::string& mark) {
        return [told = told, mark](const std::string& token) { told->add(mark + token); };
    }
    // A watcher that tells of insertions.
    std::shared_ptr<platform::TokenWatcher> watching() {
        auto watcher = this->backend().get().watchTokens();
        watcher->setInsertionHandler(tell("+"));
        return watcher;
    }
    bool becomes(const Lines& expected) {
        const bool isSo =
            this->backend().happens([&] { return told->lines().size() >= expected.size(); });
        EXPECT_EQ(told->lines(), expected);
        return isSo;
    }
    // Lets all that is due by now be told.
    void expectNothingMore(const std::shared_ptr<platform::TokenWatcher>& watcher) {
        const auto before = told->lines();
        const auto done = std::make_shared<std::promise<void>>();
        auto isDone = done->get_future();
        watcher->addRemovalHandler("(not there)",
                                   [done](const std::string&) { done->set_value(); });
        EXPECT_TRUE(this->backend().happens(
            [&] { return isDone.wait_for(std::chrono::seconds(0)) == std::future_status::ready; }));
        EXPECT_EQ(told->lines(), before);
    }

    std::shared_ptr<ToldTokens> told = std::make_shared<ToldTokens>();
};

TYPED_TEST_SUITE_P(TokenWatcherContract);

TYPED_TEST_P(TokenWatcherContract, TellsOfTokensThatComeAndOfThoseThatWereThere) {
    this->backend().insert("a");
    const auto watcher = this->watching();
    ASSERT_TRUE(this->becomes({"+a"}));

    this->backend().insert("b");

    EXPECT_TRUE(this->becomes({"+a", "+b"}));
}

TYPED_TEST_P(TokenWatcherContract, NamesThoseThatAreThereSorted) {
    const auto watcher = this->watching();
    this->backend().insert("c");
    ASSERT_TRUE(this->becomes({"+c"}));
    for (const auto* token : {"a", "b"}) this->backend().insert(token);
    ASSERT_TRUE(this->becomes({"+c", "+a", "+b"}));
    EXPECT_EQ(watcher->tokenIds(), (std::vector<std::string>{"a", "b", "c"}));

    this->backend().pull("b");

    EXPECT_TRUE(this->backend().happens([&] { return watcher->tokenIds().size() == 2; }));
    EXPECT_EQ(watcher->tokenIds(), (std::vector<std::string>{"a", "c"}));
}

TYPED_TEST_P(TokenWatcherContract, TellsAgainOfATokenThatCameBack) {
    const auto watcher = this->watching();
    this->backend().insert("a");
    ASSERT_TRUE(this->becomes({"+a"}));

    this->backend().pull("a");
    this->backend().insert("a");

    EXPECT_TRUE(this->becomes({"+a", "+a"}));
}

TYPED_TEST_P(TokenWatcherContract, KnowsInAHandlerWhatItTells) {
    const auto watcher = this->backend().get().watchTokens();
    const std::weak_ptr<platform::TokenWatcher> weak = watcher;
    const auto note = [told = this->told, weak](const std::string&) {
        if (const auto alive = weak.lock())
            told->add(std::to_string(alive->tokenIds().size()) + " there");
    };
    watcher->setInsertionHandler([note, weak](const std::string& token) {
        note(token);
        if (const auto alive = weak.lock()) alive->addRemovalHandler(token, note);
    });

    this->backend().insert("a");
    ASSERT_TRUE(this->becomes({"1 there"}));
    this->backend().pull("a");

    EXPECT_TRUE(this->becomes({"1 there", "0 there"}));
}

TYPED_TEST_P(TokenWatcherContract, TellsOnceOfTheRemovalThatWasAskedFor) {
    const auto watcher = this->watching();
    this->backend().insert("a");
    this->backend().insert("b");
    ASSERT_TRUE(this->becomes({"+a", "+b"}));
    watcher->addRemovalHandler("b", this->tell("-"));

    this->backend().pull("a");
    this->backend().pull("b");
    ASSERT_TRUE(this->becomes({"+a", "+b", "-b"}));
    this->backend().insert("b");
    this->backend().pull("b");
    this->backend().insert("c");

    EXPECT_TRUE(this->becomes({"+a", "+b", "-b", "+b", "+c"}));
}

TYPED_TEST_P(TokenWatcherContract, TellsAtOnceOfTheRemovalOfATokenThatIsNotThere) {
    const auto watcher = this->backend().get().watchTokens();

    watcher->addRemovalHandler("a", this->tell("-"));

    EXPECT_TRUE(this->becomes({"-a"}));
}

TYPED_TEST_P(TokenWatcherContract, ReplacesTheRemovalHandlerOfAToken) {
    const auto watcher = this->watching();
    this->backend().insert("a");
    ASSERT_TRUE(this->becomes({"+a"}));
    watcher->addRemovalHandler("a", this->tell("first "));
    watcher->addRemovalHandler("a", this->tell("second "));

    this->backend().pull("a");

    EXPECT_TRUE(this->becomes({"+a", "second a"}));
    this->expectNothingMore(watcher);
}

TYPED_TEST_P(TokenWatcherContract, TellsANewInsertionHandlerAllAndTheOldOneNothingMore) {
    const auto watcher = this->watching();
    this->backend().insert("a");
    this->backend().insert("b");
    ASSERT_TRUE(this->becomes({"+a", "+b"}));

    watcher->setInsertionHandler(this->tell("new "));
    ASSERT_TRUE(this->becomes({"+a", "+b", "new a", "new b"}));
    this->backend().insert("c");

    EXPECT_TRUE(this->becomes({"+a", "+b", "new a", "new b", "new c"}));
}

TYPED_TEST_P(TokenWatcherContract, NeedsNoHandlers) {
    const auto watcher = this->watching();
    watcher->setInsertionHandler(nullptr);
    watcher->addRemovalHandler("a", nullptr);

    this->backend().insert("a");

    EXPECT_TRUE(this->backend().happens([&] { return watcher->tokenIds().size() == 1; }));
    EXPECT_TRUE(this->told->lines().empty());
}

TYPED_TEST_P(TokenWatcherContract, KeepsWatchersApart) {
    auto first = this->watching();
    const auto second = this->backend().get().watchTokens();
    second->setInsertionHandler(this->tell("second "));
    this->backend().insert("a");
    ASSERT_TRUE(this->backend().happens([&] { return this->told->lines().size() == 2; }));

    first.reset();
    this->backend().insert("b");

    EXPECT_TRUE(this->backend().happens([&] { return this->told->lines().size() == 3; }));
    EXPECT_EQ(this->told->lines().back(), "second b");
}

TYPED_TEST_P(TokenWatcherContract, CallsHandlersOneAfterAnother) {
    const auto watcher = this->backend().get().watchTokens();
    const auto running = std::make_shared<std::atomic<int>>(0);
    const auto note = [told = this->told, running](const std::string& token) {
        const bool isAlone = ++*running == 1;
        std::this_thread::yield();
        told->add(isAlone && --*running == 0 ? "alone" : "beside another: " + token);
    };
    watcher->setInsertionHandler(note);
    for (const auto* token : {"a", "b", "c"}) this->backend().insert(token);
    for (const auto* token : {"x", "y", "z"}) watcher->addRemovalHandler(token, note);

    EXPECT_TRUE(this->becomes(std::vector<std::string>(6, "alone")));
}

TYPED_TEST_P(TokenWatcherContract, CallsNothingAfterTheLastReferenceWentInAHandler) {
    auto watcher = this->backend().get().watchTokens();
    this->backend().insert("a");
    this->backend().insert("b");
    ASSERT_TRUE(this->backend().happens([&] { return watcher->tokenIds().size() == 2; }));
    const std::weak_ptr<platform::TokenWatcher> weak = watcher;
    const auto last = std::make_shared<std::shared_ptr<platform::TokenWatcher>>(watcher);
    const auto kept = std::make_shared<int>();
    std::promise<void> released;
    watcher->addRemovalHandler("b", this->tell("-"));
    watcher->setInsertionHandler(
        [told = this->told, last, kept,
         isReleased = released.get_future().share()](const std::string& token) {
            isReleased.wait();
            last->reset();
            told->add("+" + token);
        });
    watcher.reset();
    released.set_value();

    EXPECT_TRUE(this->becomes({"+a"}));
    EXPECT_TRUE(weak.expired());
    this->backend().pull("b");
    // Handlers go with the watcher, and with them what they hold.
    EXPECT_TRUE(this->backend().happens([&] { return kept.use_count() == 1; }));
    EXPECT_EQ(this->told->lines(), std::vector<std::string>{"+a"});
}

TYPED_TEST_P(TokenWatcherContract, WaitsForAHandlerThatRunsWhenTheWatcherGoes) {
    auto watcher = this->backend().get().watchTokens();
    const std::weak_ptr<platform::TokenWatcher> weak = watcher;
    std::promise<void> began;
    std::atomic<bool> ended = false;
    watcher->setInsertionHandler([&](const std::string&) {
        began.set_value();
        // Until somebody is about to destroy the watcher.
        while (!weak.expired()) std::this_thread::yield();
        ended = true;
    });
    this->backend().insert("a");
    std::thread handlers([&] { this->backend().happens([&] { return ended.load(); }); });
    began.get_future().wait();

    watcher.reset();

    EXPECT_TRUE(ended);
    handlers.join();
}

REGISTER_TYPED_TEST_SUITE_P(TokenWatcherContract, TellsOfTokensThatComeAndOfThoseThatWereThere,
                            NamesThoseThatAreThereSorted, TellsAgainOfATokenThatCameBack,
                            KnowsInAHandlerWhatItTells, TellsOnceOfTheRemovalThatWasAskedFor,
                            TellsAtOnceOfTheRemovalOfATokenThatIsNotThere,
                            ReplacesTheRemovalHandlerOfAToken,
                            TellsANewInsertionHandlerAllAndTheOldOneNothingMore, NeedsNoHandlers,
                            KeepsWatchersApart, CallsHandlersOneAfterAnother,
                            CallsNothingAfterTheLastReferenceWentInAHandler,
                            WaitsForAHandlerThatRunsWhenTheWatcherGoes);

}  // namespace vlm::contracts
