// Very many random values, written and read back: a million, or as many as a sanitizer lets pass in
// the same time.

#include <gtest/gtest.h>

#include "platform/property_list.h"
#include "random_property_lists.h"

namespace vlm::platform {
namespace {

TEST(RandomPropertyListsTest, AreReadAsTheyWereWrittenInBinary) {
    test::RandomPropertyLists values;
    for (int number = 0; number < VLM_RANDOM_VALUES; ++number) {
        const PropertyList value = values.next();
        const auto data = writeBinaryPropertyList(value);
        ASSERT_TRUE(data) << value.describe();
        const auto again = readPropertyList(*data);
        ASSERT_EQ(again, value) << value.describe();
        ASSERT_EQ(writeBinaryPropertyList(*again), data) << value.describe();
    }
}

TEST(RandomPropertyListsTest, AreReadAsTheyWereWrittenInXml) {
    test::RandomPropertyLists values(test::RandomPropertyLists::Of::WhatXmlHolds);
    for (int number = 0; number < VLM_RANDOM_VALUES; ++number) {
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
