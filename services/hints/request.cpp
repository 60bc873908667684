#include "services/hints/request.h"

#include <algorithm>
#include <limits>
#include <utility>

#include "platform/harmless_text.h"
#include "platform/property_list.h"
#include "platform/text.h"
#include "services/hints/secret_pipe.h"
#include "services/hints/status.h"
#include "services/keychain/unlock_key_wrapping.h"

namespace vlm::service {

namespace {

constexpr std::size_t kHashSize = 32;
constexpr std::size_t kMostAccountName = 256;
constexpr std::size_t kMostTokenIdentifier = 2048;
constexpr std::size_t kMostPin = 256;
constexpr std::size_t kMostSession = 64;
constexpr std::size_t kMostOtherText = 4096;
constexpr std::size_t kMostQuery = std::size_t{64} << 10U;
constexpr platform::PropertyListLimits kQueryLimits = {
    .depth = 8, .objects = 1024, .bytes = kMostQuery};

// Reads one key after the other and remembers the first one that is wrong.
class Reader {
public:
    explicit Reader(const IncomingRequest& incoming) : _incoming(incoming) {
        for (const auto key : {"op", "uid", "dat1", "dat2", "str1", "str2", "str3", "num1"})
            if (std::ranges::find(incoming.unreadableKeys, key) != incoming.unreadableKeys.end())
                refuse(platform::text("\"{}\" is there twice, or of a type that no key has", key));
    }

    std::uint64_t number(std::string_view key) {
        const auto value = message().unsignedInteger(key);
        if (!value) missing(key, "an unsigned whole number");
        return value.value_or(0);
    }

    platform::UserId user() {
        const auto value = message().integer("uid");
        if (!value) return missing("uid", "a signed whole number"), platform::kNobody;
        if (*value < -1 || *value > std::numeric_limits<platform::UserId>::max())
            refuse("\"uid\" is no user id");
        return static_cast<platform::UserId>(*value);
    }

    bool flag(std::string_view key) {
        const auto value = message().integer(key);
        if (!value) return missing(key, "a signed whole number"), false;
        if (*value != 0 && *value != 1)
            refuse(platform::text("\"{}\" must be 0 or 1, and is {}", key, *value));
        return *value == 1;
    }

    bool optionalFlag(std::string_view key) { return isThere(key) && flag(key); }

    std::string text(std::string_view key, std::size_t most) {
        const auto* value = optionalText(key, most);
        if (!value && !_refusal) missing(key, "text");
        return value ? *value : std::string();
    }

    const std::string* optionalText(std::string_view key, std::size_t most) {
        const auto* value = anyText(key, most);
        if (value && value->empty()) refuse(platform::text("\"{}\" is empty", key));
        return value;
    }

    const std::string* anyText(std::string_view key, std::size_t most) {
        const auto* value = message().text(key);
        if (!value && isThere(key)) missing(key, "text");
        if (value && value->size() > most)
            refuse(platform::text("\"{}\" has {} bytes, and {} is the most", key, value->size(),
                                  most));
        return value;
    }

    platform::Bytes hash(std::string_view key = "dat1") {
        const auto* value = message().bytes(key);
        if (!value) return missing(key, "bytes"), platform::Bytes();
        if (value->size() != kHashSize)
            refuse(platform::text("\"{}\" has {} bytes, and a public-key hash has {}", key,
                                  value->size(), kHashSize));
        return *value;
    }

    std::optional<Secret> optionalPin(std::string_view key) {
        if (!isThere(key)) return std::nullopt;
        const auto pipe = message().endpoint(key);
        if (!pipe) return missing(key, "a pipe"), std::nullopt;
        auto pin = secretIn(*pipe);
        if (!pin || pin->text().size() > kMostPin)
            refuse(platform::text("\"{}\" is no pipe that holds a PIN", key));
        return pin;
    }

