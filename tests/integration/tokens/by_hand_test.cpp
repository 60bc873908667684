// The stored form by other means: what is wrapped here is opened with pkcs11-tool and openssl
// alone, and what is made with these is opened here.

#include <gmock/gmock.h>

#include <algorithm>
#include <fstream>
#include <iterator>
#include <ostream>

#include "services/keychain/unlock_key_wrapping.h"
#include "tests/integration/tokens/tokens_test.h"

namespace vlm::test {
namespace {

using service::WrapScheme;

const std::string kPassword = "pass word \xC3\xA9\xFF";

struct Row {
    const char* key;
    WrapScheme scheme;
};
void PrintTo(const Row& row, std::ostream* stream) {
    *stream << row.key << (row.scheme == WrapScheme::RsaPkcs1 ? ", PKCS#1 v1.5" : "");
}

std::string hex(const platform::Bytes& bytes) {
    constexpr char kDigits[] = "0123456789abcdef";
    std::string text;
    for (const std::uint8_t byte : bytes) text += {kDigits[byte >> 4U], kDigits[byte & 15U]};
    return text;
}

// The commands of the document, as they stand there.
std::string commandsIn(const std::string& document) {
    std::ifstream file(document);
    const std::string text{std::istreambuf_iterator(file), {}};
    const std::string begin = "```sh\n";
    const auto from = text.find(begin);
    const auto to = text.find("```\n", from + begin.size());
    if (from == std::string::npos || to == std::string::npos) return {};
    return text.substr(from + begin.size(), to - from - begin.size());
}

class ByHandTest : public TokensTest, public testing::WithParamInterface<Row> {
protected:
    ByHandTest() {
        cards.add("card", {identity(GetParam().key, "Alice")});
        token = tokenCalled("card");
        purpose = {"alice", platform::Bytes(32, 7), token.identities[0].publicKeyHash};
    }

    std::string fileWith(const std::string& name, const platform::Bytes& content) {
        const std::string path = cards.folder() / name;
        std::ofstream(path, std::ios::binary)
            .write(reinterpret_cast<const char*>(content.data()),
                   static_cast<std::streamsize>(content.size()));
        return path;
    }
    std::string wrappedHere() {
        const auto form =
            service::wrapUnlockKey(service::Secret(kPassword), purpose,
                                   token.identities[0].publicKeyInfo, GetParam().scheme);
        return form ? fileWith("form", *form) : std::string();
    }

    Child::Environment environment() const {
        auto environment = cards.environment();
        environment["PIN"] = SoftCards::kPin;
        return environment;
    }
    Ended byHand(std::vector<std::string> arguments, const std::string& input = {}) {
        arguments.insert(arguments.begin(), VLM_BY_HAND);
        return run(arguments, {.environment = environment()}, input);
    }

    std::optional<std::string> openedHere(const platform::Bytes& form) {
        service::ProofRequest request;
        request.tokenIdentifier = token.identifier;
        request.publicKeyHash = token.identities[0].publicKeyHash;
        request.challenge = platform::Bytes(32, 0x5A);
        request.pin = service::Secret(SoftCards::kPin);
        request.open = service::cardTask(form, purpose.wrapKeyHash);
        const auto proof = proveWith(std::move(request));
        const auto unlockKey =
            proof.opened ? service::unwrapUnlockKey(form, *proof.opened, purpose) : std::nullopt;
        if (!unlockKey) return {};
        return std::string(unlockKey->text());
    }

    Token token;
    service::UnlockKeyPurpose purpose;
};

TEST_P(ByHandTest, OpensWhatWasWrappedHere) {
    const auto result = byHand({"open", wrappedHere(), purpose.account, hex(purpose.publicKeyHash),
                                hex(purpose.wrapKeyHash), SoftCards::modulePath(), "card", "0001"});

    EXPECT_EQ(result.status, 0) << result.errors;
    EXPECT_EQ(result.output, kPassword);
}

TEST_P(ByHandTest, OpensNothingForAnotherAccount) {
    const auto result = byHand({"open", wrappedHere(), "bob", hex(purpose.publicKeyHash),
                                hex(purpose.wrapKeyHash), SoftCards::modulePath(), "card", "0001"});

    EXPECT_THAT(result.errors, testing::HasSubstr("assert tag == tag_of"));
    EXPECT_EQ(result.output, "");
}

// The software module has no OAEP with SHA-256; the one in front of it has.
TEST_P(ByHandTest, OpensWithTheCommandsOfTheDocument) {
    const bool needsOaep = GetParam().scheme == WrapScheme::RsaOaepSha256;
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
    if (needsOaep) GTEST_SKIP() << "pkcs11-tool cannot load a module that a sanitizer watches";
#endif
    auto variables = environment();
    variables["FORM"] = wrappedHere();
    variables["MODULE"] =
        needsOaep ? VLM_TEST_MODULES "/opening_module.so" : SoftCards::modulePath();
    variables["VLM_TEST_OPENING"] = "all";
    variables["TOKEN"] = "card";
    variables["ID"] = "0001";
    const std::string prologue = "set -euo pipefail; cd " + cards.folder().string() + "\n";

    const auto result =
        run({"bash", "-c", prologue + commandsIn(VLM_DOCUMENT)}, {.environment = variables});

    EXPECT_EQ(result.status, 0) << result.errors;
    EXPECT_EQ(result.output, kPassword);
}

TEST_P(ByHandTest, MakesWhatIsOpenedHere) {
    const auto key = fileWith("key", token.identities[0].publicKeyInfo);

    const auto result =
        byHand({"make", std::to_string(static_cast<int>(GetParam().scheme)), key, purpose.account,
                hex(purpose.publicKeyHash), hex(purpose.wrapKeyHash)},
               kPassword);

    EXPECT_EQ(result.status, 0) << result.errors;
    const platform::Bytes form(result.output.begin(), result.output.end());
    EXPECT_EQ(openedHere(form), kPassword);
}

INSTANTIATE_TEST_SUITE_P(All, ByHandTest,
                         testing::Values(Row{"rsa2048", WrapScheme::RsaOaepSha256},
                                         Row{"rsa4096", WrapScheme::RsaOaepSha256},
                                         Row{"rsa2048", WrapScheme::RsaPkcs1},
                                         Row{"p256", WrapScheme::Ecdh},
                                         Row{"p384", WrapScheme::Ecdh},
                                         Row{"p521", WrapScheme::Ecdh}));

}  // namespace
}  // namespace vlm::test
