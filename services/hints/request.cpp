#include "services/hints/request.h"

#include "platform/harmless_text.h"
#include "platform/text.h"
#include "services/hints/request_reader.h"

namespace vlm::service {

namespace {

void readLogin(RequestReader& reader, Request& request) {
    request.hash = reader.hash();
    request.tokenIdentifier = reader.text("str1", kMostTokenIdentifier);
    if (const auto* pin = reader.optionalText("str2", kMostPin)) request.pin = Secret(*pin);
    reader.optionalText("str3", kMostOtherText);
    request.user = reader.user();
}

void readCardLogin(RequestReader& reader, Request& request) {
    request.account = reader.text("str1", kMostAccountName);
    request.tokenIdentifier = reader.text("str2", kMostTokenIdentifier);
    request.hash = reader.hash();
    request.pin = reader.optionalPin("dat2");
}

void readSessionLogin(RequestReader& reader, Request& request) {
    request.session = reader.text("str1", kMostSession);
    request.account = reader.text("str2", kMostAccountName);
    request.tokenIdentifier = reader.text("str3", kMostTokenIdentifier);
}

void readStoring(RequestReader& reader, Request& request) {
    request.user = reader.user();
    request.hash = reader.hash();
    request.wrapKeyHash = reader.hash("dat2");
    request.tokenIdentifier = reader.text("str1", kMostTokenIdentifier);
    request.keyring = reader.text("str2", kMostOtherText);
    reader.anyText("str3", kMostOtherText);
}

void readArguments(RequestReader& reader, Request& request) {
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
    RequestReader reader(incoming);
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
            return account.empty()
                       ? "Looking for a card to log in with"
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