    std::optional<Secret> passwordInPipe(std::string_view key) {
        const auto pipe = message().endpoint(key);
        if (!pipe) return missing(key, "a pipe"), std::nullopt;
        auto password = secretIn(*pipe);
        if (!password || password->text().size() > kMostUnlockKeyBytes)
            refuse(platform::text("\"{}\" is no pipe that holds a password", key));
        return password;
    }

    // The token that a query of the form {"tokid": token} is restricted to; empty for all tokens.
    std::string queriedToken() {
        if (!isThere("dat1")) return {};
        const auto* bytes = message().bytes("dat1");
        if (!bytes) return missing("dat1", "bytes"), std::string();
        const auto list = platform::readPropertyList(*bytes, kQueryLimits);
        const auto* query = list ? list->dictionary() : nullptr;
        if (!query)
            return refuse("\"dat1\" is no small dictionary in a property list"), std::string();
        const auto* token = query->find("tokid");
        if (!token) return {};
        if (!token->text() || token->text()->empty() ||
            token->text()->size() > kMostTokenIdentifier)
            return refuse("\"tokid\" in \"dat1\" is no token identifier"), std::string();
        return *token->text();
    }

    void refuse(const std::string& why) {
        if (!_refusal)
            _refusal = Refusal{status::kBadRequest,
                               platform::text("The request cannot be understood: {}.", why)};
    }

    const std::optional<Refusal>& refusal() const { return _refusal; }

private:
    const platform::Message& message() const { return _incoming.message; }

    bool isThere(std::string_view key) const { return message().contains(key); }

    void missing(std::string_view key, std::string_view wanted) {
        if (isThere(key))
            refuse(platform::text("\"{}\" must hold {}", key, wanted));
        else
            refuse(platform::text("\"{}\" is missing", key));
    }

