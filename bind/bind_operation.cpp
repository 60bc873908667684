#include "bind/bind_operation.h"

#include <utility>

#include "util/bind_utils.h"

namespace vlm {

std::shared_ptr<BindOperation> BindOperation::init() {
    return initWithUserName(BindUtils::userNameForUserId(BindUtils::currentLoggedInUserId()));
}

std::shared_ptr<BindOperation> BindOperation::initWithUserName(OptionalText userName) {
    return std::shared_ptr<BindOperation>(new BindOperation(std::move(userName)));
}

BindOperation::BindOperation(OptionalText userName) : _userName(std::move(userName)) {}

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

}  // namespace vlm
