#include "services/hints/certificate_trust.h"

#include "services/hints/status.h"
#include "trust_fixture.h"

namespace vlm::service {
namespace {

using ::testing::HasSubstr;

constexpr const char* kNoPath = "no path leads from it to an issuer that this machine trusts";

class CertificateTrustTest : public TrustTest {};

TEST_F(CertificateTrustTest, FollowsThePathOverTheIssuersOnTheCard) {
    trustRoot();

    EXPECT_EQ(whyNot(alice, {issuer.der()}), "");
    EXPECT_EQ(whyNot(alice), kNoPath);
}

TEST_F(CertificateTrustTest, FollowsThePathOverTheMachinesIntermediates) {
    trustRoot();
    put("intermediates/issuer.der", test::asText(issuer.der()));

    EXPECT_EQ(whyNot(alice), "");
}

TEST_F(CertificateTrustTest, TakesAnAnchorThatSomebodyElseIssued) {
    put("anchors/issuer.pem", test::pem(issuer.der()));

    EXPECT_EQ(whyNot(alice), "");
}

TEST_F(CertificateTrustTest, TakesTheMachinesOwnAnchors) {
    EXPECT_EQ(whyNot(alice, {issuer.der()}), kNoPath);

    machine.trusted = {root.der()};

    EXPECT_EQ(whyNot(alice, {issuer.der()}), "");
}

TEST_F(CertificateTrustTest, TakesNoIssuerOnTheCardForAnAnchor) {
    EXPECT_EQ(whyNot(alice, {issuer.der(), root.der()}), kNoPath);
}

TEST_F(CertificateTrustTest, RefusesWhatTheMachineDistrusts) {
    trustRoot();
    machine.distrusted = {issuer.der()};
    EXPECT_EQ(whyNot(alice, {issuer.der()}), "this machine distrusts an issuer of it");

    machine.distrusted = {alice.der()};
    EXPECT_EQ(whyNot(alice, {issuer.der()}), "this machine distrusts it");
}

TEST_F(CertificateTrustTest, RefusesASelfSignedCertificateThatIsNoAnchor) {
    const auto bob = CertifiedKey::selfSigned({"Bob"});
    trustRoot();
    EXPECT_EQ(whyNot(bob), "it is self-signed, and no anchor of this machine");

    put("anchors/bob.pem", test::pem(bob.der()));
    EXPECT_EQ(whyNot(bob), "");
}

TEST_F(CertificateTrustTest, GoesByTheDatesOfTheWholePath) {
    trustRoot();
    auto late = issuerCalled("Late");
    late.from = kToday + kDay;
    auto past = issuerCalled("Past");
    past.until = kToday - kDay;
    const auto lateIssuer = root.issue(late);
    const auto pastIssuer = root.issue(past);

    EXPECT_EQ(whyNot(alice, {issuer.der()}, kToday + 101 * kDay), "it has expired");
    EXPECT_EQ(whyNot(alice, {issuer.der()}, kToday - 101 * kDay), "it is not yet valid");
    EXPECT_EQ(whyNot(pastIssuer.issue({"Bob"}), {pastIssuer.der()}),
              "the certificate of an issuer has expired");
    EXPECT_EQ(whyNot(lateIssuer.issue({"Bob"}), {lateIssuer.der()}),
              "the certificate of an issuer is not yet valid");
}

TEST_F(CertificateTrustTest, JudgesAnewWhenADateIsOver) {
    trustRoot();
    ASSERT_EQ(whyNot(alice, {issuer.der()}), "");

    EXPECT_EQ(whyNot(alice, {issuer.der()}, kToday + 101 * kDay), "it has expired");
    EXPECT_EQ(whyNot(alice, {issuer.der()}), "") << "the clock was set right again";
}

TEST_F(CertificateTrustTest, JudgesAnewWhenTheFilesChange) {
    ASSERT_EQ(whyNot(alice, {issuer.der()}), kNoPath);

    trustRoot();
    EXPECT_EQ(whyNot(alice, {issuer.der()}), "");

    std::filesystem::remove(folder.path() / "anchors/root.pem");
    EXPECT_EQ(whyNot(alice, {issuer.der()}), kNoPath);
}

TEST_F(CertificateTrustTest, WantsACertificateThatIsMeantForSigningIn) {
    trustRoot();
    struct Case {
        const char* why;
        const char* keyUsage;
        const char* extendedKeyUsage;
        const char* refusal;
    };
    constexpr const char* kRefusal = "it is not meant for signing in";
    const Case cases[] = {
        {"nothing said", "", "", ""},
        {"may sign", "critical,digitalSignature", "", ""},
        {"may only encrypt", "critical,keyEncipherment", "", kRefusal},
        {"may only sign contracts", "critical,nonRepudiation", "", kRefusal},
        {"for clients", "", "clientAuth", ""},
        {"for smart-card logons", "", "1.3.6.1.4.1.311.20.2.2", ""},
        {"for anything", "", "anyExtendedKeyUsage", ""},
        {"for mail and clients", "", "emailProtection,clientAuth", ""},
        {"for mail only", "", "emailProtection", kRefusal},
        {"for servers only", "", "critical,serverAuth", kRefusal},
    };
    for (const auto& each : cases) {
        CertificateRequest request{"Bob"};
        request.keyUsage = each.keyUsage;
        request.extendedKeyUsage = each.extendedKeyUsage;
        EXPECT_EQ(whyNot(issuer.issue(request), {issuer.der()}), each.refusal) << each.why;
    }
}

TEST_F(CertificateTrustTest, WantsIssuersThatMayIssue) {
    trustRoot();
    const auto noIssuer = root.issue({"Carol"});
    auto forServers = issuerCalled("Servers");
    forServers.extendedKeyUsage = "serverAuth";
    const auto serverIssuer = root.issue(forServers);
    auto last = issuerCalled("Last");
    last.basicConstraints = "critical,CA:TRUE,pathlen:0";
    const auto lastIssuer = root.issue(last);
    const auto oneTooMany = lastIssuer.issue(issuerCalled("One too many"));

    constexpr const char* kNoRight = "an issuer on its path had no right to issue it";
    EXPECT_EQ(whyNot(noIssuer.issue({"Bob"}), {noIssuer.der()}), kNoRight);
    EXPECT_EQ(whyNot(oneTooMany.issue({"Bob"}), {oneTooMany.der(), lastIssuer.der()}), kNoRight);
    EXPECT_EQ(whyNot(serverIssuer.issue({"Bob"}), {serverIssuer.der()}),
              "its issuer may not issue certificates for signing in");
}

TEST_F(CertificateTrustTest, WantsStrongKeysAndSignatures) {
    trustRoot();
    CertificateRequest request{"Bob"};

    EXPECT_EQ(whyNot(issuer.issue(request, "rsa1024"), {issuer.der()}),
              "its key or signature is too weak");
    request.withSha1 = true;
    EXPECT_EQ(whyNot(issuer.issue(request), {issuer.der()}), "its key or signature is too weak");
}

TEST_F(CertificateTrustTest, BelievesNoIssuerThatOnlyHasTheName) {
    trustRoot();
    const auto impostor = CertifiedKey::selfSigned(issuerCalled("Root"));
    const auto forged = impostor.issue({"Bob"});

    EXPECT_EQ(whyNot(forged), "its issuer did not sign it");
}

TEST_F(CertificateTrustTest, WantsTheCertificateOfTheCardsKey) {
    trustRoot();
    auto swapped = identityFor(issuer.issue({"Bob"}));
    swapped.certificate = alice.der();
    auto untold = identityFor(alice);
    untold.certificate.clear();

    EXPECT_EQ(whyNot(swapped, {issuer.der()}), "it is for another key than the card's");
    EXPECT_EQ(whyNot(untold, {issuer.der()}), "it is too large, or cannot be read");
}

TEST(WhyNotTrusted, RefusesALoginByDatesAndByDistrust) {
    Identity identity;
    identity.name = "Alice";
    identity.notBefore = 10;
    identity.notAfter = 20;

    EXPECT_EQ(whyNotTrusted(identity, 10), std::nullopt);
    EXPECT_EQ(whyNotTrusted(identity, 20), std::nullopt);
    EXPECT_THAT(whyNotTrusted(identity, 9)->text, HasSubstr("it is not yet valid"));
    EXPECT_THAT(whyNotTrusted(identity, 21)->text, HasSubstr("it has expired"));

    identity.distrust = "it has been revoked";
    const auto refusal = whyNotTrusted(identity, 15);
    ASSERT_TRUE(refusal);
    EXPECT_EQ(refusal->status, status::kCertificateRefused);
    EXPECT_EQ(refusal->text,
              "The certificate \"Alice\" is not good for a login: it has been revoked.");
}

}  // namespace
}  // namespace vlm::service