    const IncomingRequest& _incoming;
    std::optional<Refusal> _refusal;
};

void readLogin(Reader& reader, Request& request) {
    request.hash = reader.hash();
    request.tokenIdentifier = reader.text("str1", kMostTokenIdentifier);
    if (const auto* pin = reader.optionalText("str2", kMostPin)) request.pin = Secret(*pin);
    reader.optionalText("str3", kMostOtherText);
    request.user = reader.user();
}

void readCardLogin(Reader& reader, Request& request) {
    request.account = reader.text("str1", kMostAccountName);
    request.tokenIdentifier = reader.text("str2", kMostTokenIdentifier);
    request.hash = reader.hash();
    request.pin = reader.optionalPin("dat2");
}

void readSessionLogin(Reader& reader, Request& request) {
    request.session = reader.text("str1", kMostSession);
    request.account = reader.text("str2", kMostAccountName);
    request.tokenIdentifier = reader.text("str3", kMostTokenIdentifier);
}

void readStoring(Reader& reader, Request& request) {
    request.user = reader.user();
    request.hash = reader.hash();
    request.wrapKeyHash = reader.hash("dat2");
    request.tokenIdentifier = reader.text("str1", kMostTokenIdentifier);
    request.keyring = reader.text("str2", kMostOtherText);
    reader.anyText("str3", kMostOtherText);
}

void readArguments(Reader& reader, Request& request) {
    switch (request.operation) {
        case Operation::Login:
            return readLogin(reader, request);
        case Operation::TokenInfo:
            request.tokenIdentifier = reader.queriedToken();
            request.asksWhenToLookAgain = reader.optionalFlag("num1");
            request.user = reader.user();
            return;
        case Operation::Pair:
        case Operation::Unpair:
            request.hash = reader.hash();
            request.account = reader.text("str1", kMostAccountName);
            return;
        case Operation::Pairings:
            request.insertedOnly = reader.flag("num1");
            request.account = reader.text("str1", kMostAccountName);
            return;
        case Operation::UnlockKeybag:
            request.user = reader.user();
            request.password = Secret(reader.text("str1", kMostUnlockKeyBytes));
            return;
        case Operation::IsPaired:
            request.account = reader.text("str1", kMostAccountName);
            return;
        case Operation::TokenEndpoints:
        case Operation::NameKeyring:
            request.user = reader.user();
            return;
        case Operation::FindLoginCard:
            if (const auto* account = reader.optionalText("str1", kMostAccountName))
                request.account = *account;
            return;
        case Operation::CardLogin:
            return readCardLogin(reader, request);
        case Operation::SessionLogin:
            return readSessionLogin(reader, request);
        case Operation::StoreUnlockKey:
            return readStoring(reader, request);
        case Operation::EraseUnlockKey:
            request.hash = reader.hash();
            request.account = reader.text("str1", kMostAccountName);
            return;
        case Operation::PasswordChanged:
            request.account = reader.text("str1", kMostAccountName);
            request.password = reader.passwordInPipe("dat1");
            return;
    }
}

bool isOperation(std::uint64_t code) {
    switch (static_cast<Operation>(code)) {
        case Operation::Login:
        case Operation::TokenInfo:
        case Operation::Pair:
        case Operation::Unpair:
        case Operation::Pairings:
        case Operation::UnlockKeybag:
        case Operation::IsPaired:
        case Operation::TokenEndpoints:
        case Operation::FindLoginCard:
        case Operation::CardLogin:
        case Operation::SessionLogin:
        case Operation::NameKeyring:
        case Operation::StoreUnlockKey:
        case Operation::EraseUnlockKey:
        case Operation::PasswordChanged:
            return true;
    }
    return false;
}

}  // namespace

Outcome<Request> readRequest(const IncomingRequest& incoming) {
    Reader reader(incoming);
    const auto code = reader.number("op");
    if (!isOperation(code))
        reader.refuse(platform::text("\"op\" is {}, which is no operation", code));
    if (reader.refusal()) return *reader.refusal();

    Request request;
    request.operation = static_cast<Operation>(code);
    readArguments(reader, request);
    if (reader.refusal()) return *reader.refusal();
    return request;
}

std::string describe(const Request& request) {
    const auto hash = platform::hexadecimal(request.hash);
    const auto account = platform::harmlessText(request.account);
    switch (request.operation) {
        case Operation::Login:
            return platform::text("Logging in with {} of the card {}", hash,
                                  platform::harmlessText(request.tokenIdentifier));
        case Operation::TokenInfo:
            return "Listing the inserted cards";
        case Operation::Pair:
            return platform::text("Pairing {} with {}", account, hash);
        case Operation::Unpair:
            return platform::text("Unpairing {} from {}", account, hash);
        case Operation::Pairings:
            return platform::text("Listing the pairings of {}", account);
        case Operation::UnlockKeybag:
            return "Unlocking a login keyring";
        case Operation::IsPaired:
            return platform::text("Asking whether {} is paired", account);
        case Operation::TokenEndpoints:
            return "Watching for cards";
        case Operation::FindLoginCard:
            return account.empty() ? "Looking for a card to log in with"
                                   : platform::text("Looking for a card to log in {} with", account);
        case Operation::CardLogin:
            return platform::text("Logging in {} with a card", account);
        case Operation::SessionLogin:
            return platform::text("Noting the card that logged in {}", account);
        case Operation::NameKeyring:
            return platform::text("Naming the login keyring of user {}", request.user);
        case Operation::StoreUnlockKey:
            return platform::text("Storing the key that opens the login keyring of user {} with {}",
                                  request.user, hash);
        case Operation::EraseUnlockKey:
            return platform::text("Erasing the unlock key of {} for {}", account, hash);
        case Operation::PasswordChanged:
            return platform::text("Wrapping the new password of {}", account);
    }
    return {};
}

Refusal refused(platform::Status status, const Request& request, std::string_view why) {
    return {status, platform::text("{}: {}", describe(request), why)};
}

}  // namespace vlm::service
