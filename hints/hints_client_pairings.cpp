// Pairings of accounts with identities: made, ended and asked for.

#include <cstdint>
#include <new>

#include "hints/hints_client.h"
#include "hints/hints_exchange.h"
#include "hints/hints_log.h"
#include "hints/status.h"
#include "platform/token_framework.h"

using namespace vlm::hints;
using vlm::platform::Bytes;
using vlm::platform::ErrorPlace;
using vlm::platform::PropertyList;
using vlm::platform::Status;
using vlm::platform::String;

namespace {

Status binderWorker(const std::optional<String>& userName,
                    const std::optional<Bytes>& publicKeyHash, bool unbind, ErrorPlace error) {
    log().debug("binderWorker");
    if (!userName || !publicKeyHash) {
        log().error("binderWorker wrong params");
        return kFirstStringRefused;
    }

    auto request = makeRequest(unbind ? Operation::UnbindUser : Operation::BindUser);
    request.set("dat1", *publicKeyHash);
    if (!setString(&request, 1, userName, "binderWorker")) return kFirstStringRefused;

    const auto reply = connectTo(Instance::Daemon)->sendAndWait(request);
    vlm::platform::decodeReplyError(reply, error);
    return readStatus(reply);
}

// The dictionary's values in its order; its keys say nothing to a caller. None when there is no
// memory for them: how many there are is the service's choice, not the caller's.
std::optional<PropertyList::Array> valuesOf(const PropertyList::Dictionary& dictionary) {
    try {
        PropertyList::Array values;
        values.reserve(dictionary.size());
        for (const auto& entry : dictionary) values.push_back(entry.second);
        return values;
    } catch (const std::bad_alloc&) {
        return std::nullopt;
    }
}

}  // namespace

Status VLBindUser(const std::optional<String>& userName, const std::optional<Bytes>& publicKeyHash,
                  ErrorPlace error) {
    return binderWorker(userName, publicKeyHash, /*unbind=*/false, error);
}

Status VLUnbindUser(const std::optional<String>& userName,
                    const std::optional<Bytes>& publicKeyHash, ErrorPlace error) {
    return binderWorker(userName, publicKeyHash, /*unbind=*/true, error);
}

std::optional<PropertyList::Array> VLCopyLegacyBindings(const std::optional<String>& userName,
                                                        bool flag) {
    log().debug("VLCopyLegacyBindings");
    if (!userName) {
        log().error("VLCopyLegacyBindings wrong params");
        return std::nullopt;
    }

    auto request = makeRequest(Operation::CopyLegacyBindings);
    request.set("num1", std::int64_t{flag});
    if (!setString(&request, 1, userName, "VLCopyLegacyBindings")) return std::nullopt;

    const auto reply = connectTo(Instance::Daemon)->sendAndWait(request);
    const auto list = readPropertyListUnlessFailed(reply);
    const auto* bindings = list ? list->dictionary() : nullptr;
    if (!bindings) return std::nullopt;

    log().debug("transforming {} hashes", bindings->size());
    auto hashes = valuesOf(*bindings);
    if (hashes) log().debug("result {}", *hashes);
    return hashes;
}

bool VLIsUserBound(const std::optional<String>& userName) {
    log().debug("VLIsUserBound");
    if (!userName) {
        log().error("VLIsUserBound wrong params");
        return false;
    }

    // Without an answer the user counts as paired.
    auto request = makeRequest(Operation::IsUserBound);
    if (!setString(&request, 1, userName, "VLIsUserBound")) return true;

    const auto reply = connectTo(Instance::Daemon)->sendAndWait(request);
    return readStatusUnlessFailed(reply) != vlm::platform::kSuccess;
}
