#include "services/hints/tokens/worker_protocol.h"

#include <gtest/gtest.h>

#include <functional>

#include "platform/property_list.h"
#include "services/hints/tokens/signature.h"

namespace vlm::service {
namespace {

using platform::PropertyList;
using Array = PropertyList::Array;
using Dictionary = PropertyList::Dictionary;

Identity sampleIdentity(std::uint8_t number) {
    Identity identity;
    identity.publicKeyInfo = Bytes(91, number);
    identity.publicKeyHash = sha256(identity.publicKeyInfo);
    identity.name = "Alice";
    identity.notBefore = -1;
    identity.notAfter = std::int64_t{1} << 40;
    identity.canSign = true;
    identity.certificate = Bytes(300, number);
    return identity;
}

Token sampleToken() {
    Token token;
    token.identifier = "pkcs11:model=a;manufacturer=b;serial=c;token=d";
    token.name = "d";
    token.hasPinPad = true;
    token.pinState = PinState::LastTry;
    token.identities = {sampleIdentity(1), sampleIdentity(2)};
    if (token.identities[1].publicKeyHash < token.identities[0].publicKeyHash)
        std::swap(token.identities[0], token.identities[1]);
    token.wrapKeyHash = token.identities[0].publicKeyHash;
    token.otherCertificates = {Bytes(200, 7), Bytes(100, 8)};
    token.wrapScheme = WrapScheme::RsaPkcs1;
    return token;
}

struct HostileCase {
    const char* why;
    const char* key;
    PropertyList value;
};

template <typename Message>
std::optional<Message> roundTrip(const Message& answer) {
    const auto message = encodeAnswer(answer);
    if (!message) return {};
    auto decoded = decodeAnswer(*message);
    auto* same = decoded ? std::get_if<Message>(&*decoded) : nullptr;
    if (same == nullptr) return {};
    return std::move(*same);
}

TEST(WorkerProtocolTest, CarriesTokens) {
    Token poor = sampleToken();
    poor.identities.clear();
    poor.wrapKeyHash.reset();
    poor.wrapScheme = Token().wrapScheme;
    const std::vector<Token> tokens = {sampleToken(), poor};

    const auto answer = roundTrip(ListAnswer{tokens, {"one problem"}, true});

    ASSERT_TRUE(answer);
    EXPECT_EQ(answer->tokens, tokens);
    EXPECT_EQ(answer->problems, std::vector<std::string>{"one problem"});
    EXPECT_TRUE(answer->announcesNothing);
}

TEST(WorkerProtocolTest, LeavesOutCertificatesThatAreOutOfBounds) {
    Token token = sampleToken();
    token.identities[0].certificate.resize(kMostCertificateBytes + 1);
    token.otherCertificates = {Bytes(kMostCertificateBytes + 1)};
    token.otherCertificates.resize(kMostOtherCertificates + 2, Bytes{1});

    const auto answer = roundTrip(ListAnswer{std::vector{token}, {}});

    ASSERT_TRUE(answer && answer->tokens);
    const Token& told = answer->tokens->at(0);
    EXPECT_EQ(told.identities[0].certificate, Bytes{});
    EXPECT_EQ(told.identities[1].certificate, token.identities[1].certificate);
    EXPECT_EQ(told.otherCertificates, std::vector<Bytes>(kMostOtherCertificates, Bytes{1}));
}

TEST(WorkerProtocolTest, TellsTokensWithoutCertificatesWhereThereIsNoRoomForThem) {
    Token token = sampleToken();
    token.otherCertificates.assign(kMostOtherCertificates, Bytes(kMostCertificateBytes));
    std::vector<Token> tokens(40, token);

    const auto answer = roundTrip(ListAnswer{tokens, {}});

    ASSERT_TRUE(answer && answer->tokens);
    EXPECT_EQ(answer->tokens->size(), 40U);
    EXPECT_EQ(answer->tokens->at(0).identities[0].certificate, Bytes{});
    EXPECT_EQ(answer->tokens->at(0).otherCertificates, std::vector<Bytes>{});
}

TEST(WorkerProtocolTest, TellsNoTokensFromUnchangedOnes) {
    const auto none = roundTrip(ListAnswer{std::vector<Token>{}, {}});
    const auto unchanged = roundTrip(ListAnswer{std::nullopt, {}});

    ASSERT_TRUE(none && unchanged);
    EXPECT_TRUE(none->tokens);
    EXPECT_FALSE(unchanged->tokens);
}

TEST(WorkerProtocolTest, CarriesProofsAndFailures) {
    const auto proof =
        roundTrip(Proof{Proof::Outcome::PinIncorrect, {1, 2}, PinState::FewTriesLeft, "because"});
    const auto failure = roundTrip(FailedAnswer{"no such module"});

    ASSERT_TRUE(proof && failure);
    EXPECT_EQ(proof->outcome, Proof::Outcome::PinIncorrect);
    EXPECT_EQ(proof->signature, (Bytes{1, 2}));
    EXPECT_EQ(proof->pinStateAfter, PinState::FewTriesLeft);
    EXPECT_EQ(proof->reason, "because");
    EXPECT_EQ(failure->reason, "no such module");
}

ProofRequest sampleRequest() {
    ProofRequest request;
    request.tokenIdentifier = "pkcs11:token=a";
    request.publicKeyHash = Bytes(32, 1);
    request.challenge = Bytes(32, 2);
    request.pin = Secret("765432");
    return request;
}

TEST(WorkerProtocolTest, CarriesRequestsWithoutThePin) {
    const auto message = encodeProofRequest(sampleRequest());

    ASSERT_TRUE(message);
    EXPECT_EQ(std::string(message->begin(), message->end()).find("765432"), std::string::npos);
    const auto decoded = decodeRequest(*message);
    const auto* request = decoded ? std::get_if<ProofRequest>(&*decoded) : nullptr;
    ASSERT_NE(request, nullptr);
    EXPECT_EQ(request->tokenIdentifier, "pkcs11:token=a");
    EXPECT_EQ(request->publicKeyHash, Bytes(32, 1));
    EXPECT_EQ(request->challenge, Bytes(32, 2));
    EXPECT_TRUE(request->pin.empty());
    EXPECT_TRUE(std::holds_alternative<ListRequest>(*decodeRequest(*encodeListRequest())));
}

TEST(WorkerProtocolTest, CarriesWhatIsToBeOpened) {
    for (const WrapScheme scheme :
         {WrapScheme::RsaOaepSha256, WrapScheme::RsaPkcs1, WrapScheme::Ecdh}) {
        ProofRequest request = sampleRequest();
        request.open = OpenRequest{Bytes(32, 3), scheme, Bytes(kMostSealedBytes, 4)};

        const auto decoded = decodeRequest(*encodeProofRequest(request));

        ASSERT_TRUE(decoded);
        EXPECT_EQ(std::get<ProofRequest>(*decoded).open, request.open);
    }
    EXPECT_FALSE(std::get<ProofRequest>(*decodeRequest(*encodeProofRequest(sampleRequest()))).open);
}

TEST(WorkerProtocolTest, CarriesWhyNothingWasOpened) {
    for (const std::string why : {"", "because"}) {
        const auto answer = roundTrip(OpeningAnswer{why});
        ASSERT_TRUE(answer);
        EXPECT_EQ(answer->whyNot, why);
    }
}

TEST(WorkerProtocolTest, NeverHasASecretInAMessage) {
    Proof proof;
    proof.outcome = Proof::Outcome::Signed;
    proof.opened = std::make_shared<const Secret>(Secret("top secret"));

    const auto message = encodeAnswer(proof);

    ASSERT_TRUE(message);
    EXPECT_EQ(std::string(message->begin(), message->end()).find("secret"), std::string::npos);
}

TEST(WorkerProtocolTest, RefusesOpeningsThatAreOutOfBounds) {
    const Dictionary good = {{"op", "prove"},      {"token", "pkcs11:token=a"},
                             {"hash", Bytes(32)},  {"challenge", Bytes(32)},
                             {"wrap", Bytes(32)},  {"scheme", 3},
                             {"sealed", Bytes(65)}};
    const std::vector<HostileCase> cases = {
        {"wrap key of another size", "wrap", Bytes(31)},
        {"scheme before the first", "scheme", 0},
        {"scheme beyond the last", "scheme", 4},
        {"scheme of a wrong type", "scheme", "ecdh"},
        {"sealed part that is too long", "sealed", Bytes(kMostSealedBytes + 1)},
        {"sealed part of a wrong type", "sealed", 1},
    };
    EXPECT_TRUE(decodeRequest(*platform::writeBinaryPropertyList(good)));
    for (const HostileCase& each : cases) {
        Dictionary request = good;
        request.set(each.key, each.value);
        EXPECT_FALSE(decodeRequest(*platform::writeBinaryPropertyList(request))) << each.why;
    }
}

TEST(WorkerProtocolTest, RefusesToSendRequestsThatAreOutOfBounds) {
    ProofRequest shortWrapKey = sampleRequest();
    shortWrapKey.open = OpenRequest{Bytes(31), WrapScheme::Ecdh, Bytes(65)};
    ProofRequest longSealed = sampleRequest();
    longSealed.open = OpenRequest{Bytes(32), WrapScheme::Ecdh, Bytes(kMostSealedBytes + 1)};
    ProofRequest longPin = sampleRequest();
    longPin.pin = Secret(std::string(kMostPinBytes + 1, '1'));
    ProofRequest shortHash = sampleRequest();
    shortHash.publicKeyHash.pop_back();
    ProofRequest longChallenge = sampleRequest();
    longChallenge.challenge.resize(kMostChallengeBytes + 1);

    EXPECT_FALSE(encodeProofRequest(longPin));
    EXPECT_FALSE(encodeProofRequest(shortHash));
    EXPECT_FALSE(encodeProofRequest(longChallenge));
    EXPECT_FALSE(encodeProofRequest(shortWrapKey));
    EXPECT_FALSE(encodeProofRequest(longSealed));
}

// What a corrupted worker may say.

Dictionary identityEntries() {
    return {{"key", Bytes(91, 1)}, {"name", "A"}, {"from", 0}, {"until", 1}, {"signs", true}};
}

Dictionary tokenEntries() {
    return {{"id", "pkcs11:token=a"}, {"name", "a"}, {"pad", false},
            {"login", true},          {"pin", 0},    {"identities", Array{identityEntries()}}};
}

std::optional<std::vector<Token>> decodeTokens(Array tokens) {
    const PropertyList message =
        Dictionary{{"problems", Array{}}, {"silent", false}, {"tokens", std::move(tokens)}};
    const auto answer = decodeAnswer(*platform::writeBinaryPropertyList(message));
    const auto* list = answer ? std::get_if<ListAnswer>(&*answer) : nullptr;
    if (list == nullptr) return {};
    return list->tokens;
}

TEST(WorkerProtocolTest, TakesTheSampleThatTheHostileOnesAreMadeFrom) {
    EXPECT_TRUE(decodeTokens({tokenEntries()}));
}

TEST(WorkerProtocolTest, RefusesTokensThatAreOutOfBounds) {
    const std::vector<HostileCase> cases = {
        {"identifier of a wrong type", "id", 5},
        {"identifier that is no such URI", "id", "http:x"},
        {"identifier with a line feed", "id", "pkcs11:token=a\nb"},
        {"identifier beyond ASCII", "id", "pkcs11:token=\u00e9"},
        {"identifier that is too long", "id", "pkcs11:" + std::string(2048, 'x')},
        {"name that is too long", "name", std::string(1028, 'x')},
        {"name of a wrong type", "name", Bytes{1}},
        {"boolean of a wrong type", "pad", 1},
        {"PIN state below the first", "pin", -1},
        {"PIN state beyond the last", "pin", 4},
        {"wrap key of another size", "wrap", Bytes(31)},
        {"wrap key without a scheme", "wrap", Bytes(32)},
        {"identities of a wrong type", "identities", Dictionary{}},
        {"too many identities", "identities", Array(4097, identityEntries())},
        {"identity that is none", "identities", Array{5}},
        {"too many certificates", "others", Array(33, Bytes{1})},
        {"certificate that is too long", "others", Array{Bytes((16 << 10) + 1)}},
        {"certificate of a wrong type", "others", Array{"text"}},
    };
    for (const HostileCase& each : cases) {
        Dictionary token = tokenEntries();
        token.set(each.key, each.value);
        EXPECT_FALSE(decodeTokens({token})) << each.why;
    }
    EXPECT_FALSE(decodeTokens(Array(1025, tokenEntries()))) << "too many tokens";
    EXPECT_FALSE(decodeTokens({Dictionary{}})) << "a token without anything";
}

TEST(WorkerProtocolTest, RefusesIdentitiesThatAreOutOfBounds) {
    const std::vector<HostileCase> cases = {
        {"no key", "key", Bytes{}},
        {"key that is too long", "key", Bytes(8193)},
        {"name of a wrong type", "name", true},
        {"date of a wrong type", "from", "now"},
        {"date out of range", "until", ~std::uint64_t{0}},
        {"ability of a wrong type", "signs", "yes"},
        {"certificate that is too long", "certificate", Bytes((16 << 10) + 1)},
        {"certificate of a wrong type", "certificate", "text"},
    };
    for (const HostileCase& each : cases) {
        Dictionary identity = identityEntries();
        identity.set(each.key, each.value);
        Dictionary token = tokenEntries();
        token.set("identities", Array{identity});
        EXPECT_FALSE(decodeTokens({token})) << each.why;
    }
}

TEST(WorkerProtocolTest, MakesTextsHarmlessAndIdentitiesSortedOnItsOwn) {
    Dictionary second = identityEntries();
    second.set("key", Bytes(91, 2));
    second.set("name", "a\nb");
    Dictionary token = tokenEntries();
    token.set("identities", Array{second, identityEntries(), second});

    const auto tokens = decodeTokens({token});

    ASSERT_TRUE(tokens);
    const auto& identities = (*tokens)[0].identities;
    ASSERT_EQ(identities.size(), 2U);
    EXPECT_LT(identities[0].publicKeyHash, identities[1].publicKeyHash);
    for (const Identity& each : identities) {
        EXPECT_EQ(each.publicKeyHash, sha256(each.publicKeyInfo));
        EXPECT_EQ(each.name, each.publicKeyInfo[0] == 2 ? "a\ufffdb" : "A");
    }
}

TEST(WorkerProtocolTest, RefusesProofsThatAreOutOfBounds) {
    const Dictionary good = {{"outcome", 0}, {"signature", Bytes{1}}, {"pin", 0}, {"reason", ""}};
    const std::vector<HostileCase> cases = {
        {"outcome beyond the last", "outcome", 7},
        {"outcome of a wrong type", "outcome", "signed"},
        {"signature that is too long", "signature", Bytes(4097)},
        {"PIN state beyond the last", "pin", 4},
        {"reason of a wrong type", "reason", 1},
    };
    EXPECT_TRUE(decodeAnswer(*platform::writeBinaryPropertyList(good)));
    for (const HostileCase& each : cases) {
        Dictionary proof = good;
        proof.set(each.key, each.value);
        EXPECT_FALSE(decodeAnswer(*platform::writeBinaryPropertyList(proof))) << each.why;
    }
}

TEST(WorkerProtocolTest, RefusesWhatIsNoMessage) {
    const std::vector<PropertyList> cases = {Dictionary{},
                                             Array{},
                                             5,
                                             "list",
                                             Dictionary{{"problems", Array{5}}, {"silent", false}},
                                             Dictionary{{"problems", Array{}}},
                                             Dictionary{{"problems", Array{}}, {"silent", 1}},
                                             Dictionary{{"unopened", 5}},
                                             Dictionary{{"failed", 5}}};
    for (const PropertyList& each : cases) {
        const auto message = platform::writeBinaryPropertyList(each);
        EXPECT_FALSE(decodeAnswer(*message)) << each.describe();
        EXPECT_FALSE(decodeRequest(*message)) << each.describe();
    }
    EXPECT_FALSE(decodeAnswer(Bytes{}));
    EXPECT_FALSE(decodeRequest(Bytes{1, 2, 3}));
}

TEST(WorkerProtocolTest, SurvivesAnyCutAndAnyFlippedByte) {
    const auto message = encodeAnswer(ListAnswer{std::vector{sampleToken()}, {"x"}});
    ASSERT_TRUE(message);
    for (std::size_t i = 0; i < message->size(); ++i) {
        decodeAnswer(std::span(*message).first(i));
        Bytes flipped = *message;
        flipped[i] ^= 0xFFU;
        const auto answer = decodeAnswer(flipped);
        const auto* list = answer ? std::get_if<ListAnswer>(&*answer) : nullptr;
        if (list == nullptr || !list->tokens) continue;
        for (const Token& token : *list->tokens)
            EXPECT_TRUE(token.identifier.starts_with("pkcs11:"));
    }
}

}  // namespace
}  // namespace vlm::service
