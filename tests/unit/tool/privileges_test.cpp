#include "tool/privileges.h"

#include <sstream>

#include "platform_test.h"

namespace vlm {
namespace {

using platform::LogLevel;

class Privileges : public fakes::PlatformTest {
protected:
    std::ostringstream output;
    std::ostringstream complaints;
    Console console{output, complaints};
};

TEST_F(Privileges, CheckRootPassesRootAndSaysNothing) {
    process().runAs(0);

    EXPECT_TRUE(checkRoot(console));
    EXPECT_EQ(output.str(), "");
    EXPECT_TRUE(log().lines().empty());
}

TEST_F(Privileges, CheckRootRefusesEverybodyElse) {
    process().runAs(1000);

    EXPECT_FALSE(checkRoot(console));
    EXPECT_EQ(output.str(), "This operation requires root privileges.\n");
    EXPECT_EQ(log().texts(LogLevel::Default),
              std::vector<std::string>{"This operation requires root privileges.\n"});
}

TEST_F(Privileges, CheckNoRootPassesAnOrdinaryUserAndSaysNothing) {
    process().runAs(1000);

    EXPECT_TRUE(checkNoRoot(console));
    EXPECT_EQ(output.str(), "");
    EXPECT_TRUE(log().lines().empty());
}

TEST_F(Privileges, CheckNoRootRefusesRoot) {
    process().runAs(0);

    EXPECT_FALSE(checkNoRoot(console));
    EXPECT_EQ(output.str(), "This operation must not be run with root privileges.\n");
    EXPECT_EQ(log().texts(LogLevel::Default),
              std::vector<std::string>{"This operation must not be run with root privileges.\n"});
}

TEST_F(Privileges, ASetUserIdRunAsRootPassesCheckRoot) {
    process().runSetUserId(/*real=*/1000, /*effective=*/0);

    EXPECT_TRUE(checkRoot(console));
    EXPECT_FALSE(checkNoRoot(console));
}

TEST_F(Privileges, RootWhoBecameAnotherUserIsThatUser) {
    process().runSetUserId(/*real=*/0, /*effective=*/1000);

    EXPECT_FALSE(checkRoot(console));
    EXPECT_TRUE(checkNoRoot(console));
}

}  // namespace
}  // namespace vlm
