#include "services/hints/judged_tokens.h"

#include "fake_anchors.h"
#include "fake_tokens.h"
#include "trust_fixture.h"

namespace vlm::service {
namespace {

class JudgedTokensTest : public TrustTest {
protected:
    JudgedTokensTest() {
        Token token;
        token.identifier = "pkcs11:token=a";
        token.identities = {identityFor(bob)};
        tokens.insert(token);
    }

    // The only identity's distrust, once it is listed.
    std::optional<std::string> listed() const {
        if (!_listed) return std::nullopt;
        return _listed->at(0).identities.at(0).distrust;
    }
    void list() {
        _listed.reset();
        judged.list([this](std::vector<Token> all) {
            EXPECT_FALSE(_listed) << "a listing is answered once";
            _listed = std::move(all);
        });
    }

    const CertifiedKey bob = CertifiedKey::selfSigned({"Bob"});
    bool isTrustChecked = true;
    fakes::FakeTokens tokens;
    fakes::FakeAnchors anchors;
    JudgedTokens judged{
        {tokens, anchors, trust, [this] { return isTrustChecked; }, [] { return kToday; }}};

private:
    std::optional<std::vector<Token>> _listed;
};

TEST_F(JudgedTokensTest, ReadsNothingWhereTrustIsNotChecked) {
    isTrustChecked = false;

    list();
    tokens.settle();

    EXPECT_EQ(listed(), "");
    EXPECT_EQ(anchors.readings, 0);
}

TEST_F(JudgedTokensTest, WaitsForCardsAndAnchorsInEitherOrder) {
    list();
    tokens.settle();
    EXPECT_EQ(listed(), std::nullopt);
    anchors.settle();
    EXPECT_EQ(listed(), "it is self-signed, and no anchor of this machine");

    anchors.anchors.trusted = {bob.der()};
    list();
    anchors.settle();
    EXPECT_EQ(listed(), std::nullopt);
    tokens.settle();
    EXPECT_EQ(listed(), "");
}

TEST_F(JudgedTokensTest, ObeysTheSettingAsItIsNow) {
    list();
    tokens.settle();
    anchors.settle();
    ASSERT_NE(listed(), "");

    isTrustChecked = false;
    list();
    tokens.settle();

    EXPECT_EQ(listed(), "");
}

}  // namespace
}  // namespace vlm::service
