#include "bind/bind_operation.h"

#include <utility>

#include "util/bind_utils.h"

namespace vlm {

std::shared_ptr<BindOperation> BindOperation::init(PairingDialogMaker makeDialog) {
    return initWithUserName(BindUtils::userNameForUserId(BindUtils::currentLoggedInUserId()),
                            std::move(makeDialog));
}

std::shared_ptr<BindOperation> BindOperation::initWithUserName(OptionalText userName,
                                                               PairingDialogMaker makeDialog) {
    return std::shared_ptr<BindOperation>(
        new BindOperation(std::move(userName), std::move(makeDialog)));
}

BindOperation::BindOperation(OptionalText userName, PairingDialogMaker makeDialog)
    : _userName(std::move(userName)), _makeDialog(std::move(makeDialog)) {}

BindOperation::~BindOperation() = default;

std::shared_ptr<const BindOperation::WrapKeysHashMap> BindOperation::wrapKeysHashMap() const {
    return _wrapKeysHashMap.get();
}

void BindOperation::setWrapKeysHashMap(std::optional<WrapKeysHashMap> wrapKeysHashMap) {
    _wrapKeysHashMap.set(std::move(wrapKeysHashMap));
}

std::shared_ptr<const BindOperation::UnpairedIdentities> BindOperation::unpairedIdentities() const {
    return _unpairedIdentities.get();
}

void BindOperation::setUnpairedIdentities(std::optional<UnpairedIdentities> unpairedIdentities) {
    _unpairedIdentities.set(std::move(unpairedIdentities));
}

BindOperation::Reply BindOperation::reply() const {
    const auto held = _reply.get();
    return held ? *held : nullptr;
}

void BindOperation::setReply(Reply reply) { _reply.set(std::move(reply)); }

std::shared_ptr<PairingDialog> BindOperation::dialog() const { return _dialog.get(); }

void BindOperation::setDialog(std::shared_ptr<PairingDialog> dialog) {
    _dialog.set(std::move(dialog));
}

std::shared_ptr<platform::TokenWatcher> BindOperation::tokenWatcher() const {
    const auto held = _tokenWatcher.get();
    return held ? *held : nullptr;
}

void BindOperation::setTokenWatcher(std::shared_ptr<platform::TokenWatcher> tokenWatcher) {
    _tokenWatcher.set(std::move(tokenWatcher));
}

}  // namespace vlm
