#include "services/hints/tokens/machine_anchors.h"

#include <gtest/gtest.h>

#include "platform/property_list.h"

namespace vlm::service {
namespace {

using platform::Bytes;
using platform::PropertyList;

TEST(MachineAnchorsTest, AreToldAsTheyAre) {
    const MachineAnchors anchors{{{1, 2}, {3}}, {{4}}};

    const auto message = encodeAnchors(anchors);

    ASSERT_TRUE(message);
    EXPECT_EQ(decodeAnchors(*message), anchors);
}

TEST(MachineAnchorsTest, LeaveOutWhatIsOutOfBounds) {
    const MachineAnchors anchors{{Bytes(kMostAnchorBytes + 1, 1), {}, {2}},
                                 std::vector<Bytes>(kMostAnchors + 1, Bytes{3})};

    const auto message = encodeAnchors(anchors);
    const auto told = message ? decodeAnchors(*message) : std::nullopt;

    ASSERT_TRUE(told);
    EXPECT_EQ(told->trusted, std::vector<Bytes>{{2}});
    EXPECT_EQ(told->distrusted.size(), kMostAnchors);
}

TEST(MachineAnchorsTest, AreNoneInAnythingElse) {
    const auto decoded = [](PropertyList value) {
        return decodeAnchors(*platform::writeBinaryPropertyList(std::move(value))).has_value();
    };
    const PropertyList::Array one{Bytes{1}};
    const PropertyList::Array tooLong{Bytes(kMostAnchorBytes + 1, 1)};
    const PropertyList::Array wrong{"text"};

    EXPECT_TRUE(decoded(PropertyList::Dictionary{{"trusted", one}, {"distrusted", one}}));
    EXPECT_FALSE(decoded(PropertyList::Dictionary{{"trusted", one}}));
    EXPECT_FALSE(decoded(PropertyList::Dictionary{{"trusted", one}, {"distrusted", tooLong}}));
    EXPECT_FALSE(decoded(PropertyList::Dictionary{{"trusted", wrong}, {"distrusted", one}}));
    EXPECT_FALSE(decoded("text"));
    EXPECT_FALSE(decodeAnchors(Bytes{1, 2, 3}));
}

}  // namespace
}  // namespace vlm::service
