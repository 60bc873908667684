// A login by PAM between a person and a service that do what the test says.

#pragma once

#include <chrono>
#include <string>

#include "fake_transaction.h"
#include "pam_replies.h"
#include "platform_test.h"
#include "services/pam/authentication.h"

namespace vlm::pam {

inline constexpr std::uint64_t kSearch = 11;
inline constexpr std::uint64_t kLogin = 12;
inline constexpr std::int64_t kRequired = 8;

class AuthenticationTest : public fakes::PlatformTest {
protected:
    AuthenticationTest() {
        accounts().add("root", 0);
        accounts().add("alice", 1000);
    }

    int run() {
        return Authentication({transaction, service.exchange(), std::chrono::seconds(5),
                               [this](const std::string&) { return isCardRequired; }})
            .run();
    }

    fakes::FakeTransaction transaction;
    ScriptedService service;
    bool isCardRequired = false;  // by the settings, when the service does not say
};

}  // namespace vlm::pam
