#include "trust_fixture.h"

namespace vlm::service {
namespace {

using ::testing::HasSubstr;
using ::testing::StartsWith;

class RevocationTest : public TrustTest {
protected:
    RevocationTest() { trustRoot(); }

    void publish(const CertifiedKey& by, const test::ListRequest& request,
                 const std::string& name = "list.crl") {
        put("revoked/" + name, test::asText(by.revoke(request)));
    }
    std::string whyNotAlice(std::int64_t now = kToday) {
        return whyNot(alice, {issuer.der()}, now);
    }
};

TEST_F(RevocationTest, RefusesARevokedCertificateAndNoOther) {
    publish(issuer, {.revoked = {alice.der()}});

    EXPECT_EQ(whyNotAlice(), "it has been revoked");
    EXPECT_EQ(whyNot(issuer.issue({"Bob"}), {issuer.der()}), "");
}

TEST_F(RevocationTest, RefusesWhatARevokedIssuerIssued) {
    publish(root, {.revoked = {issuer.der()}});

    EXPECT_EQ(whyNotAlice(), "the certificate of an issuer has been revoked");
}

TEST_F(RevocationTest, AsksNoIssuerForAListThatItDoesNotPublish) {
    publish(CertifiedKey::selfSigned(issuerCalled("Somebody else")), {});

    EXPECT_EQ(whyNotAlice(), "");
}

TEST_F(RevocationTest, RefusesEverythingOfAnIssuerWhoseListIsTooOld) {
    publish(issuer, {});
    EXPECT_EQ(whyNotAlice(), "");

    EXPECT_EQ(whyNotAlice(kToday + 2 * kDay), "the revocation list of its issuer is too old");
}

TEST_F(RevocationTest, TakesTheListThatIsInItsDates) {
    publish(issuer, {.from = kToday - 9 * kDay, .until = kToday - 8 * kDay}, "old.crl");
    publish(issuer, {.revoked = {alice.der()}}, "new.crl");

    EXPECT_EQ(whyNotAlice(), "it has been revoked");
}

TEST_F(RevocationTest, BelievesNoListThatTheIssuerDidNotSign) {
    const auto impostor = CertifiedKey::selfSigned(issuerCalled("Issuer"));
    publish(impostor, {});

    EXPECT_EQ(whyNotAlice(), "the revocation list of its issuer cannot be relied on");
}

TEST_F(RevocationTest, LetsAnAnchorCountWhateverItsOwnIssuerRevokes) {
    std::filesystem::remove(folder.path() / "anchors/root.pem");
    put("anchors/issuer.pem", test::pem(issuer.der()));
    publish(root, {.revoked = {issuer.der()}});

    EXPECT_EQ(whyNot(alice), "");
}

TEST_F(RevocationTest, RefusesEverythingWhileAListCannotBeRead) {
    publish(CertifiedKey::selfSigned(issuerCalled("Somebody else")), {});
    ASSERT_EQ(whyNotAlice(), "");

    put("revoked/broken.crl", "not a list");

    EXPECT_THAT(whyNotAlice(), StartsWith("whether it is revoked cannot be told: "));
    EXPECT_THAT(whyNotAlice(), HasSubstr("broken.crl"));
}

}  // namespace
}  // namespace vlm::service
