// Workers that break their word in an opening: the proof that was made before stays.

#include <gmock/gmock.h>

#include <fstream>
#include <ostream>

#include "services/hints/tokens/frames.h"
#include "services/hints/tokens/worker_protocol.h"
#include "tests/integration/tokens/tokens_test.h"

namespace vlm::test {
namespace {

using Outcome = Proof::Outcome;
using platform::Bytes;
using testing::HasSubstr;
using testing::IsEmpty;

Bytes frame(const Bytes& content) {
    Bytes whole;
    for (const unsigned shift : {0U, 8U, 16U, 24U})
        whole.push_back(static_cast<std::uint8_t>(content.size() >> shift));
    whole.insert(whole.end(), content.begin(), content.end());
    return whole;
}

template <typename Answer>
Bytes frameOf(const Answer& answer) {
    return frame(*service::encodeAnswer(answer));
}

Bytes operator+(Bytes one, const Bytes& other) {
    one.insert(one.end(), other.begin(), other.end());
    return one;
}

const Proof kSigned{Outcome::Signed, Bytes{1, 2, 3}, PinState::Ready, {}};
const service::OpeningAnswer kOpens{""};
const service::OpeningAnswer kFailed{"because"};

struct Answers {
    const char* why;
    Bytes afterProof;
    const char* expected;  // why nothing was opened
};
void PrintTo(const Answers& answers, std::ostream* stream) { *stream << answers.why; }

class BadOpenersTest : public TokensTest, public testing::WithParamInterface<Answers> {
protected:
    BadOpenersTest() { token.identifier = "pkcs11:token=a"; }

    // A worker that tells of the token, and says this when it is asked for a proof.
    void answerWith(const Bytes& answers) {
        put("listing", frameOf(service::ListAnswer{std::vector{token}, {}, false}));
        put("answers", answers);
        const auto asked = frame(*service::encodeListRequest()).size();
        useWorkerScript("head -c " + std::to_string(asked) + " <&3 >/dev/null; cat '" +
                        path("listing") + "' >&3; head -c 1 <&3 >/dev/null; cat '" +
                        path("answers") + "' >&3; exec sleep 60");
    }

    Proof prove(bool opens) {
        service::ProofRequest request;
        request.tokenIdentifier = token.identifier;
        request.publicKeyHash = Bytes(32, 1);
        if (opens) request.open = service::OpenRequest{Bytes(32, 1), service::WrapScheme::Ecdh, {}};
        return proveWith(std::move(request));
    }

    Token token;

private:
    std::string path(const std::string& name) const { return cards.folder() / name; }
    void put(const std::string& name, const Bytes& content) {
        std::ofstream(path(name), std::ios::binary)
            .write(reinterpret_cast<const char*>(content.data()),
                   static_cast<std::streamsize>(content.size()));
    }
};

TEST_F(BadOpenersTest, AreTakenAtTheirWordWhenTheyKeepIt) {
    answerWith(frameOf(kSigned) + frameOf(kOpens) + frame({'k', 'e', 'y'}));

    const Proof proof = prove(/*opens=*/true);

    EXPECT_EQ(proof.outcome, Outcome::Signed);
    ASSERT_TRUE(proof.opened);
    EXPECT_EQ(proof.opened->text(), "key");
}

TEST_F(BadOpenersTest, MaySayWhyTheyOpenedNothing) {
    answerWith(frameOf(kSigned) + frameOf(kFailed) + frame({}));

    const Proof proof = prove(/*opens=*/true);

    EXPECT_EQ(proof.signature, kSigned.signature);
    EXPECT_FALSE(proof.opened);
    EXPECT_EQ(proof.whyNotOpened, "because");
    EXPECT_THAT(warnings(), IsEmpty());
}

TEST_P(BadOpenersTest, TakeNoProofBack) {
    answerWith(frameOf(kSigned) + GetParam().afterProof);

    const Proof proof = prove(/*opens=*/true);

    EXPECT_EQ(proof.outcome, Outcome::Signed);
    EXPECT_EQ(proof.signature, kSigned.signature);
    EXPECT_FALSE(proof.opened);
    EXPECT_THAT(proof.whyNotOpened, HasSubstr(GetParam().expected));
}

INSTANTIATE_TEST_SUITE_P(
    All, BadOpenersTest,
    testing::Values(
        Answers{"a secret in spite of a failure", frameOf(kFailed) + frame({1}), "makes no sense"},
        Answers{"no secret in spite of success", frameOf(kOpens) + frame({}), "makes no sense"},
        Answers{"a secret that is too long", frameOf(kOpens) + Bytes{1, 16, 0, 0}, "too long"},
        Answers{"another proof", frameOf(kSigned), "another question"},
        Answers{"another listing", frameOf(service::ListAnswer{}), "another question"},
        Answers{"a useless module", frameOf(service::FailedAnswer{"bad"}), "is of no use: bad"},
        Answers{"no message", frame({1, 2, 3}), "makes no sense"}));

TEST_F(BadOpenersTest, OpenNothingBeforeTheProof) {
    answerWith(frameOf(kOpens) + frame({1}));

    EXPECT_EQ(prove(/*opens=*/true).outcome, Outcome::CardFailed);
}

TEST_F(BadOpenersTest, OpenNothingThatNobodyAskedFor) {
    answerWith(frameOf(kSigned) + frameOf(kOpens) + frame({1}));

    const Proof proof = prove(/*opens=*/false);

    EXPECT_EQ(proof.outcome, Outcome::Signed);
    EXPECT_FALSE(proof.opened);
}

TEST_F(BadOpenersTest, OpenNothingAfterARefusal) {
    answerWith(frameOf(Proof{Outcome::PinIncorrect, {}, PinState::LastTry, "no"}) +
               frameOf(kOpens) + frame({1}));

    const Proof proof = prove(/*opens=*/true);

    EXPECT_EQ(proof.outcome, Outcome::PinIncorrect);
    EXPECT_FALSE(proof.opened);
}

}  // namespace
}  // namespace vlm::test
