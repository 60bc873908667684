// What platform/work_queues.h promises. Verbs: end(), called by work, ends the main queue once the
// work before it is done; run() runs everything until then.

#pragma once

#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "platform/work_queues.h"
#include "tests/contracts/contract_test.h"

namespace vlm::contracts {

template <typename Backend>
class WorkQueuesContract : public ContractTest<Backend> {
protected:
    using Milliseconds = std::chrono::milliseconds;

    platform::WorkQueues& queues() { return this->backend().get(); }

    // Work that writes its name into the list of what was done.
    platform::WorkQueues::Work note(const std::string& name) {
        return [this, name] { done.push_back(name); };
    }
    platform::WorkQueues::Work end() {
        return [this] { this->backend().end(); };
    }

    std::vector<std::string> done;
};

TYPED_TEST_SUITE_P(WorkQueuesContract);

TYPED_TEST_P(WorkQueuesContract, DoesMainWorkInTheOrderInWhichItCame) {
    this->queues().runOnMain(this->note("first"));
    this->queues().runOnMain(this->note("second"));
    this->queues().runOnMain(this->note("third"));
    this->queues().runOnMain(this->end());

    this->backend().run();

    EXPECT_EQ(this->done, (std::vector<std::string>{"first", "second", "third"}));
}

TYPED_TEST_P(WorkQueuesContract, DoesNothingWhileItIsHandedIn) {
    this->queues().runOnMain(this->note("work"));
    this->queues().runOnMainAfter(std::chrono::milliseconds(0), this->note("later"));

    EXPECT_TRUE(this->done.empty());

    this->queues().runOnMain(this->end());
    this->backend().run();
}

TYPED_TEST_P(WorkQueuesContract, DoesWorkOfWorkAfterWhatWasThere) {
    this->queues().runOnMain([this] {
        this->queues().runOnMain(this->note("inner"));
        this->queues().runOnMain(this->end());
        this->done.push_back("outer");
    });
    this->queues().runOnMain(this->note("next"));

    this->backend().run();

    EXPECT_EQ(this->done, (std::vector<std::string>{"outer", "next", "inner"}));
}

TYPED_TEST_P(WorkQueuesContract, DoesDelayedWorkWhenItsTimeHasCome) {
    this->queues().runOnMainAfter(std::chrono::milliseconds(40), this->note("late"));
    this->queues().runOnMainAfter(std::chrono::milliseconds(41), this->end());
    this->queues().runOnMainAfter(std::chrono::milliseconds(1), this->note("early"));
    this->queues().runOnMain(this->note("now"));

    this->backend().run();

    EXPECT_EQ(this->done, (std::vector<std::string>{"now", "early", "late"}));
}

TYPED_TEST_P(WorkQueuesContract, DoesWorkOfOneTimeInTheOrderInWhichItCame) {
    std::vector<std::string> expected;
    for (int i = 0; i < 20; ++i) {
        expected.push_back(std::to_string(i));
        this->queues().runOnMainAfter(std::chrono::milliseconds(2), this->note(expected.back()));
    }
    this->queues().runOnMainAfter(std::chrono::milliseconds(2), this->end());

    this->backend().run();

    EXPECT_EQ(this->done, expected);
}

TYPED_TEST_P(WorkQueuesContract, TakesAnEarlierTimeThanTheOneThatItWaitsFor) {
    this->queues().runOnMainAfter(std::chrono::hours(1), this->note("next hour"));
    this->queues().runOnMain([this] {
        this->queues().runOnMainAfter(std::chrono::milliseconds(1), this->note("soon"));
        this->queues().runOnMainAfter(std::chrono::milliseconds(1), this->end());
    });

    this->backend().run();

    EXPECT_EQ(this->done, std::vector<std::string>{"soon"});
}

TYPED_TEST_P(WorkQueuesContract, DoesBackgroundWorkWhichMayHandInMore) {
    this->queues().runInBackground([this] {
        this->queues().runInBackground([this] {
            this->queues().runOnMain(this->note("main"));
            this->queues().runOnMain(this->end());
        });
    });

    this->backend().run();

    EXPECT_EQ(this->done, std::vector<std::string>{"main"});
}

TYPED_TEST_P(WorkQueuesContract, LetsGoOfWorkThatIsDone) {
    const auto onMain = std::make_shared<int>();
    const auto delayed = std::make_shared<int>();
    this->queues().runOnMain([onMain] {});
    this->queues().runOnMainAfter(std::chrono::milliseconds(1), [delayed] {});
    this->queues().runOnMainAfter(std::chrono::milliseconds(2), [this, onMain, delayed] {
        EXPECT_EQ(onMain.use_count(), 2);
        EXPECT_EQ(delayed.use_count(), 2);
        this->backend().end();
    });

    this->backend().run();

    EXPECT_EQ(onMain.use_count(), 1);
    EXPECT_EQ(delayed.use_count(), 1);
}

TYPED_TEST_P(WorkQueuesContract, TakesWorkFromManyThreadsAndDoesItOneAfterAnother) {
    constexpr int kThreads = 4;
    constexpr int kWorks = 100;
    std::vector<int> seen(kThreads, 0);
    int left = kThreads * kWorks;
    const auto handIn = [&](int thread) {
        for (int i = 0; i < kWorks; ++i)
            this->queues().runOnMain([&, thread, i] {
                EXPECT_EQ(seen[static_cast<std::size_t>(thread)]++, i);
                if (--left == 0) this->backend().end();
            });
    };

    std::vector<std::thread> threads;
    for (int thread = 0; thread < kThreads; ++thread) threads.emplace_back(handIn, thread);
    for (auto& thread : threads) thread.join();
    this->backend().run();

    EXPECT_EQ(left, 0);
}

TYPED_TEST_P(WorkQueuesContract, LeavesWorkThatComesAfterTheEnd) {
    this->queues().runOnMain(this->note("before"));
    this->queues().runOnMain(this->end());
    this->queues().runOnMainAfter(std::chrono::hours(1), this->note("after"));

    this->backend().run();

    EXPECT_EQ(this->done, std::vector<std::string>{"before"});
}

REGISTER_TYPED_TEST_SUITE_P(WorkQueuesContract, DoesMainWorkInTheOrderInWhichItCame,
                            DoesNothingWhileItIsHandedIn, DoesWorkOfWorkAfterWhatWasThere,
                            DoesDelayedWorkWhenItsTimeHasCome,
                            DoesWorkOfOneTimeInTheOrderInWhichItCame,
                            TakesAnEarlierTimeThanTheOneThatItWaitsFor,
                            DoesBackgroundWorkWhichMayHandInMore, LetsGoOfWorkThatIsDone,
                            TakesWorkFromManyThreadsAndDoesItOneAfterAnother,
                            LeavesWorkThatComesAfterTheEnd);

}  // namespace vlm::contracts
