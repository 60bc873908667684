#include "tool/pairing_commands.h"

#include "bind/bind_operation.h"
#include "hints/hints_client.h"
#include "platform/harmless_text.h"
#include "platform/text.h"
#include "platform/token_framework.h"
#include "settings/smartcard_settings.h"
#include "tool/exit_status.h"
#include "util/bind_utils.h"

namespace vlm {

using platform::Error;
using platform::harmlessText;
using platform::kSuccess;
using platform::Status;
using platform::text;

namespace {

// A service that fails without an error object still leaves its number. Its words may hold a
// card's, so they are kept from acting on the terminal.
std::string reason(Status status, const std::optional<Error>& error) {
    if (error) return harmlessText(error->description());
    return Error{std::string(platform::VLErrorDomain), status, std::nullopt}.description();
}

// The keychain's failures come as a number alone, which is no help to a person.
std::string whyNotStored(Status status) {
    switch (status) {
        case -2004:
            return "The smart card was pulled out. Unpair it, insert it and pair it again.";
        case -2007:
            return "The password of the login keyring was not entered. Unpair the smart card and "
                   "pair it again to be asked once more.";
        case -2021:
            return "There is no login keyring, or nobody on the user's desktop can be asked for "
                   "its password. Pair again when the user is logged in there.";
        case -2022:
            return "The password that was entered does not open the login keyring. Unpair the "
                   "smart card and pair it again to be asked once more.";
        case -2023:
            return "The smart card has no key that can protect the login keyring's password.";
        default:
            return Error{std::string(platform::VLErrorDomain), status, std::nullopt}.description();
    }
}

bool mayPair(const Options& options) {
    return VLGetSmartcardSetting("oneCardPerUser") == 0 || !VLIsUserBound(options.userName);
}

void storeUnlockKey(BindOperation& operation, const Options& options, Console& console) {
    const auto hex = BindUtils::dataToHex(options.publicKeyHash);
    std::optional<Error> error;
    const Status status = operation.storeUnlockKey(options.publicKeyHash, &error);
    if (status == kSuccess) {
        if (options.verbose)
            console.print(text("User was successfully paired (public key hash: {}).", hex));
        return;
    }
    console.print(text("Failed to store Login keychain unlock key. {}",
                       error ? harmlessText(error->description()) : whyNotStored(status)));
    console.print(
        text("User was successfully paired (public key hash: {}) but user password will "
             "be required after next SmartCard login to unlock Login keychain.",
             hex));
}

}  // namespace

int runPair(const Options& options, Console& console) {
    if (!mayPair(options)) {
        console.print("Cannot pair user who is already paired");
        return kExitFailure;
    }

    const auto operation = BindOperation::initWithUserName(options.userName);
    BindUtils::log().debug("pairing user {} with pubkey hash: {})", options.userName,
                           options.publicKeyHash);
    std::optional<Error> error;
    const Status status =
        operation->pairUser(options.publicKeyHash, /*requireWrapKey=*/false, &error);
    if (status != kSuccess) {
        console.print(text("Cannot pair user (public key hash: {}). {}",
                           BindUtils::dataToHex(options.publicKeyHash), reason(status, error)));
        return kExitFailure;
    }
    storeUnlockKey(*operation, options, console);
    return kExitSuccess;
}

int runUnpair(const Options& options, Console& console) {
    if (!options.publicKeyHash) {
        console.print("Cannot unpair user - no pubkey hash was provided");
        return kExitFailure;
    }

    const auto operation = BindOperation::init();
    const auto hex = BindUtils::dataToHex(options.publicKeyHash);
    BindUtils::log().debug("unpairing user {} from pubkey hash {}", options.userName, hex);
    std::optional<Error> error;
    const Status status = operation->unpairUser(options.publicKeyHash, options.userName, &error);
    if (status != kSuccess) {
        console.print(
            text("Cannot unpair user (public key hash: {}). {}", hex, reason(status, error)));
        return kExitFailure;
    }
    if (options.verbose)
        console.print(text("User was successfully unpaired (public key hash: {}).", hex));
    return kExitSuccess;
}

}  // namespace vlm
