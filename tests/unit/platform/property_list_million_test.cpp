// Very many random values: a million, or as many as a sanitizer lets pass in the same time.

#include <gtest/gtest.h>

#include "round_trips.h"

namespace vlm::test {
namespace {

TEST(RandomPropertyListsTest, AreReadAsTheyWereWrittenInBinary) {
    expectThatBinaryListsRoundTrip(VLM_RANDOM_VALUES);
}

TEST(RandomPropertyListsTest, AreReadAsTheyWereWrittenInXml) {
    expectThatXmlListsRoundTrip(VLM_RANDOM_VALUES);
}

}  // namespace
}  // namespace vlm::test
