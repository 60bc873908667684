// The login hints service, for programs: which cards are there, log in with one, pair an account
// with an identity of a card.
//
// Shapes:    an identity is named by its public-key hash, the SHA-256 over the DER encoding of its
//            SubjectPublicKeyInfo. A token is named by its identifier, a PKCS#11 URI. A user id is
//            the system's 32-bit number; 0 stands for the user at the console where that is said.
// Texts:     a String stored as UTF-8 is sent as it is. One stored as UTF-16 is converted, which
//            fails for ill-formed text, for the empty text, and where every unit takes three bytes.
// Ownership: arguments are only read; results belong to the caller.
// Threads:   any; calls share nothing and may run side by side.
// Blocking:  every call waits for the service's reply, without a time-out: a person may be typing a
//            PIN. A call refused for its arguments returns at once and reaches no service.
// Errors:    a Status, 0 for success; hints/status.h has the client's own numbers, all others are
//            the service's. Where a function takes a place for an error, that gets the service's
//            error object, in VLErrorDomain with a sentence for people; it is left alone when the
//            reply carries none, and may be null. Nothing is thrown but std::bad_alloc.
// Service:   "daemon" is the machine's instance. "By rule" means: the daemon when nobody or root is
//            at the console, or when this process runs as root; else the user's own instance.
// Log:       subsystem org.vlm.token, category ZEM. No PIN and no text argument is logged.

#pragma once

#include <optional>

#include "platform/endpoint.h"
#include "platform/export.h"
#include "platform/property_list.h"
#include "platform/string.h"
#include "platform/types.h"

// Proves that the person holds the card: the service logs in to the token with the PIN and checks
// a signature by the key. By rule.
//   userId           for whom; 0 for the user at the console
//   tokenIdentifier  required
//   publicKeyHash    required; an identity of that token
//   secondString     the PIN; without one the service asks the person for it
//   thirdString      sent when given; without a meaning so far
// Returns the service's status, also next to an error object. -1000: no status came back; -1001,
// -1002, -1003: the identifier, second or third text cannot be sent; -1003: a required argument is
// missing.
VLM_EXPORT vlm::platform::Status VLPerformLogin(
    vlm::platform::UserId userId, const std::optional<vlm::platform::String>& tokenIdentifier,
    const std::optional<vlm::platform::Bytes>& publicKeyHash,
    const std::optional<vlm::platform::String>& secondString,
    const std::optional<vlm::platform::String>& thirdString, vlm::platform::ErrorPlace error);

// What the service knows of the inserted tokens. By rule.
//   userId  for whom; 0 for the user at the console
//   query   {"tokid": identifier} asks for one token only
// Returns a dictionary whose "ctx" holds, as bytes, one more property list: the token record. None
// when the query cannot be written as a property list, the exchange fails, or the reply is no
// property list.
VLM_EXPORT std::optional<vlm::platform::PropertyList> VLCopyAvailableTokensInfo(
    vlm::platform::UserId userId,
    const std::optional<vlm::platform::PropertyList::Dictionary>& query);

// Pairs the account with the identity, so that it may log in with the card. Daemon.
//   userName       required; an account's name
//   publicKeyHash  required
// Returns the service's status, also next to an error object; success means that the pairing is on
// disk. -1000: no status came back; -1001: an argument is missing, or the name cannot be sent.
VLM_EXPORT vlm::platform::Status VLBindUser(
    const std::optional<vlm::platform::String>& userName,
    const std::optional<vlm::platform::Bytes>& publicKeyHash, vlm::platform::ErrorPlace error);

// Ends the pairing of the account with the identity. Daemon. Arguments and results as above.
VLM_EXPORT vlm::platform::Status VLUnbindUser(
    const std::optional<vlm::platform::String>& userName,
    const std::optional<vlm::platform::Bytes>& publicKeyHash, vlm::platform::ErrorPlace error);

// The identities that the account is paired with. Daemon.
//   userName  required
//   flag      passed on; asks this system's service for identities of inserted tokens only
// Returns the public-key hashes (bytes), in the service's order. None when the name is missing or
// cannot be sent, the exchange fails, or the reply is no dictionary.
VLM_EXPORT std::optional<vlm::platform::PropertyList::Array> VLCopyLegacyBindings(
    const std::optional<vlm::platform::String>& userName, bool flag);

// Unlocks the user's key bag, which is the login keyring. The daemon when the user is not the one
// who runs this process, else by rule.
//   userId  whose; not 0
//   text    the keyring's password
// Returns the service's status. -1000: the service failed or no status came back, or the text is
// missing or cannot be sent; -1001: the user id is 0.
VLM_EXPORT vlm::platform::Status VLUnlockKeybag(vlm::platform::UserId userId,
                                                const std::optional<vlm::platform::String>& text);

// Whether the account is paired with any identity. Daemon.
//   userName  required
// A failed exchange and a name that cannot be sent answer true, so that no rule that protects
// paired accounts is lost with the service; a missing name answers false.
VLM_EXPORT bool VLIsUserBound(const std::optional<vlm::platform::String>& userName);

// The two ends of the channel on which a token watcher is told of cards. Daemon.
//   userId         whose; sent as it is, also 0
//   first, second  places for the ends, each of which may be null
// True when the reply carries no error; the places are set then, to none for an end that the reply
// lacks, and left alone otherwise.
VLM_EXPORT bool VLCopyTokenEndpoints(vlm::platform::UserId userId,
                                     std::optional<vlm::platform::Endpoint>* first,
                                     std::optional<vlm::platform::Endpoint>* second,
                                     vlm::platform::ErrorPlace error);
