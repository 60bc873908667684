// Request: what a caller asks, read from a message and checked.
//
// Errors:   a key that is missing, of another type, out of its bounds or there twice refuses the
//           whole request, with a text that names the key. Keys that an operation does not know
//           are passed over.
// Threads:  values.
// In tests: tests/unit/services/request_test.cpp

#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "platform/types.h"
#include "services/hints/exchanges.h"
#include "services/hints/outcome.h"
#include "services/hints/secret.h"

namespace vlm::service {

enum class Operation : std::uint64_t {
    Login = 0,
    TokenInfo = 1,
    Pair = 2,
    Unpair = 3,
    Pairings = 4,
    UnlockKeybag = 5,
    IsPaired = 6,
    TokenEndpoints = 7,
    NameKeyring = 8,
    StoreUnlockKey = 9,
    EraseUnlockKey = 10,
    FindLoginCard = 11,
    CardLogin = 12,
    PasswordChanged = 13,
    SessionLogin = 14,
};

struct Request {
    Operation operation = Operation::Login;
    platform::UserId user = platform::kNobody;  // Login, TokenInfo, UnlockKeybag, TokenEndpoints,
                                                // NameKeyring, StoreUnlockKey
    platform::Bytes hash;  // Login, Pair, Unpair, StoreUnlockKey, EraseUnlockKey, CardLogin
    std::string account;   // Pair, Unpair, Pairings, IsPaired, EraseUnlockKey, PasswordChanged,
                           // CardLogin, SessionLogin; FindLoginCard: empty for whomever the
                           // inserted cards belong to
    std::string tokenIdentifier;       // Login, StoreUnlockKey, CardLogin, SessionLogin;
                                       // TokenInfo: empty for all tokens
    std::optional<Secret> pin;         // Login, CardLogin, when the caller has it
    std::optional<Secret> password;    // UnlockKeybag, PasswordChanged: always there
    platform::Bytes wrapKeyHash;       // StoreUnlockKey
    std::string keyring;               // StoreUnlockKey
    std::string session;               // SessionLogin
    bool insertedOnly = false;         // Pairings
    bool asksWhenToLookAgain = false;  // TokenInfo
};

Outcome<Request> readRequest(const IncomingRequest& incoming);

// What the request asks for, as the beginning of a sentence that says why it was not done.
std::string describe(const Request& request);

// That sentence.
Refusal refused(platform::Status status, const Request& request, std::string_view why);

}  // namespace vlm::service
