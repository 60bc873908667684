// BindOperation: one attempt to pair a user with an identity of an inserted smart card.
//
// Started, an operation makes sure that its user may pair, watches tokens, shows its dialog while
// there is something to offer, and reports how it ended. Made and not started, it only pairs and
// unpairs.
//
// Shapes:    a token is named by its identifier, a key by its public-key hash.
// Ownership: shared; background work, timers and handlers hold an operation weakly. It and its
//            dialog hold each other until it has ended.
// Threads:   starting works in the background; the token watcher calls on its own thread; all that
//            is done with the dialog is done on the main queue. What they share is published whole,
//            and a reader keeps the version it got. The user's name is set before the start.
// Blocking:  whatever asks the hints service waits for its answer, and that may be a person's PIN.
//            Starting and finishing never wait.
// Errors:    a status, 0 for success, beside an error in the caller's place. An operation's own
//            refusals are kRefused in VLErrorDomain; every other status is a service's.
// In tests:  tests/unit/bind

#pragma once

#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "bind/dialog_place.h"
#include "bind/pairing_dialog.h"
#include "bind/snapshot.h"
#include "bind/token_info.h"
#include "platform/property_list.h"
#include "platform/types.h"

namespace vlm::platform {
class TokenWatcher;
}

namespace vlm {

// How an operation ended.
enum class BindResult : std::int32_t {
    Succeeded = 0,
    Failed = 1,
    Canceled = 2,
    NotOffered = 3,
};

class BindOperation : public std::enable_shared_from_this<BindOperation> {
public:
    using Bytes = platform::Bytes;
    using ErrorPlace = platform::ErrorPlace;
    using OptionalHash = std::optional<Bytes>;
    using OptionalText = std::optional<std::string>;
    using Reply = std::function<void(BindResult, const std::optional<platform::Error>&)>;

    using DisplayNames = std::map<Bytes, std::string>;               // by public-key hash
    using UnpairedIdentities = std::map<std::string, DisplayNames>;  // by token
    using WrapKeysHashMap = std::map<Bytes, std::string>;            // token by wrap key's hash

    // The status of what an operation refuses itself.
    static constexpr platform::Status kRefused = -8;

    // For the user who sits at this machine. An operation that is started makes its dialog with
    // `makeDialog`; without one it shows nothing.
    static std::shared_ptr<BindOperation> init(PairingDialogMaker makeDialog = {});

    static std::shared_ptr<BindOperation> initWithUserName(OptionalText userName,
                                                           PairingDialogMaker makeDialog = {});

    ~BindOperation();
    BindOperation(const BindOperation&) = delete;
    BindOperation& operator=(const BindOperation&) = delete;

    // Returns at once. The reply is told how the operation ends, with the dialog's error if it
    // gives one: in the background when the start finds nothing to offer, else on the main queue.
    // It may be called again: a token that leaves late is told, too.
    void startWithReply(Reply reply);

    // The dialog's end of the operation.
    void finishWithResult(BindResult result, const OptionalHash& publicKeyHash,
                          const std::optional<platform::Error>& error);

    // Closes the dialog and reports; a failure is shown to the user before that. The main queue's
    // only.
    void _showResultAlert(BindResult result, const std::optional<platform::Error>& error);

    // What the hints service tells about one token, or about all; TokenInfo reads it.
    std::optional<platform::PropertyList> tokenData(const OptionalText& token) const;

    // Adds what can be paired on one token to the cache, or makes the cache anew for all tokens.
    // A token without a key that can wrap an unlock key is left out when one is required.
    void _updateTokenCache(const OptionalText& token, bool requireWrapKey);

    // The hash of the key on this token that can wrap an unlock key.
    OptionalHash wrapKeyForTokenId(const std::string& token) const;

    // What the token watcher tells.
    void tokenInserted(const std::string& token);
    void tokenRemoved(const std::string& token);

    // The token that holds this key among the cached ones that can be paired.
    OptionalText tokenIdForUnpairedPubKeyHash(const OptionalHash& publicKeyHash) const;

