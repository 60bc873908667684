// What the service and a card worker say to each other. A message is a binary property list in a
// frame. A secret is never part of one, so that it never lies in an ordinary buffer: a request to
// prove is followed by one more frame that holds nothing but the PIN, and the answer to an opening
// by one that holds nothing but what was opened, which is empty when that failed.
//
// A proof is told as soon as the card has signed. What is to be opened is a second answer, so that
// a module that crashes or hangs in it takes no proof back.
//
// Neither side believes the other: a card module may have corrupted the worker. Reading answers
// none for anything that is not such a message within the bounds.

#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <variant>
#include <vector>

#include "services/hints/tokens.h"

namespace vlm::service {

inline constexpr std::size_t kMostPinBytes = 256;
inline constexpr std::size_t kMostChallengeBytes = 4096;
inline constexpr std::size_t kMostSealedBytes = 8192;
inline constexpr std::size_t kMostOpenedBytes = 4096;
inline constexpr std::size_t kMostCertificateBytes = std::size_t{16} << 10U;
inline constexpr std::size_t kMostOtherCertificates = 32;  // on one token

struct ListRequest {};

// The request, without the PIN that follows it; none for one that is out of bounds.
std::optional<Bytes> encodeListRequest();
std::optional<Bytes> encodeProofRequest(const ProofRequest& request);
std::optional<std::variant<ListRequest, ProofRequest>> decodeRequest(
    std::span<const std::uint8_t> message);

// Tokens are absent when they are as this worker told them last.
struct ListAnswer {
    std::optional<std::vector<Token>> tokens;
    std::vector<std::string> problems;  // for the log
    bool announcesNothing = false;      // no reader tells when a token comes to this module
};
// After a proof that was signed, when the request wants something opened.
struct OpeningAnswer {
    std::string whyNot;  // for people; empty when the opened secret follows
};
struct FailedAnswer {
    std::string reason;  // why the module is of no use
};

// Certificates that are out of bounds are left out, and all of them where a listing would be too
// long with them.
std::optional<Bytes> encodeAnswer(const ListAnswer& answer);
std::optional<Bytes> encodeAnswer(const Proof& answer);
std::optional<Bytes> encodeAnswer(const OpeningAnswer& answer);
std::optional<Bytes> encodeAnswer(const FailedAnswer& answer);

using Answer = std::variant<ListAnswer, Proof, OpeningAnswer, FailedAnswer>;
std::optional<Answer> decodeAnswer(std::span<const std::uint8_t> message);

}  // namespace vlm::service
