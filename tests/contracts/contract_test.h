// ContractTest: the base of the suites that hold a fake and the real class to the same promises.
//
// A backend makes the world that a test describes, and gives the service that looks at it:
//   std::optional<std::string> unavailable()  why this machine cannot run it; none when it can
//   get()                                     the service
// and the verbs that the contract names.

#pragma once

#include <gtest/gtest.h>

#include <optional>
#include <string>

namespace vlm::contracts {

template <typename Backend>
class ContractTest : public ::testing::Test {
protected:
    void SetUp() override {
        if (const auto reason = _backend.unavailable()) GTEST_SKIP() << *reason;
    }

    Backend& backend() { return _backend; }

private:
    Backend _backend;
};

// What a backend on a fake has in common with the others.
template <typename Fake>
class FakeBackend {
public:
    std::optional<std::string> unavailable() { return std::nullopt; }
    Fake& get() { return _fake; }

private:
    Fake _fake;
};

}  // namespace vlm::contracts