    // Whether any key of the card that holds this one is paired; asks the hints service.
    bool _isSmartCardPaired(const OptionalHash& publicKeyHash) const;

    // Logs in to the card with the key and pairs the operation's user with it.
    platform::Status pairUser(const OptionalHash& publicKeyHash, bool requireWrapKey,
                              ErrorPlace error);

    // Undoes a pairing of the named user, or of the operation's own when none is named. The unlock
    // key goes too when it is the operation's own user; failing to erase it is no failure.
    platform::Status unpairUser(const OptionalHash& publicKeyHash, const OptionalText& userName,
                                ErrorPlace error);

    // Stores the key that opens the user's login keyring after a login with this card, which was
    // paired before; the user has to be the one at the console. May ask that user for the keyring's
    // password. A status of the keychain's comes without an error.
    platform::Status storeUnlockKey(const OptionalHash& publicKeyHash, ErrorPlace error);

    // The maps: null, or none to set, when absent; an absent map counts as an empty one in every
    // look-up, but a pairing fills the cache only when it is absent.
    std::shared_ptr<const WrapKeysHashMap> wrapKeysHashMap() const;
    void setWrapKeysHashMap(std::optional<WrapKeysHashMap> wrapKeysHashMap);
    std::shared_ptr<const UnpairedIdentities> unpairedIdentities() const;
    void setUnpairedIdentities(std::optional<UnpairedIdentities> unpairedIdentities);

    // Null when absent; the dialog is that also after the end.
    Reply reply() const;
    void setReply(Reply reply);
    std::shared_ptr<PairingDialog> dialog() const;
    void setDialog(std::shared_ptr<PairingDialog> dialog);
    std::shared_ptr<platform::TokenWatcher> tokenWatcher() const;
    void setTokenWatcher(std::shared_ptr<platform::TokenWatcher> tokenWatcher);
    const OptionalText& userName() const { return _userName; }
    void setUserName(OptionalText userName) { _userName = std::move(userName); }

private:
    BindOperation(OptionalText userName, PairingDialogMaker makeDialog);

    template <typename... Arguments>
    auto whileAlive(void (BindOperation::*step)(Arguments...));
    void onMain(void (BindOperation::*step)());

    void startUp();
    bool mayPair() const;
    bool offersSomething() const;
    void watchTokens();
    void dropWatcher();
    void checkForDialog();
    void handleInsertion(const std::string& token);
    void handleRemoval(const std::string& token);

    void makeDialog();
    void showDialog(const std::shared_ptr<PairingDialog>& made);
    void refreshDialog();
    void closeDialog();
    void cancel();
    void showFailure(const std::shared_ptr<PairingDialog>& dialog,
                     const std::optional<platform::Error>& error);
    void end(BindResult result, const std::optional<platform::Error>& error);
    void report(BindResult result, const std::optional<platform::Error>& error) const;

    UnpairedIdentities offeredIdentities(const TokenInfo& info,
                                         const std::vector<std::string>& candidates,
                                         bool requireWrapKey) const;
    platform::Status loginAndBind(const std::string& token, const OptionalHash& publicKeyHash,
                                  ErrorPlace error) const;
    platform::Status refusePairing(const OptionalHash& publicKeyHash, ErrorPlace error) const;
    void eraseUnlockKey(const OptionalHash& publicKeyHash, const OptionalText& user) const;
    platform::Status _storeUnlockKey(const Bytes& publicKeyHash, const std::string& token,
                                     const Bytes& wrapKeyHash) const;

    Snapshot<WrapKeysHashMap> _wrapKeysHashMap;
    Snapshot<UnpairedIdentities> _unpairedIdentities;
    Snapshot<Reply> _reply;
    DialogPlace _dialog;
    Snapshot<std::shared_ptr<platform::TokenWatcher>> _tokenWatcher;
    OptionalText _userName;
    const PairingDialogMaker _makeDialog;
};

}  // namespace vlm
