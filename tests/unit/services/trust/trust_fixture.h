// A folder of trust with a root in it, issuers below that, and judgements on what they certify.

#pragma once

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <filesystem>
#include <string>
#include <vector>

#include "platform_test.h"
#include "services/hints/certificate_trust.h"
#include "tests/integration/linux/temporary_folder.h"
#include "tests/tools/certificates/certificate_maker.h"

namespace vlm::service {

using test::CertificateRequest;
using test::CertifiedKey;
using test::issuerCalled;
using test::kDay;
using test::kToday;

class TrustTest : public fakes::PlatformTest {
protected:
    // Files that only this user may write, whatever the mask is.
    std::filesystem::path put(const std::string& name, const std::string& content) {
        auto path = folder.write(name, content);
        std::filesystem::permissions(path, std::filesystem::perms(0644));
        std::filesystem::permissions(path.parent_path(), std::filesystem::perms(0755));
        return path;
    }
    void trustRoot() { put("anchors/root.pem", test::pem(root.der())); }

    static Identity identityFor(const CertifiedKey& key) {
        Identity identity;
        identity.publicKeyHash = key.publicKeyHash();
        identity.name = "Alice";
        identity.notBefore = kToday - 100 * kDay;
        identity.notAfter = kToday + 100 * kDay;
        identity.canSign = true;
        identity.certificate = key.der();
        return identity;
    }

    // Why the key's certificate is not trusted, on a card with these others; empty when it is.
    std::string whyNot(const CertifiedKey& key, std::vector<Bytes> others = {},
                       std::int64_t now = kToday) {
        return whyNot(identityFor(key), std::move(others), now);
    }
    std::string whyNot(Identity identity, std::vector<Bytes> others = {},
                       std::int64_t now = kToday) {
        Token token;
        token.identities = {std::move(identity)};
        token.otherCertificates = std::move(others);
        std::vector<Token> tokens{std::move(token)};
        trust.judge(tokens, machine, now);
        return tokens[0].identities[0].distrust;
    }

    test::TemporaryFolder folder;
    MachineAnchors machine;
    CertificateTrust trust{TrustFolder(folder.path(), geteuid())};

    const CertifiedKey root = CertifiedKey::selfSigned(issuerCalled("Root"));
    const CertifiedKey issuer = root.issue(issuerCalled("Issuer"));
    const CertifiedKey alice = issuer.issue({"Alice"});
};

}  // namespace vlm::service
