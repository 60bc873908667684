#include "platform/linux/growing_pause.h"

#include <gtest/gtest.h>

namespace vlm::platform {
namespace {

using namespace std::chrono_literals;

TEST(GrowingPauseTest, DoublesUpToTheLongest) {
    GrowingPause pause;

    for (const auto expected : {1s, 2s, 4s, 8s, 16s, 30s, 30s}) EXPECT_EQ(pause.next(), expected);
}

TEST(GrowingPauseTest, BeginsAnewAfterASuccess) {
    GrowingPause pause(2s, 10s);
    pause.next();
    pause.next();

    pause.reset();

    for (const auto expected : {2s, 4s, 8s, 10s}) EXPECT_EQ(pause.next(), expected);
}

}  // namespace
}  // namespace vlm::platform
