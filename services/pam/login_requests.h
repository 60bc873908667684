// The requests of a login, and what the service's replies mean for it.
//
// A reply comes over the bus and is judged like any stranger's: what is not as agreed is nonsense,
// and lets nobody in.
//
// Threads: functions of their arguments. Errors: kinds of answers.
// In tests: tests/unit/pam/authentication_test.cpp

#pragma once

#include <optional>
#include <string>

#include "platform/message.h"
#include "platform/types.h"
#include "services/hints/request.h"
#include "services/hints/secret.h"

namespace vlm::pam {

struct FoundCard {
    std::string account;
    std::string tokenIdentifier;
    std::string name;  // harmless, and without quotes
    platform::Bytes hash;
    bool hasPinPad = false;
    bool hasFewTriesLeft = false;
    bool isLastTry = false;
    bool isRequired = false;  // the account has no other way in
};

struct Found {
    enum class Kind {
        Card,
        NoCard,        // the password way is open
        CardRequired,  // and there is none
        Refused,       // there is one, and it is not accepted
        PinLocked,
        NoDecision,  // the service does not answer, or cannot say
        Nonsense,
    };
    Kind kind = Kind::NoDecision;
    FoundCard card{};
    std::string text{};  // for the person
};

// A request without its arguments.
platform::Message requestOf(service::Operation operation);

// Empty for the account that the inserted cards belong to.
platform::Message cardSearch(const std::string& account);
Found readFound(const std::optional<platform::Message>& reply);

struct LoginAnswer {
    int result;  // PAM's
    std::string text{};
    std::optional<service::Secret> unlockKey{};
};

// Without a PIN where the reader asks for it; none when the PIN cannot be sent.
std::optional<platform::Message> cardLogin(const std::string& account, const FoundCard& card,
                                           const service::Secret* pin);
LoginAnswer readLogin(const std::optional<platform::Message>& reply);

}  // namespace vlm::pam
