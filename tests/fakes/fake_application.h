// A desktop that starts the agent when a test posts to it, and sees it end.

#pragma once

#include <memory>
#include <optional>
#include <utility>
#include <vector>

#include "platform/application.h"

namespace vlm::fakes {

class FakeApplication final : public platform::Application {
public:
    // What a test does. A process that has ended is told nothing more.
    void deliver(const std::string& notification) {
        if (!exitStatus && _handler) _handler(notification);
    }
    // Another process with the same handler.
    void startAnew() { exitStatus = openAtExit = std::nullopt; }

    // What a test looks at.
    std::optional<int> exitStatus;  // of the first end
    int exits = 0;
    std::optional<int> openAtExit;  // transactions, at the first end
    int openTransactions = 0;
    bool isReceiving() const { return _handler != nullptr; }

    // What run() does in place of the desktop's loop, and answers when nothing ends it.
    std::function<void()> whileRunning = [] {};
    int statusOfLoop = 0;

    void setEventHandler(EventHandler handler) override { _handler = std::move(handler); }

    int run() override {
        whileRunning();
        return exitStatus.value_or(statusOfLoop);
    }

    void exit(int status) override {
        ++exits;
        if (exitStatus) return;
        exitStatus = status;
        openAtExit = openTransactions;
    }

    std::unique_ptr<Transaction> openTransaction() override {
        return std::make_unique<Counted>(openTransactions);
    }

private:
    class Counted final : public Transaction {
    public:
        explicit Counted(int& open) : _open(open) { ++_open; }
        ~Counted() override { --_open; }
        Counted(const Counted&) = delete;
        Counted& operator=(const Counted&) = delete;

    private:
        int& _open;
    };

    EventHandler _handler;
};

}  // namespace vlm::fakes
