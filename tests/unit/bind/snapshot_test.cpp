#include "bind/snapshot.h"

#include <gtest/gtest.h>

#include <atomic>
#include <map>
#include <memory>
#include <thread>
#include <vector>

namespace vlm {
namespace {

using Map = std::map<int, int>;

TEST(Snapshot, IsAbsentAtFirst) {
    const Snapshot<Map> cell;

    EXPECT_EQ(cell.get(), nullptr);
}

TEST(Snapshot, TellsAbsentFromEmpty) {
    Snapshot<Map> cell;

    cell.set(Map{});
    ASSERT_NE(cell.get(), nullptr);
    EXPECT_TRUE(cell.get()->empty());

    cell.set(std::nullopt);
    EXPECT_EQ(cell.get(), nullptr);
}

TEST(Snapshot, UpdateMakesAnAbsentValueOrLeavesItAbsent) {
    Snapshot<Map> cell;

    cell.update([](std::shared_ptr<Map>& map) { EXPECT_FALSE(map); });
    EXPECT_EQ(cell.get(), nullptr);

    cell.update([](std::shared_ptr<Map>& map) { map = std::make_shared<Map>(Map{{1, 10}}); });
    EXPECT_EQ(*cell.get(), (Map{{1, 10}}));
}

TEST(Snapshot, UpdateKeepsWhatItDoesNotChange) {
    Snapshot<Map> cell;
    cell.set(Map{{1, 10}, {2, 20}});

    cell.update([](std::shared_ptr<Map>& map) {
        if (map) map->insert_or_assign(2, 21);
    });

    EXPECT_EQ(*cell.get(), (Map{{1, 10}, {2, 21}}));
}

TEST(Snapshot, UpdateTakesTheValueAway) {
    Snapshot<Map> cell;
    cell.set(Map{});

    cell.update([](std::shared_ptr<Map>& map) { map.reset(); });

    EXPECT_EQ(cell.get(), nullptr);
}

TEST(Snapshot, AReaderKeepsTheVersionThatItGot) {
    Snapshot<Map> cell;
    cell.set(Map{{1, 10}});
    const auto before = cell.get();

    cell.update([](std::shared_ptr<Map>& map) {
        if (map) map->clear();
    });
    cell.set(std::nullopt);

    EXPECT_EQ(*before, (Map{{1, 10}}));
}

// Every update adds an entry and counts it, so a version that is not whole gives itself away.
TEST(Snapshot, ShowsOnlyWholeVersionsAndLosesNoUpdate) {
    constexpr int kWriters = 3;
    constexpr int kUpdates = 200;
    struct Versioned {
        Map map;
        int entries = 0;
    };
    Snapshot<Versioned> cell;
    std::atomic<int> writing = kWriters;
    std::atomic<int> torn = 0;

    const auto write = [&](int writer) {
        for (int i = 0; i < kUpdates; ++i)
            cell.update([&](std::shared_ptr<Versioned>& value) {
                if (!value) value = std::make_shared<Versioned>();
                value->map[writer * kUpdates + i] = i;
                ++value->entries;
            });
        --writing;
    };
    const auto read = [&] {
        while (writing > 0) {
            const auto version = cell.get();
            if (version && version->map.size() != static_cast<std::size_t>(version->entries))
                ++torn;
        }
    };
    std::vector<std::thread> threads;
    for (int writer = 0; writer < kWriters; ++writer) threads.emplace_back(write, writer);
    for (int reader = 0; reader < 2; ++reader) threads.emplace_back(read);
    for (auto& thread : threads) thread.join();

    EXPECT_EQ(torn, 0);
    EXPECT_EQ(cell.get()->entries, kWriters * kUpdates);
}

TEST(Snapshot, MayBeDroppedWhileItIsReadAndUpdated) {
    Snapshot<Map> cell;
    std::atomic<bool> done = false;
    std::atomic<int> wrong = 0;

    std::thread dropper([&] {
        for (int i = 0; i < 500; ++i) {
            cell.update([&](std::shared_ptr<Map>& map) {
                map = std::make_shared<Map>(Map{{i, i}});
            });
            cell.set(std::nullopt);
        }
        done = true;
    });
    std::thread reader([&] {
        while (!done)
            if (const auto version = cell.get(); version && version->size() != 1) ++wrong;
    });
    dropper.join();
    reader.join();

    EXPECT_EQ(wrong, 0);
    EXPECT_EQ(cell.get(), nullptr);
}

}  // namespace
}  // namespace vlm
