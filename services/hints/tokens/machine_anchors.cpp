#include "services/hints/tokens/machine_anchors.h"

#include <utility>

#include "platform/property_list.h"
#include "services/hints/tokens/frames.h"

namespace vlm::service {
namespace {

using platform::Bytes;
using platform::PropertyList;

constexpr platform::PropertyListLimits kLimits = {
    .depth = 4, .objects = std::size_t{1} << 15U, .bytes = kMostFrameBytes};

bool isInBounds(const Bytes& certificate) {
    return !certificate.empty() && certificate.size() <= kMostAnchorBytes;
}

PropertyList::Array listOf(const std::vector<Bytes>& certificates) {
    PropertyList::Array list;
    for (const auto& each : certificates)
        if (isInBounds(each) && list.size() < kMostAnchors) list.emplace_back(each);
    return list;
}

// False for anything that is no such list.
bool read(const PropertyList* value, std::vector<Bytes>& certificates) {
    const auto* list = value == nullptr ? nullptr : value->array();
    if (list == nullptr || list->size() > kMostAnchors) return false;
    for (const auto& each : *list) {
        if (each.bytes() == nullptr || !isInBounds(*each.bytes())) return false;
        certificates.push_back(*each.bytes());
    }
    return true;
}

}  // namespace

std::optional<Bytes> encodeAnchors(const MachineAnchors& anchors) {
    return platform::writeBinaryPropertyList(
        PropertyList::Dictionary{{"trusted", listOf(anchors.trusted)},
                                 {"distrusted", listOf(anchors.distrusted)}},
        kLimits);
}

std::optional<MachineAnchors> decodeAnchors(std::span<const std::uint8_t> message) {
    const auto value = platform::readPropertyList(message, kLimits);
    const auto* entries = value ? value->dictionary() : nullptr;
    MachineAnchors anchors;
    if (entries == nullptr || !read(entries->find("trusted"), anchors.trusted) ||
        !read(entries->find("distrusted"), anchors.distrusted))
        return {};
    return anchors;
}

}  // namespace vlm::service
