// What a card, or a folder with ten thousand files, may do to the daemon: no more than take a
// bounded time.

#include <chrono>
#include <random>

#include "trust_fixture.h"

namespace vlm::service {
namespace {

using std::chrono::steady_clock;

class HostileTrustTest : public TrustTest {
protected:
    HostileTrustTest() { trustRoot(); }

    // Generous, since sanitizers are slow; what it keeps out is work that grows with the square.
    template <typename Work>
    static void inTime(Work work) {
        const auto begin = steady_clock::now();
        work();
        EXPECT_LT(steady_clock::now() - begin, std::chrono::seconds(10));
    }
};

TEST_F(HostileTrustTest, GivesUpAPathThatIsTooLong) {
    std::vector<Bytes> others;
    auto last = issuer;
    for (int i = 0; i < 30; ++i) {
        others.push_back(last.der());
        last = last.issue(issuerCalled("Issuer " + std::to_string(i)));
    }
    others.push_back(last.der());

    inTime([&] {
        EXPECT_EQ(whyNot(last.issue({"Bob"}), others),
                  "no path leads from it to an issuer that this machine trusts");
    });
}

TEST_F(HostileTrustTest, LeavesACircleOfIssuers) {
    const auto one = CertifiedKey::selfSigned(issuerCalled("One"));
    const auto two = CertifiedKey::selfSigned(issuerCalled("Two"));
    const auto oneByTwo = two.certifyAgain(one, issuerCalled("One"));
    const auto twoByOne = one.certifyAgain(two, issuerCalled("Two"));

    inTime([&] {
        EXPECT_EQ(whyNot(oneByTwo.issue({"Bob"}), {oneByTwo.der(), twoByOne.der()}),
                  "no path leads from it to an issuer that this machine trusts");
    });
}

TEST_F(HostileTrustTest, FindsTheWayAmongManyIssuersOfOneName) {
    std::vector<Bytes> others;
    for (int i = 0; i < 31; ++i)
        others.push_back(CertifiedKey::selfSigned(issuerCalled("Issuer")).der());
    others.push_back(issuer.der());

    inTime([&] { whyNot(alice, others); });
}

TEST_F(HostileTrustTest, JudgesACardThatIsFull) {
    Token token;
    token.identities.assign(4096, identityFor(alice));
    for (auto& identity : token.identities)
        identity.publicKeyHash[0] = static_cast<std::uint8_t>(&identity - token.identities.data());
    token.otherCertificates.assign(31, Bytes(std::size_t{16} << 10U, 1));
    token.otherCertificates.push_back(issuer.der());
    std::vector<Token> tokens{token};

    inTime([&] { trust.judge(tokens, machine, kToday); });
    inTime([&] { trust.judge(tokens, machine, kToday); });
}

TEST_F(HostileTrustTest, LooksUpATenThousandthList) {
    for (int i = 0; i < 100; ++i) {
        const auto other = CertifiedKey::selfSigned(issuerCalled("Other " + std::to_string(i)));
        const auto list = test::pem(other.revoke({}), "X509 CRL");
        std::string lists;
        for (int k = 0; k < 100; ++k) lists += list;
        put("revoked/" + std::to_string(i) + ".crl", lists);
    }
    put("revoked/issuer.crl", test::asText(issuer.revoke({.revoked = {alice.der()}})));

    inTime([&] { EXPECT_EQ(whyNot(alice, {issuer.der()}), "it has been revoked"); });
    inTime([&] { EXPECT_EQ(whyNot(issuer.issue({"Bob"}), {issuer.der()}), ""); });
}

TEST_F(HostileTrustTest, TakesAnyBytesForNoCertificate) {
    std::mt19937 random(1);
    for (int i = 0; i < 2000; ++i) {
        auto identity = identityFor(alice);
        auto other = issuer.der();
        identity.certificate[random() % identity.certificate.size()] =
            static_cast<std::uint8_t>(random());
        other[random() % other.size()] = static_cast<std::uint8_t>(random());
        whyNot(identity, {other});
    }
    EXPECT_EQ(whyNot(alice, {issuer.der()}), "") << "and is none the worse for it";
}

TEST_F(HostileTrustTest, TakesAChangedCertificateForNoTrustedOne) {
    for (std::size_t at = 0; at < alice.der().size(); ++at) {
        auto identity = identityFor(alice);
        identity.certificate[at] ^= 1U;
        EXPECT_NE(whyNot(identity, {issuer.der()}), "") << "with byte " << at << " changed";
    }
}

}  // namespace
}  // namespace vlm::service
