// What is listed agrees with what openssl, pkcs11-tool and p11tool make of the same cards.

#include <gmock/gmock.h>
#include <p11-kit/uri.h>

#include <algorithm>
#include <fstream>
#include <regex>
#include <set>
#include <sstream>

#include "services/hints/tokens/token_identifier.h"
#include "tests/integration/tokens/tokens_test.h"

namespace vlm::test {
namespace {

using testing::ElementsAre;
using testing::SizeIs;
using Strings = std::set<std::string>;

std::string hexOf(const platform::Bytes& bytes) {
    std::ostringstream hex;
    for (const auto byte : bytes) hex << std::hex << (byte >> 4) << (byte & 15);
    return hex.str();
}

class AgreementTest : public TokensTest {
protected:
    std::string run(const std::vector<std::string>& command) {
        const auto result = test::run(command, {.environment = cards.environment()});
        EXPECT_EQ(result.status, 0) << testing::PrintToString(command) << result.errors;
        return result.output;
    }

    // The public-key hash of a certificate in a file, as the openssl program computes it.
    std::string hashByOpenssl(const std::string& certificateFile) {
        const std::string script = "openssl x509 -in '" + certificateFile +
                                   "' -noout -pubkey | openssl pkey -pubin -outform DER | "
                                   "openssl dgst -sha256 -r";
        return run({"sh", "-c", script}).substr(0, 64);
    }

    // The objects on a card without a login, as pkcs11-tool lists them: one text for each.
    std::vector<std::string> objectsByPkcs11Tool(const std::string& label) {
        std::istringstream output(run({"pkcs11-tool", "--module", SoftCards::modulePath(),
                                       "--token-label", label, "--list-objects"}));
        std::vector<std::string> objects;
        for (std::string line; std::getline(output, line);) {
            if (!line.empty() && line[0] != ' ') objects.emplace_back();
            if (!objects.empty()) objects.back() += line + "\n";
        }
        return objects;
    }

    static std::string fieldIn(const std::string& text, const std::string& pattern) {
        std::smatch match;
        return std::regex_search(text, match, std::regex(pattern)) ? match[1].str() : "";
    }

    // The common names in the certificates with a key beside them.
    Strings namesByPkcs11Tool(const std::string& label) {
        const auto objects = objectsByPkcs11Tool(label);
        Strings keys;
        for (const std::string& object : objects)
            if (object.starts_with("Public Key")) keys.insert(fieldIn(object, "ID: +([0-9a-f]+)"));
        Strings names;
        for (const std::string& object : objects)
            if (object.starts_with("Certificate") &&
                keys.contains(fieldIn(object, "ID: +([0-9a-f]+)")))
                names.insert(fieldIn(object, "CN=([^/\n]+)"));
        return names;
    }

    // The hashes of the certificates with a key beside them.
    Strings hashesByP11tool(const std::string& label) {
        std::istringstream output(run({"p11tool", "--provider", SoftCards::modulePath(),
                                       "--only-urls", "--list-all", "pkcs11:token=" + label}));
        Strings keys;
        std::vector<std::string> certificates;
        for (std::string url; std::getline(output, url);) {
            if (url.find("type=public") != std::string::npos)
                keys.insert(fieldIn(url, "[;:]id=([^;]+)"));
            if (url.find("type=cert") != std::string::npos) certificates.push_back(url);
        }
        Strings hashes;
        for (const std::string& url : certificates) {
            if (!keys.contains(fieldIn(url, "[;:]id=([^;]+)"))) continue;
            const std::string file = cards.folder() / "exported.pem";
            std::ofstream(file) << run(
                {"p11tool", "--provider", SoftCards::modulePath(), "--export", url});
            hashes.insert(hashByOpenssl(file));
        }
        return hashes;
    }

    Strings ourHashes(const Token& token) {
        Strings hashes;
        for (const Identity& identity : token.identities)
            hashes.insert(hexOf(identity.publicKeyHash));
        return hashes;
    }

