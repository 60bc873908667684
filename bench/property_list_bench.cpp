// How fast property lists are read and written, against what cannot be done without: building the
// same values from parts that lie in memory, and copying the bytes while walking over the values.

#include <malloc.h>

#include <algorithm>
#include <cstdio>
#include <cstring>
#include <string>
#include <vector>

#include "bench/interleaved.h"
#include "platform/property_list.h"

namespace vlm::bench {
namespace {

using platform::Bytes;
using platform::PropertyList;

// An entry of a record as services send it: a name, a key's hash, a state.
struct Part {
    std::string key;
    std::string name;
    Bytes hash;
    std::int64_t count = 0;
    bool used = false;
};

std::vector<Part> parts(std::size_t count) {
    std::vector<Part> all;
    for (std::size_t i = 0; i < count; ++i) {
        Part part;
        part.key = "identity-" + std::to_string(i);
        part.name = "Alice Example the " + std::to_string(i) + "th";
        part.hash.assign(32, static_cast<std::uint8_t>(i));
        std::memcpy(part.hash.data(), &i, sizeof i);
        part.count = static_cast<std::int64_t>(i * 37);
        part.used = i % 2 == 0;
        all.push_back(std::move(part));
    }
    return all;
}

PropertyList built(const std::vector<Part>& parts) {
    PropertyList::Dictionary record;
    for (const Part& part : parts)
        record.append(part.key, PropertyList::Array{part.name, part.hash, part.count, part.used});
    return record;
}

// Looks at every value once, and at the size of what it holds.
std::size_t walked(const PropertyList& value) {
    if (const auto* text = value.text()) return text->size();
    if (const auto* bytes = value.bytes()) return bytes->size();
    std::size_t sum = 1;
    if (const auto* array = value.array())
        for (const PropertyList& each : *array) sum += walked(each);
    if (const auto* dictionary = value.dictionary())
        for (const auto& [key, each] : *dictionary) sum += key.size() + walked(each);
    return sum;
}

std::string megabytesPerSecond(std::size_t bytes, std::chrono::duration<double> time) {
    char text[48];
    std::snprintf(text, sizeof text, "%.0f MB/s", static_cast<double>(bytes) / 1e6 / time.count());
    return text;
}

bool measure(std::size_t entries) {
    const auto source = parts(entries);
    const PropertyList value = built(source);
    const Bytes bytes = *platform::writeBinaryPropertyList(value);
    if (platform::readPropertyList(bytes) != value) {
        std::printf("%zu entries are not read back as they were written\n", entries);
        return false;
    }

    const std::size_t times = std::max<std::size_t>(1, 20'000 / entries);
    const auto time = medianTimes(
        {
            {"read", [&] { keep(platform::readPropertyList(bytes)); }, times},
            {"build", [&] { keep(built(source)); }, times},
            {"write", [&] { keep(platform::writeBinaryPropertyList(value)); }, times},
            {"copy and walk",
             [&] {
                 keep(Bytes(bytes));
                 keep(walked(value));
             },
             times},
        },
        entries > 10'000 ? 15 : 60);

    const std::string what =
        std::to_string(entries) + " entries, " + std::to_string(bytes.size()) + " bytes";
    const bool reads = report("read " + what, time[0], "building the values", time[1], 3,
                              megabytesPerSecond(bytes.size(), time[0]));
    const bool writes = report("write " + what, time[2], "copying and walking", time[3], 4,
                               megabytesPerSecond(bytes.size(), time[2]));
    return reads && writes;
}

// What one piece frees, the next one finds: else whichever follows a large one pays for new pages,
// and the one behind it for none.
void keepMemory() {
    mallopt(M_MMAP_THRESHOLD, 32 << 20);
    mallopt(M_TRIM_THRESHOLD, 1 << 30);
}

}  // namespace
}  // namespace vlm::bench

int main() {
    vlm::bench::keepMemory();
    bool reached = true;
    for (const std::size_t entries : {10UL, 1'000UL, 100'000UL})
        reached = vlm::bench::measure(entries) && reached;
    return reached ? 0 : 1;
}
