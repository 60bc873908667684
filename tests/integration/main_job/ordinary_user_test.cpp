// What somebody without privileges can do from the shell, and what not.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include "machine.h"

namespace vlm::test {

using ::testing::HasSubstr;
using ::testing::Not;

namespace {

constexpr uid_t kOrdinaryUser = 65534;

class OrdinaryUser : public ::testing::Test {
protected:
    void SetUp() override {
        if (getuid() != 0) GTEST_SKIP() << "only root can run the tool as another user";
        if (!run({"true"}, {{}, kOrdinaryUser}).status)
            GTEST_SKIP() << "this machine knows no second user id";
        machine.cards.add("Card", {identity("p256", "Alice Example")});
        machine.startService();
        const auto listing = machine.vlmbind({"-i"}).output;
        ASSERT_NE(listing.find('\t'), std::string::npos) << listing;
        hash = listing.substr(listing.find('\t') - 64, 64);
    }

    Ended vlmbind(std::vector<std::string> arguments) {
        return machine.vlmbind(std::move(arguments), kOrdinaryUser);
    }

    Machine machine;
    std::string hash;
};

TEST_F(OrdinaryUser, ListsWithoutPrivileges) {
    const auto listing = vlmbind({"-i"});

    EXPECT_EQ(listing.status, 0) << listing.errors;
    EXPECT_THAT(listing.output, HasSubstr("\tAlice Example\n"));
}

TEST_F(OrdinaryUser, IsNotToldWhomACardIsPairedWith) {
    ASSERT_EQ(machine.vlmbind({"-p", "-u", "root", "-h", hash}).status, 0);

    const auto listing = vlmbind({"-i"}).output;

    EXPECT_THAT(listing, HasSubstr("Paired identities which are not used for authentication:\n" +
                                   hash + "\tanother account - Alice Example\n"));
    EXPECT_THAT(listing, Not(HasSubstr("root")));
}

TEST_F(OrdinaryUser, CannotPair) {
    const auto refused = vlmbind({"-p", "-u", "nobody", "-h", hash});

    EXPECT_EQ(refused.status, 255);
    EXPECT_EQ(refused.output, "This operation requires root privileges.\n");
}

TEST_F(OrdinaryUser, CannotUnpairAndIsToldWhoCan) {
    ASSERT_EQ(machine.vlmbind({"-p", "-u", "nobody", "-h", hash}).status, 0);

    const auto refused = vlmbind({"-r", "-u", "nobody", "-h", hash});

    EXPECT_EQ(refused.status, 255);
    EXPECT_THAT(refused.output, HasSubstr("Cannot unpair user (public key hash: " + hash + "). "));
    EXPECT_THAT(refused.output, HasSubstr("an administrator has to allow this"));
    EXPECT_THAT(machine.vlmbind({"-i"}).output, HasSubstr("nobody - Alice Example"));
}

}  // namespace

}  // namespace vlm::test
