// CardModule: the tokens of one module, for the worker process. Keeps the module initialised, a
// session open on each token, and what was read from a token until that token leaves.

#pragma once

#include <chrono>
#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "services/hints/tokens.h"
#include "services/hints/tokens/identities.h"
#include "services/hints/tokens/key_opener.h"
#include "services/hints/tokens/pkcs11_module.h"

namespace vlm::service {

class CardModule {
public:
    struct Listing {
        std::vector<Token> tokens;          // sorted by identifier, each once
        std::vector<std::string> problems;  // tokens that could not be read, and why
    };

    // A software module learns of a new token only when it is initialised anew; a listing does so
    // when the last time was longer than `lookAgainAfter` ago.
    CardModule(std::unique_ptr<Pkcs11Module> module, std::chrono::milliseconds lookAgainAfter);

    Listing list(std::int64_t now);
    // Whether a token can come without a word. A module without any slot waits for a reader.
    bool announcesNothing() const { return _module->hasSlots() && _module->isSoftware(); }

    // Tells the proof to `tell`, once; then answers what the request wants opened, or none when it
    // wants nothing, or nothing was signed.
    std::optional<Opening> prove(ProofRequest request,
                                 const std::function<void(const Proof&)>& tell);

private:
    struct KnownToken {
        SlotToken slotToken;
        std::optional<Pkcs11Session> session;  // none after the module was initialised anew
        TokenObjects objects;
    };
    using KnownTokens = std::map<TokenFields, KnownToken>;

    std::optional<std::vector<SlotToken>> presentTokens();
    const TokenObjects* objectsOf(const SlotToken& token, KnownTokens& present);

    std::unique_ptr<Pkcs11Module> _module;
    std::chrono::milliseconds _lookAgainAfter;
    std::chrono::steady_clock::time_point _looked;
    KnownTokens _known;
};

}  // namespace vlm::service
