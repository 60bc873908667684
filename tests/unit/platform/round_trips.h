// Random values, written and read back.

#pragma once

#include <gtest/gtest.h>

#include "platform/property_list.h"
#include "random_property_lists.h"

namespace vlm::test {

inline void expectThatBinaryListsRoundTrip(int count) {
    RandomPropertyLists values;
    for (int number = 0; number < count; ++number) {
        const platform::PropertyList value = values.next();
        const auto data = writeBinaryPropertyList(value);
        ASSERT_TRUE(data) << value.describe();
        const auto again = platform::readPropertyList(*data);
        ASSERT_EQ(again, value) << value.describe();
        ASSERT_EQ(writeBinaryPropertyList(*again), data) << value.describe();
    }
}

inline void expectThatXmlListsRoundTrip(int count) {
    RandomPropertyLists values(RandomPropertyLists::Of::WhatXmlHolds);
    for (int number = 0; number < count; ++number) {
        const platform::PropertyList value = values.next();
        const auto text = writeXmlPropertyList(value);
        ASSERT_TRUE(text) << value.describe();
        const auto again = platform::readPropertyList(platform::Bytes(text->begin(), text->end()));
        ASSERT_EQ(again, value) << *text;
        ASSERT_EQ(writeXmlPropertyList(*again), text);
    }
}

}  // namespace vlm::test
