#include "services/pam/options.h"

#include <gmock/gmock.h>

namespace vlm::pam {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

Options read(std::vector<const char*> words) {
    return readOptions(static_cast<int>(words.size()), words.data());
}

TEST(PamOptionsTest, AreTheSystemBusAndFiveSecondsWhereNothingIsSaid) {
    const auto options = read({});

    EXPECT_FALSE(options.isDebugging);
    EXPECT_EQ(options.patience, std::chrono::seconds(5));
    EXPECT_EQ(options.bus, "unix:path=/run/dbus/system_bus_socket");
    EXPECT_THAT(options.notUnderstood, IsEmpty());
}

TEST(PamOptionsTest, ReadEachWord) {
    const auto options = read({"debug", "timeout=12", "bus=unix:path=/tmp/bus"});

    EXPECT_TRUE(options.isDebugging);
    EXPECT_EQ(options.patience, std::chrono::seconds(12));
    EXPECT_EQ(options.bus, "unix:path=/tmp/bus");
    EXPECT_THAT(options.notUnderstood, IsEmpty());
}

TEST(PamOptionsTest, LeaveOutWhatIsNotUnderstood) {
    for (const char* word :
         {"timeout=", "timeout=0", "timeout=-1", "timeout=601", "timeout=5s",
          "timeout=99999999999999999999", "bus=", "Debug", "", "use_first_pass"}) {
        const auto options = read({word, "debug"});

        EXPECT_THAT(options.notUnderstood, ElementsAre(word));
        EXPECT_EQ(options.patience, std::chrono::seconds(5));
        EXPECT_TRUE(options.isDebugging);
    }
}

}  // namespace
}  // namespace vlm::pam
