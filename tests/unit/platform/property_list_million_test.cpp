// A million random values, written and read back; fewer in a build with sanitizers.

#include <gtest/gtest.h>

#include "measured_cost.h"
#include "platform/property_list.h"
#include "random_property_lists.h"

namespace vlm::platform {
namespace {

constexpr int kLists = 1000000 / test::kAllowance;

TEST(MillionPropertyListsTest, AreReadAsTheyWereWrittenInBinary) {
    test::RandomPropertyLists values;
    for (int number = 0; number < kLists; ++number) {
        const PropertyList value = values.next();
        const auto data = writeBinaryPropertyList(value);
        ASSERT_TRUE(data) << value.describe();
        const auto again = readPropertyList(*data);
        ASSERT_EQ(again, value) << value.describe();
        ASSERT_EQ(writeBinaryPropertyList(*again), data) << value.describe();
    }
}

TEST(MillionPropertyListsTest, AreReadAsTheyWereWrittenInXml) {
    test::RandomPropertyLists values(test::RandomPropertyLists::Of::WhatXmlHolds);
    for (int number = 0; number < kLists; ++number) {
        const PropertyList value = values.next();
        const auto text = writeXmlPropertyList(value);
        ASSERT_TRUE(text) << value.describe();
        const auto again = readPropertyList(Bytes(text->begin(), text->end()));
        ASSERT_EQ(again, value) << *text;
        ASSERT_EQ(writeXmlPropertyList(*again), text);
    }
}

}  // namespace
}  // namespace vlm::platform
