#include "services/hints/tokens/worker_protocol.h"

#include <algorithm>
#include <utility>

#include "platform/property_list.h"
#include "services/hints/tokens/bounded_entries.h"
#include "services/hints/tokens/card_text.h"
#include "services/hints/tokens/frames.h"
#include "services/hints/tokens/signature.h"

namespace vlm::service {
namespace {

using platform::PropertyList;
using platform::PropertyListLimits;
using Array = PropertyList::Array;
using Dictionary = PropertyList::Dictionary;

constexpr PropertyListLimits kLimits = {
    .depth = 8, .objects = std::size_t{1} << 19U, .bytes = kMostFrameBytes};
constexpr std::size_t kMostTokens = 1024;
constexpr std::size_t kMostIdentities = 4096;  // on one token
constexpr std::size_t kMostIdentifierBytes = 2048;
constexpr std::size_t kMostKeyBytes = 8192;
constexpr std::size_t kMostSignatureBytes = 4096;
constexpr std::size_t kMostProblems = 64;
constexpr std::size_t kMostReasonCharacters = 512;
constexpr std::size_t kHashBytes = 32;

std::optional<Bytes> write(Dictionary message) {
    return platform::writeBinaryPropertyList(std::move(message), kLimits);
}

enum class Certificates { Told, LeftOut };

bool isTold(const Bytes& certificate, Certificates certificates) {
    return certificates == Certificates::Told && !certificate.empty() &&
           certificate.size() <= kMostCertificateBytes;
}

PropertyList encode(const Identity& identity, Certificates certificates) {
    Dictionary dictionary{{"key", identity.publicKeyInfo},
                          {"name", identity.name},
                          {"from", identity.notBefore},
                          {"until", identity.notAfter},
                          {"signs", identity.canSign}};
    if (isTold(identity.certificate, certificates))
        dictionary.set("certificate", identity.certificate);
    return dictionary;
}

std::optional<Identity> decodeIdentity(const PropertyList& value) {
    BoundedEntries entries(&value);
    Identity identity;
    identity.publicKeyInfo = entries.bytes("key", 1, kMostKeyBytes);
    // The hash is made here, so that it is right whatever the worker is up to.
    identity.publicKeyHash = sha256(identity.publicKeyInfo);
    identity.name = entries.cardText("name", kCardTextLength);
    identity.notBefore = entries.integer("from");
    identity.notAfter = entries.integer("until");
    identity.canSign = entries.boolean("signs");
    if (entries.has("certificate"))
        identity.certificate = entries.bytes("certificate", 1, kMostCertificateBytes);
    if (entries.failed()) return {};
    return identity;
}

PropertyList encode(WrapScheme scheme) { return static_cast<std::int64_t>(scheme); }

PropertyList encode(const Token& token, Certificates certificates) {
    Array identities;
    for (const Identity& identity : token.identities)
        identities.push_back(encode(identity, certificates));
    Array others;
    for (const Bytes& other : token.otherCertificates)
        if (isTold(other, certificates) && others.size() < kMostOtherCertificates)
            others.emplace_back(other);
    Dictionary dictionary{{"id", token.identifier},
                          {"name", token.name},
                          {"pad", token.hasPinPad},
                          {"login", token.needsLogin},
                          {"pin", static_cast<std::int64_t>(token.pinState)},
                          {"identities", std::move(identities)}};
    if (!others.empty()) dictionary.set("others", std::move(others));
    if (token.wrapKeyHash) {
        dictionary.set("wrap", *token.wrapKeyHash);
        dictionary.set("scheme", encode(token.wrapScheme));
    }
    return dictionary;
}

// Whether the text can stand in a URI: the identifier is shown and logged as it is.
bool isIdentifier(const std::string& text) {
    return text.starts_with("pkcs11:") &&
           std::ranges::all_of(text, [](char c) { return c > ' ' && c < 0x7F; });
}

std::optional<Token> decodeToken(const PropertyList& value) {
    BoundedEntries entries(&value);
    Token token;
    token.identifier = entries.text("id", kMostIdentifierBytes);
    token.name = entries.cardText("name", kCardTextLength);
    token.hasPinPad = entries.boolean("pad");
    token.needsLogin = entries.boolean("login");
    token.pinState = entries.oneOf("pin", PinState::Ready, PinState::Locked);
    if (entries.has("wrap")) {
        token.wrapKeyHash = entries.bytes("wrap", kHashBytes, kHashBytes);
        token.wrapScheme = entries.oneOf("scheme", WrapScheme::RsaOaepSha256, WrapScheme::Ecdh);
    }
    for (const PropertyList& each : entries.array("identities", kMostIdentities)) {
        auto identity = decodeIdentity(each);
        if (!identity) return {};
        token.identities.push_back(std::move(*identity));
    }
    if (entries.has("others")) {
        for (const PropertyList& each : entries.array("others", kMostOtherCertificates)) {
            if (each.bytes() == nullptr || each.bytes()->size() > kMostCertificateBytes) return {};
            token.otherCertificates.push_back(*each.bytes());
        }
    }
    if (entries.failed() || !isIdentifier(token.identifier)) return {};
    std::ranges::sort(token.identities, {}, &Identity::publicKeyHash);
    const auto twice = std::unique(
        token.identities.begin(), token.identities.end(),
        [](const Identity& a, const Identity& b) { return a.publicKeyHash == b.publicKeyHash; });
    token.identities.erase(twice, token.identities.end());
    return token;
}

std::optional<ListAnswer> decodeListAnswer(BoundedEntries entries) {
    ListAnswer answer;
    for (const PropertyList& each : entries.array("problems", kMostProblems)) {
        if (each.text() == nullptr) return {};
        answer.problems.push_back(cardText(*each.text(), kMostReasonCharacters));
    }
    answer.announcesNothing = entries.boolean("silent");
    if (entries.has("tokens")) {
        answer.tokens.emplace();
        for (const PropertyList& each : entries.array("tokens", kMostTokens)) {
            auto token = decodeToken(each);
            if (!token) return {};
            answer.tokens->push_back(std::move(*token));
        }
    }
    if (entries.failed()) return {};
    return answer;
}

std::optional<Proof> decodeProof(BoundedEntries entries) {
    Proof proof;
    proof.outcome = entries.oneOf("outcome", Proof::Outcome::Signed, Proof::Outcome::CardFailed);
    proof.signature = entries.bytes("signature", 0, kMostSignatureBytes);
    proof.pinStateAfter = entries.oneOf("pin", PinState::Ready, PinState::Locked);
    proof.reason = entries.cardText("reason", kMostReasonCharacters);
    if (entries.failed()) return {};
    return proof;
}

}  // namespace

std::optional<Bytes> encodeListRequest() { return write({{"op", "list"}}); }

std::optional<Bytes> encodeProofRequest(const ProofRequest& request) {
    if (request.tokenIdentifier.size() > kMostIdentifierBytes ||
        request.challenge.size() > kMostChallengeBytes ||
        request.publicKeyHash.size() != kHashBytes || request.pin.text().size() > kMostPinBytes)
        return {};
    Dictionary message{{"op", "prove"},
                       {"token", request.tokenIdentifier},
                       {"hash", request.publicKeyHash},
                       {"challenge", request.challenge}};
    if (request.open) {
        if (request.open->wrapKeyHash.size() != kHashBytes ||
            request.open->sealed.size() > kMostSealedBytes)
            return {};
        message.set("wrap", request.open->wrapKeyHash);
        message.set("scheme", encode(request.open->scheme));
        message.set("sealed", request.open->sealed);
    }
    return write(std::move(message));
}

std::optional<std::variant<ListRequest, ProofRequest>> decodeRequest(
    std::span<const std::uint8_t> message) {
    const auto value = platform::readPropertyList(message, kLimits);
    BoundedEntries entries(value ? &*value : nullptr);
    const std::string operation = entries.text("op", 16);
    if (operation == "list") return ListRequest{};
    if (operation != "prove") return {};
    ProofRequest request;
    request.tokenIdentifier = entries.text("token", kMostIdentifierBytes);
    request.publicKeyHash = entries.bytes("hash", kHashBytes, kHashBytes);
    request.challenge = entries.bytes("challenge", 0, kMostChallengeBytes);
    if (entries.has("wrap")) {
        auto& open = request.open.emplace();
        open.wrapKeyHash = entries.bytes("wrap", kHashBytes, kHashBytes);
        open.scheme = entries.oneOf("scheme", WrapScheme::RsaOaepSha256, WrapScheme::Ecdh);
        open.sealed = entries.bytes("sealed", 0, kMostSealedBytes);
    }
    if (entries.failed()) return {};
    return request;
}

namespace {

std::optional<Bytes> encodeWith(const ListAnswer& answer, Certificates certificates) {
    Array problems;
    for (const std::string& problem : answer.problems)
        if (problems.size() < kMostProblems) problems.emplace_back(problem);
    Dictionary message{{"problems", std::move(problems)}, {"silent", answer.announcesNothing}};
    if (answer.tokens) {
        Array tokens;
        for (const Token& token : *answer.tokens) tokens.push_back(encode(token, certificates));
        message.set("tokens", std::move(tokens));
    }
    return write(std::move(message));
}

}  // namespace

std::optional<Bytes> encodeAnswer(const ListAnswer& answer) {
    auto whole = encodeWith(answer, Certificates::Told);
    return whole ? std::move(whole) : encodeWith(answer, Certificates::LeftOut);
}

std::optional<Bytes> encodeAnswer(const Proof& answer) {
    return write({{"outcome", static_cast<std::int64_t>(answer.outcome)},
                  {"signature", answer.signature},
                  {"pin", static_cast<std::int64_t>(answer.pinStateAfter)},
                  {"reason", answer.reason}});
}

std::optional<Bytes> encodeAnswer(const OpeningAnswer& answer) {
    return write({{"unopened", answer.whyNot}});
}

std::optional<Bytes> encodeAnswer(const FailedAnswer& answer) {
    return write({{"failed", answer.reason}});
}

std::optional<Answer> decodeAnswer(std::span<const std::uint8_t> message) {
    const auto value = platform::readPropertyList(message, kLimits);
    BoundedEntries entries(value ? &*value : nullptr);
    if (entries.has("failed")) {
        FailedAnswer answer{entries.cardText("failed", kMostReasonCharacters)};
        if (entries.failed()) return {};
        return answer;
    }
    if (entries.has("unopened")) {
        OpeningAnswer answer{entries.cardText("unopened", kMostReasonCharacters)};
        if (entries.failed()) return {};
        return answer;
    }
    if (entries.has("outcome")) {
        if (auto proof = decodeProof(entries)) return std::move(*proof);
        return {};
    }
    if (auto answer = decodeListAnswer(entries)) return std::move(*answer);
    return {};
}

}  // namespace vlm::service
