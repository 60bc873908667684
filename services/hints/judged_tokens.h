// JudgedTokens: the tokens with a judgement on each identity, where the machine asks for
// certificates of issuers that it trusts. Where it does not, nothing is read for it.
//
// In tests: tests/unit/services/trust/judged_tokens_test.cpp

#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <utility>
#include <vector>

#include "services/hints/anchors.h"
#include "services/hints/certificate_trust.h"
#include "services/hints/tokens.h"

namespace vlm::service {

class JudgedTokens final : public Tokens {
public:
    struct Parts {
        Tokens& tokens;
        Anchors& anchors;
        CertificateTrust& trust;
        std::function<bool()> isTrustChecked;
        std::function<std::int64_t()> now;  // seconds since 1970-01-01 00:00:00 UTC
    };

    explicit JudgedTokens(Parts parts) : _parts(std::move(parts)) {}

    void list(std::function<void(std::vector<Token>)> answer) override {
        if (!_parts.isTrustChecked()) return _parts.tokens.list(std::move(answer));
        // Whichever comes last, the cards as a rule, finds the other there.
        struct Round {
            std::function<void(std::vector<Token>)> answer;
            std::optional<MachineAnchors> anchors;
            std::optional<std::vector<Token>> tokens;
        };
        const auto round = std::make_shared<Round>();
        round->answer = std::move(answer);
        const auto endWhenComplete = [this, round] {
            if (!round->anchors || !round->tokens) return;
            _parts.trust.judge(*round->tokens, *round->anchors, _parts.now());
            round->answer(std::move(*round->tokens));
        };
        _parts.anchors.read([round, endWhenComplete](const MachineAnchors& anchors) {
            round->anchors = anchors;
            endWhenComplete();
        });
        _parts.tokens.list([round, endWhenComplete](std::vector<Token> tokens) {
            round->tokens = std::move(tokens);
            endWhenComplete();
        });
    }
    LookAgain lookAgain() const override { return _parts.tokens.lookAgain(); }
    void prove(ProofRequest request, std::function<void(Proof)> answer) override {
        _parts.tokens.prove(std::move(request), std::move(answer));
    }

private:
    Parts _parts;
};

}  // namespace vlm::service
