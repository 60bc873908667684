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

bool mayPair(const Options& options) {
    return VLGetSmartcardSetting("oneCardPerUser") == 0 || !VLIsUserBound(options.userName);
}

void storeUnlockKey(BindOperation& operation, const Options& options, Console& console) {
    const auto hex = BindUtils::dataToHex(options.publicKeyHash);
    std::optional<Error> error;
    if (operation.storeUnlockKey(options.publicKeyHash, &error) == kSuccess) {
        if (options.verbose)
            console.print(text("User was successfully paired (public key hash: {}).", hex));
        return;
    }
    console.print(text("Failed to store Login keychain unlock key. {}",
                       error ? harmlessText(error->description()) : ""));
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