    static Strings ourNames(const Token& token) {
        const auto names = namesOf(token.identities);
        return {names.begin(), names.end()};
    }
};

CardIdentity labelled(CardIdentity identity) {
    // Tools find an object by its label too.
    if (!identity.certificates.empty()) identity.label = identity.certificates[0].commonName;
    return identity;
}

// Each kind of identity, good and bad.
std::vector<CardIdentity> manyKinds() {
    CardIdentity expired = identity("p256", "Expired");
    expired.certificates[0].fromDay = -20;
    expired.certificates[0].untilDay = -10;
    CardIdentity certificateOnly = identity("p256", "Certificate only");
    certificateOnly.privateKey = certificateOnly.publicKey = false;
    CardIdentity keyOnly = identity("p256", "");
    keyOnly.certificates.clear();
    CardIdentity first = identity("p256", "First of one id");
    CardIdentity second = identity("p256", "Second of one id");
    first.id = second.id = "0a0b";
    std::vector<CardIdentity> all;
    for (const auto& each :
         {identity("rsa2048", "R2"), identity("rsa3072", "R3"), identity("rsa4096", "R4"),
          identity("p256", "P2"), identity("p384", "P3"), expired, certificateOnly, keyOnly, first,
          second})
        all.push_back(labelled(each));
    return all;
}

TEST_F(AgreementTest, OneCardWithAllKinds) {
    cards.add("one", manyKinds());

    const Token token = tokenCalled("one");

    EXPECT_THAT(token.identities, SizeIs(8));
    EXPECT_EQ(ourNames(token), namesByPkcs11Tool("one"));
    EXPECT_EQ(ourHashes(token), hashesByP11tool("one"));
}

TEST_F(AgreementTest, TwoCards) {
    cards.add("one", {labelled(identity("rsa2048", "Alice"))});
    cards.add("two", {labelled(identity("p256", "Bob")), labelled(identity("p384", "Carol"))});

    const auto all = list();

    ASSERT_THAT(namesOf(all), ElementsAre("one", "two"));
    for (const Token& token : all) {
        EXPECT_EQ(ourNames(token), namesByPkcs11Tool(token.name));
        EXPECT_EQ(ourHashes(token), hashesByP11tool(token.name));
    }
}

TEST_F(AgreementTest, TwoCertificatesOnOneKeyAreOneIdentity) {
    CardIdentity twice = identity("p256", "First");
    twice.certificates.push_back({.commonName = "Second", .fromDay = -3});
    cards.add("one", {labelled(twice)});

    const Token token = tokenCalled("one");

    EXPECT_THAT(token.identities, SizeIs(1));
    EXPECT_EQ(ourHashes(token), hashesByP11tool("one"));
    EXPECT_EQ(namesByPkcs11Tool("one"), (Strings{"First", "Second"}));
}

// p11tool lists nothing at so many tokens, so that pkcs11-tool has to do, one card at a time.
TEST_F(AgreementTest, FiftyCards) {
    std::vector<Card> fifty;
    for (int i = 10; i < 60; ++i) {
        const std::string number = std::to_string(i);
        fifty.push_back(
            {.label = "card" + number,
             .identities = {identity("p256", "A" + number), identity("p256", "B" + number)}});
    }
    cards.add(fifty);

    const auto all = list();

    ASSERT_THAT(all, SizeIs(50));
    for (const Token& token : all) EXPECT_EQ(ourNames(token), namesByPkcs11Tool(token.name));
}

std::string identifierByP11Kit(const service::TokenFields& fields) {
    P11KitUri* uri = p11_kit_uri_new();
    CK_TOKEN_INFO* info = p11_kit_uri_get_token_info(uri);
    const auto put = [](auto& place, const std::string& text) {
        std::ranges::fill(place, ' ');
        std::copy_n(text.begin(), std::min(text.size(), std::size(place)), place);
    };
    put(info->model, fields.model);
    put(info->manufacturerID, fields.manufacturer);
    put(info->serialNumber, fields.serial);
    put(info->label, fields.label);
    char* text = nullptr;
    EXPECT_EQ(p11_kit_uri_format(uri, P11_KIT_URI_FOR_TOKEN, &text), P11_KIT_URI_OK);
    const std::string identifier = text;
    free(text);
    p11_kit_uri_free(uri);
    return identifier;
}

TEST_F(AgreementTest, IdentifiersAreSpelledAsP11KitSpellsThem) {
    std::string printable;
    for (char c = ' '; c < 0x7F; ++c) {
        printable += c;
        const service::TokenFields each = {"a", "b", "c", std::string("x") + c + "y"};
        EXPECT_EQ(service::tokenIdentifier(each), identifierByP11Kit(each));
    }
    const std::vector<service::TokenFields> cases = {
        {"SoftHSM v2", "SoftHSM project", "0123456789abcdef", "My card"},
        {"", "", "", ""},
        {"  blanks", " in front", " and ", "  between the words  "},
        {"Modèle", "Größe AG", "שלום", "\xff\xfe not UTF-8"},
        {std::string("zero\0inside", 11), "new\nline", "tab\t", std::string(32, '%')},
    };
    for (const auto& fields : cases)
        EXPECT_EQ(service::tokenIdentifier(fields), identifierByP11Kit(fields));
}

}  // namespace
}  // namespace vlm::test
