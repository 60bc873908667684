#include "services/hints/unlock_key_changes.h"

#include <string>
#include <utility>

#include "platform/harmless_text.h"
#include "platform/text.h"
#include "services/hints/account_spelling.h"
#include "services/hints/hints_log.h"
#include "services/hints/status.h"
#include "services/keychain/unlock_key_wrapping.h"

namespace vlm::service {

namespace {

// By the public half that was kept for it, and in the way in which it was wrapped before.
bool wrapInPlace(UnlockKey& key, const Secret& password) {
    const auto task = cardTask(key.wrapped, key.wrapKeyHash);
    auto wrapped = task ? wrapUnlockKey(password, {key.account, key.hash, key.wrapKeyHash},
                                        key.wrapPublicInfo, task->scheme)
                        : std::nullopt;
    if (wrapped) key.wrapped = std::move(*wrapped);
    return wrapped.has_value();
}

}  // namespace

std::optional<Refusal> eraseUnlockKey(UnlockKeyStore& keys, const Caller& caller,
                                      const Request& request) {
    // An account that is gone can still lose its keys.
    const auto account = spelling(request.account).value_or(request.account);
    const auto wasThere = keys.eraseUnlockKey(account, request.hash);
    if (!wasThere) return wasThere.refusal();
    if (*wasThere)
        kLog.notice("erased the unlock key of {} for {} for user {}",
                    platform::harmlessText(account), platform::hexadecimal(request.hash),
                    caller.user);
    return std::nullopt;
}

Outcome<std::size_t> wrapAnew(UnlockKeyStore& keys, const Caller& caller, const Request& request) {
    const auto account = spelling(request.account);
    if (!account) return refused(status::kNoSuchAccount, request, "there is no such account.");
    auto all = keys.unlockKeysOf(*account);
    if (!all) return all.refusal();
    for (auto& key : *all)
        if (!wrapInPlace(key, *request.password))
            return refused(status::kNoWrapKey, request,
                           platform::text("the unlock key for {} cannot be wrapped anew. Unpair "
                                          "that card and pair it again.",
                                          platform::hexadecimal(key.hash)));
    if (auto failure = keys.storeUnlockKeys(*all)) return *failure;
    if (!all->empty())
        kLog.notice("wrapped the new password of {} for {} cards for user {}",
                    platform::harmlessText(*account), all->size(), caller.user);
    return all->size();
}

}  // namespace vlm::service
