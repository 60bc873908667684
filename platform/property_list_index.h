// Finds what was seen before among the parts of a property list, in a table of hashes.
//
// Errors: whoever makes a list can choose parts that all have one hash. The search is given up
//         after some steps then, and the caller has to do without it.

#pragma once

#include <bit>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <string_view>
#include <vector>

namespace vlm::platform {

std::uint32_t hashOf(std::uint64_t number);
std::uint32_t hashOf(std::string_view bytes);

class PropertyListIndex {
public:
    explicit PropertyListIndex(std::size_t expected = 0)
        : _places(std::bit_ceil(2 * expected + kFewest)) {}

    // The number of the part that is equal, which is the new number when there was none; nothing
    // when too many others are in the way. `isEqual` answers for the part with a number.
    template <typename IsEqual>
    std::optional<std::uint32_t> findOrAdd(std::uint32_t hash, std::uint32_t number,
                                           IsEqual isEqual) {
        std::size_t at = hash;
        for (int step = 0; step < kMostSteps; ++step, ++at) {
            Place& place = _places[at & (_places.size() - 1)];
            if (place.number == kFree) {
                place = {hash, number};
                if (2 * ++_taken > _places.size()) grow();
                return number;
            }
            if (place.hash == hash && isEqual(place.number)) return place.number;
        }
        return std::nullopt;
    }

private:
    static constexpr std::uint32_t kFree = UINT32_MAX;
    static constexpr std::size_t kFewest = 16;
    static constexpr int kMostSteps = 128;  // far more than there are by chance in half a table

    struct Place {
        std::uint32_t hash = 0;
        std::uint32_t number = kFree;
    };

    void grow() {
        std::vector<Place> places(2 * _places.size());
        for (const Place& place : _places) {
            if (place.number == kFree) continue;
            std::size_t at = place.hash;
            while (places[at & (places.size() - 1)].number != kFree) ++at;
            places[at & (places.size() - 1)] = place;
        }
        _places = std::move(places);
    }

    std::vector<Place> _places;  // a power of two of them
    std::size_t _taken = 0;
};

}  // namespace vlm::platform
