#include "services/hints/trust_folder.h"

#include <sys/stat.h>

#include <chrono>

#include "trust_fixture.h"

namespace vlm::service {
namespace {

using ::testing::Contains;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::SizeIs;

class TrustFolderTest : public TrustTest {
protected:
    std::vector<std::string> complaints() { return log().texts(platform::LogLevel::Error); }

    TrustFolder trusted{folder.path(), geteuid()};
};

TEST_F(TrustFolderTest, ReadsAnyNumberInPemAndOneInDer) {
    put("anchors/two.pem", "A comment\n" + test::pem(root.der()) + test::pem(issuer.der()));
    put("anchors/one.der", test::asText(alice.der()));
    put("intermediates/one.pem", test::pem(issuer.der()));
    put("revoked/one.pem", test::pem(issuer.revoke({}), "X509 CRL"));

    ASSERT_TRUE(trusted.refresh());

    EXPECT_THAT(trusted.files().anchors, SizeIs(3));
    EXPECT_THAT(trusted.files().intermediates, SizeIs(1));
    EXPECT_THAT(trusted.files().lists, SizeIs(1));
    EXPECT_EQ(trusted.files().unusableList, "");
    EXPECT_THAT(complaints(), IsEmpty());
}

TEST_F(TrustFolderTest, IsEmptyAndContentWhereThereIsNone) {
    TrustFolder none(folder.path() / "none", geteuid());

    EXPECT_TRUE(none.refresh());
    EXPECT_FALSE(none.refresh());

    EXPECT_THAT(none.files().anchors, IsEmpty());
    EXPECT_THAT(complaints(), IsEmpty());
}

TEST_F(TrustFolderTest, ReadsAgainOnlyAfterAChange) {
    const auto file = put("anchors/root.pem", test::pem(root.der()));
    // Files that have just been made may still change without a trace.
    const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(5);
    while (trusted.refresh()) ASSERT_LT(std::chrono::steady_clock::now(), end);

    EXPECT_FALSE(trusted.refresh());
    put("anchors/root.pem", test::pem(issuer.der()));
    EXPECT_TRUE(trusted.refresh());
    std::filesystem::remove(file);
    EXPECT_TRUE(trusted.refresh());
    EXPECT_THAT(trusted.files().anchors, IsEmpty());
}

TEST_F(TrustFolderTest, CountsNoFileThatOthersMayWrite) {
    const auto file = put("anchors/root.pem", test::pem(root.der()));
    put("anchors/issuer.pem", test::pem(issuer.der()));
    chmod(file.c_str(), 0664);

    trusted.refresh();

    EXPECT_THAT(trusted.files().anchors, SizeIs(1));
    EXPECT_THAT(complaints(), SizeIs(1));
    EXPECT_THAT(complaints(), Contains(HasSubstr("root.pem does not count: not only the user")));
}

TEST_F(TrustFolderTest, CountsNothingOfAFolderThatOthersMayWrite) {
    put("anchors/root.pem", test::pem(root.der()));
    chmod((folder.path() / "anchors").c_str(), 0777);
    trusted.refresh();
    EXPECT_THAT(trusted.files().anchors, IsEmpty());
    EXPECT_EQ(trusted.files().unusableList, "") << "no list is concerned";

    chmod((folder.path() / "anchors").c_str(), 0755);
    chmod(folder.path().c_str(), 0777);
    trusted.refresh();
    EXPECT_THAT(trusted.files().anchors, IsEmpty());
    EXPECT_NE(trusted.files().unusableList, "") << "the lists may have been taken away";
}

TEST_F(TrustFolderTest, CountsNothingOfAnotherOwner) {
    put("anchors/root.pem", test::pem(root.der()));
    TrustFolder ofAnother(folder.path(), geteuid() + 1);

    ofAnother.refresh();

    EXPECT_THAT(ofAnother.files().anchors, IsEmpty());
    EXPECT_THAT(complaints(), SizeIs(1));
}

TEST_F(TrustFolderTest, FollowsNoLinkAndWaitsForNoPipe) {
    const auto file = put("elsewhere.pem", test::pem(root.der()));
    put("anchors/issuer.pem", test::pem(issuer.der()));
    std::filesystem::create_symlink(file, folder.path() / "anchors/link.pem");
    mkfifo((folder.path() / "anchors/pipe").c_str(), 0644);

    trusted.refresh();

    EXPECT_THAT(trusted.files().anchors, SizeIs(1));
    EXPECT_THAT(complaints(), Contains(HasSubstr("link.pem does not count: it is a symbolic")));
    EXPECT_THAT(complaints(), Contains(HasSubstr("pipe does not count: it is not of the right")));
}

TEST_F(TrustFolderTest, PassesOverHiddenFilesAndComplainsOfBrokenOnes) {
    put("anchors/.hidden", "anything");
    put("anchors/broken.pem", test::pem(root.der()).substr(0, 200));
    put("anchors/key.pem", test::pem(root.der(), "PRIVATE KEY"));
    put("anchors/trailing.der", test::asText(root.der()) + "x");

    trusted.refresh();

    EXPECT_THAT(trusted.files().anchors, IsEmpty());
    EXPECT_THAT(complaints(), SizeIs(3));
    EXPECT_THAT(complaints(), Contains(HasSubstr("broken.pem holds something else")));
}

}  // namespace
}  // namespace vlm::service
