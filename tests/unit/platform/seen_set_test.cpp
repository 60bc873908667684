#include "platform/seen_set.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <string>

#include "platform/secret_hash.h"

namespace vlm::platform {
namespace {

// Pieces by number, as whoever uses the set keeps them.
class SeenSetTest : public ::testing::Test {
protected:
    // The number of the piece that is found to be the same; a new one's own.
    std::uint32_t findOrAdd(const std::string& piece) {
        const auto next = static_cast<std::uint32_t>(_pieces.size());
        const std::uint32_t found = _set.findOrAdd(_hashOf(piece), next, [&](std::uint32_t number) {
            return _pieces.at(number) == piece;
        });
        if (found == next) _pieces.push_back(piece);
        return found;
    }

    void expectAllToldApart(const std::vector<std::string>& pieces) {
        for (std::uint32_t number = 0; number < pieces.size(); ++number)
            EXPECT_EQ(findOrAdd(pieces[number]), number) << "new, size " << pieces[number].size();
        for (std::uint32_t number = 0; number < pieces.size(); ++number)
            EXPECT_EQ(findOrAdd(pieces[number]), number) << "again, size " << pieces[number].size();
    }

    SecretHash _hashOf;
    SeenSet _set{0};
    std::vector<std::string> _pieces;
};

TEST_F(SeenSetTest, FindsAPieceWithTheSameBytes) {
    const std::uint32_t first = findOrAdd("one");
    const std::uint32_t second = findOrAdd("two");

    EXPECT_NE(first, second);
    EXPECT_EQ(findOrAdd("one"), first);
    EXPECT_EQ(findOrAdd("two"), second);
}

TEST_F(SeenSetTest, TellsTheEmptyPieceFromOthers) {
    expectAllToldApart({"", std::string(1, '\0'), "a"});
}

TEST_F(SeenSetTest, TellsPiecesOfEveryShortLengthApart) {
    std::vector<std::string> pieces;
    for (std::size_t size = 1; size <= 40; ++size) pieces.emplace_back(size, 'x');
    expectAllToldApart(pieces);
}

TEST_F(SeenSetTest, TellsZerosOfDifferentLengthsApart) {
    std::vector<std::string> pieces;
    for (std::size_t size = 0; size <= 40; ++size) pieces.emplace_back(size, '\0');
    expectAllToldApart(pieces);
}

// A difference in whatever byte counts, also in those behind the last whole word.
TEST_F(SeenSetTest, TellsPiecesThatDifferInOneByteApart) {
    std::vector<std::string> pieces;
    for (std::size_t size = 1; size <= 40; ++size) {
        const std::string same(size, 'x');
        pieces.push_back(same);
        for (std::size_t at = 0; at < size; ++at) {
            pieces.push_back(same);
            pieces.back()[at] = 'y';
        }
    }
    expectAllToldApart(pieces);
}

TEST_F(SeenSetTest, KeepsEveryPieceWhileItGrows) {
    std::vector<std::string> pieces(10000);
    for (std::size_t number = 0; number < pieces.size(); ++number)
        pieces[number] = "piece " + std::to_string(number);
    expectAllToldApart(pieces);
}

// Hashes that did not spread would not be wrong, only slow, and nobody would notice.
TEST_F(SeenSetTest, ComparesHardlyAnyPieceThatDiffers) {
    std::size_t compared = 0;
    constexpr std::uint32_t kPieces = 20000;
    for (std::uint32_t number = 0; number < kPieces; ++number) {
        std::vector<std::uint8_t> bytes(number % 40 + 3);
        for (std::size_t byte = 0; byte < 3; ++byte)
            bytes[byte] = static_cast<std::uint8_t>(number >> (8 * byte));
        _set.findOrAdd(_hashOf(bytes), number, [&](std::uint32_t) {
            ++compared;
            return false;
        });
    }
    // 20,000 random hashes of 32 bits have 0.05 pairs in common, of which few meet.
    EXPECT_LT(compared, 10u);
}

}  // namespace
}  // namespace vlm::platform
