#include "platform/binary_property_list_room.h"

#include <algorithm>

#include "platform/binary_property_list_output.h"
#include "platform/property_list_reading.h"
#include "platform/secret_hash.h"
#include "platform/seen_set.h"
#include "platform/utf.h"

namespace vlm::platform::binary_format {

namespace {

// Each function answers false as soon as a limit is passed.
class Counter {
public:
    explicit Counter(const PropertyListLimits& limits) : _limits(limits), _budget(limits) {
        constexpr std::size_t kOfASmallList = 64;
        _room.hashes.reserve(kOfASmallList);
    }

    bool addTop(const PropertyList& value) { return _budget.takeObjects(1) && add(value, 0); }

    Room room() && { return std::move(_room); }

private:
    bool add(const PropertyList& value, std::size_t depth) {
        return value.visit([&](const auto& held) { return add(held, depth); });
    }

    bool add(bool, std::size_t) { return addScalar(1); }
    bool add(std::int64_t value, std::size_t) {
        return addScalar(1 + widthOf(static_cast<std::uint64_t>(value)));
    }
    bool add(std::uint64_t, std::size_t) { return addScalar(1 + 2 * 8); }
    bool add(double, std::size_t) { return addScalar(1 + 8); }
    bool add(PropertyList::Date, std::size_t) { return addScalar(1 + 8); }

    // In UTF-16 a character of one byte takes two, of two or three bytes two, of four bytes four.
    bool add(const std::string& text, std::size_t) {
        const std::size_t most = isAscii(text) ? text.size() : 2 * text.size();
        return addSharable(_hashOf(text), text.size(), most);
    }

    bool add(const Bytes& bytes, std::size_t) {
        return addSharable(_hashOf(bytes), bytes.size(), bytes.size());
    }

    bool add(const PropertyList::Array& array, std::size_t depth) {
        return addCollection(array.size(), depth) &&
               std::ranges::all_of(array,
                                   [&](const PropertyList& each) { return add(each, depth + 1); });
    }

    bool add(const PropertyList::Dictionary& dictionary, std::size_t depth) {
        return addCollection(2 * dictionary.size(), depth) &&
               std::ranges::all_of(dictionary,
                                   [&](const auto& entry) { return add(entry.first, depth); }) &&
               std::ranges::all_of(dictionary,
                                   [&](const auto& entry) { return add(entry.second, depth + 1); });
    }

    bool addScalar(std::size_t bytes) {
        _room.contents += bytes;
        ++_room.scalars;
        return true;
    }

    bool addSharable(std::uint32_t hash, std::size_t held, std::size_t written) {
        _room.hashes.push_back(hash);
        return _budget.takeBytes(held) && addScalar(countBytes(held) + written);
    }

    bool addCollection(std::size_t references, std::size_t depth) {
        if (depth == _limits.depth || !_budget.takeObjects(references)) return false;
        _room.contents += countBytes(references);
        _room.references += references;
        ++_room.collections;
        return true;
    }

    const PropertyListLimits& _limits;
    const SecretHash _hashOf;
    PropertyListBudget _budget;
    Room _room;
};

}  // namespace

std::size_t Room::bytes() const {
    const std::size_t table = kMagic.size() + contents + references * widthOf(objects());
    return table + objects() * widthOf(table) + kTrailerSize;
}

bool Room::isNumberable() const {
    constexpr std::size_t kMost = 0xFFFFFFFF;
    return objects() <= SeenSet::kMostPieces && bytes() <= kMost;
}

std::optional<Room> roomFor(const PropertyList& value, const PropertyListLimits& limits) {
    Counter counter(limits);
    if (!counter.addTop(value)) return std::nullopt;
    return std::move(counter).room();
}

}  // namespace vlm::platform::binary_format
