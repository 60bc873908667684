#include "services/hints/session_cards.h"

#include <gtest/gtest.h>
#include <sys/stat.h>

#include <filesystem>

#include "tests/integration/linux/temporary_folder.h"

namespace vlm::service {
namespace {

constexpr const char* kToken = "pkcs11:model=a;token=Alice%27s";

class SessionCardsTest : public testing::Test {
protected:
    std::filesystem::path fileOf(const std::string& session) const {
        return folder.path() / "vlm" / "sessions" / session;
    }
    static mode_t modeOf(const std::filesystem::path& path) {
        struct stat status {};
        return lstat(path.c_str(), &status) == 0 ? status.st_mode & 07777U : 0;
    }

    test::TemporaryFolder folder;
    SessionCards cards{folder.path() / "vlm" / "sessions"};
};

TEST_F(SessionCardsTest, KnowWithWhichCardASessionWasLoggedIn) {
    EXPECT_EQ(cards.tokenOf("1"), std::nullopt);

    EXPECT_EQ(cards.record("1", kToken), std::nullopt);
    EXPECT_EQ(cards.record("c2", "pkcs11:token=b"), std::nullopt);

    EXPECT_EQ(cards.tokenOf("1"), kToken);
    EXPECT_EQ(cards.tokenOf("c2"), "pkcs11:token=b");
    EXPECT_EQ(cards.tokenOf("3"), std::nullopt);
}

TEST_F(SessionCardsTest, TakeTheLatestLoginOfASession) {
    cards.record("1", kToken);
    cards.record("1", "pkcs11:token=b");

    EXPECT_EQ(cards.tokenOf("1"), "pkcs11:token=b");
}

TEST_F(SessionCardsTest, AreForEverybodyToReadWhateverTheMaskIs) {
    const auto mask = umask(0077);
    cards.record("1", kToken);
    umask(mask);

    EXPECT_EQ(modeOf(fileOf("1")), 0644U);
    EXPECT_EQ(modeOf(fileOf("")), 0755U);
    EXPECT_EQ(modeOf(folder.path() / "vlm"), 0755U);
}

TEST_F(SessionCardsTest, TakeNoNameThatLeavesTheFolder) {
    const std::vector<std::string> names{
        "", ".", "..", "../1", "a/b", ".1", "1\n", "a b", std::string(65, '1')};
    for (const auto& session : names) {
        EXPECT_NE(cards.record(session, kToken), std::nullopt) << session;
        EXPECT_EQ(cards.tokenOf(session), std::nullopt) << session;
    }
    EXPECT_FALSE(std::filesystem::exists(folder.path() / "vlm" / "1"));
}

TEST_F(SessionCardsTest, TakeNothingButATokensIdentifier) {
    const std::vector<std::string> tokens{"Card", "pkcs11:a\nb", "pkcs11:a b",
                                          "pkcs11:" + std::string(3000, 'a')};
    for (const auto& token : tokens) EXPECT_NE(cards.record("1", token), std::nullopt) << token;

    cards.record("1", kToken);
    for (const auto* content : {"", "pkcs11:token=a", "Card\n", "pkcs11:a\npkcs11:b\n"}) {
        folder.write("vlm/sessions/1", content);
        EXPECT_EQ(cards.tokenOf("1"), std::nullopt) << content;
    }
}

TEST_F(SessionCardsTest, FollowNoLink) {
    cards.record("1", kToken);
    const auto elsewhere = folder.write("elsewhere", "pkcs11:token=other\n");
    std::filesystem::create_symlink(elsewhere, fileOf("2"));
    std::filesystem::create_symlink(elsewhere, fileOf(".3"));

    EXPECT_EQ(cards.tokenOf("2"), std::nullopt);
    EXPECT_EQ(cards.record("2", kToken), std::nullopt);
    EXPECT_EQ(cards.record("3", kToken), std::nullopt);

    EXPECT_EQ(cards.tokenOf("2"), kToken);
    EXPECT_EQ(cards.tokenOf("3"), kToken);
    EXPECT_EQ(std::filesystem::file_size(elsewhere), 19U) << "and is left as it was";
}

TEST_F(SessionCardsTest, ForgetTheSessionsThatAreGone) {
    cards.forgetUnless([](const std::string&) { return false; });
    cards.record("1", kToken);
    cards.record("2", kToken);

    cards.forgetUnless([](const std::string& session) { return session == "2"; });

    EXPECT_EQ(cards.tokenOf("1"), std::nullopt);
    EXPECT_EQ(cards.tokenOf("2"), kToken);
}

TEST_F(SessionCardsTest, SayWhyTheyCannotBeRecorded) {
    folder.write("vlm", "a file in the folder's place");

    EXPECT_NE(cards.record("1", kToken), std::nullopt);
}

}  // namespace
}  // namespace vlm::service
