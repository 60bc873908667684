#include "services/hints/tokens/card_module.h"

#include <algorithm>
#include <utility>

#include "platform/text.h"
#include "services/hints/tokens/token_prover.h"
#include "services/hints/tokens/token_reader.h"

namespace vlm::service {
namespace {

using std::chrono::steady_clock;

// What a slot answers that has no card, or one of another make: nothing to tell anybody about.
bool meansNoToken(CK_RV result) {
    return result == CKR_TOKEN_NOT_PRESENT || result == CKR_DEVICE_REMOVED ||
           result == CKR_SLOT_ID_INVALID || result == CKR_TOKEN_NOT_RECOGNIZED;
}

bool isTrouble(CK_RV result) { return result != CKR_OK && !meansNoToken(result); }

// The flags that say what kind of token it is; the others tell of its state and change often.
CK_FLAGS kindOf(CK_FLAGS flags) {
    return flags & (CKF_LOGIN_REQUIRED | CKF_PROTECTED_AUTHENTICATION_PATH | CKF_TOKEN_INITIALIZED);
}

}  // namespace

CardModule::CardModule(std::unique_ptr<Pkcs11Module> module,
                       std::chrono::milliseconds lookAgainAfter)
    : _module(std::move(module)), _lookAgainAfter(lookAgainAfter), _looked(steady_clock::now()) {}

// None when the module does not even tell its slots.
std::optional<std::vector<SlotToken>> CardModule::presentTokens() {
    if (steady_clock::now() - _looked < _lookAgainAfter) {
        auto tokens = _module->tokens();
        // A software token whose files were taken away fails until it is looked for anew.
        const bool failed = !tokens || std::ranges::any_of(*tokens, isTrouble, &SlotToken::result);
        if (!failed) return tokens;
    }
    if (_module->isSoftware()) {
        for (auto& [fields, token] : _known) token.session.reset();
        _module->reinitialize();
    }
    _looked = steady_clock::now();
    return _module->tokens();
}

CardModule::Listing CardModule::list(std::int64_t now) {
    Listing listing;
    KnownTokens present;
    const auto slotTokens = presentTokens();
    if (!slotTokens) listing.problems.emplace_back("it does not tell its slots");
    for (const SlotToken& slotToken : slotTokens.value_or(std::vector<SlotToken>{})) {
        if (slotToken.result != CKR_OK) {
            if (isTrouble(slotToken.result))
                listing.problems.push_back(
                    platform::text("a card in slot {} gives no information: {}", slotToken.slot,
                                   resultText(slotToken.result)));
            continue;
        }
        if ((slotToken.flags & CKF_TOKEN_INITIALIZED) == 0) continue;
        Token token = describeToken(slotToken);
        if (present.contains(slotToken.fields)) {
            listing.problems.push_back("two cards are the same: " + token.identifier);
            continue;
        }
        const TokenObjects* objects = objectsOf(slotToken, present);
        if (objects == nullptr) {
            listing.problems.push_back("the card \"" + token.name + "\" cannot be read");
            continue;
        }
        addIdentities(*objects, now, token);
        listing.tokens.push_back(std::move(token));
    }
    // Tokens that left take their sessions and what was read from them along.
    _known = std::move(present);
    std::ranges::sort(listing.tokens, {}, &Token::identifier);
    return listing;
}

// What the token holds: as it was read before when it has been there since, else read now. The
// token moves to, or is put among, those that are present; null when it cannot be read.
const TokenObjects* CardModule::objectsOf(const SlotToken& token, KnownTokens& present) {
    auto known = _known.extract(token.fields);
    if (!known.empty()) {
        KnownToken& kept = known.mapped();
        const bool same = kept.slotToken.slot == token.slot &&
                          kindOf(kept.slotToken.flags) == kindOf(token.flags);
        if (same && !kept.session) kept.session = _module->openSession(token.slot);
        if (same && kept.session && kept.session->isValid())
            return &present.insert(std::move(known)).position->second.objects;
    }
    auto session = _module->openSession(token.slot);
    auto objects = session ? readObjects(*session) : std::nullopt;
    if (!objects) return nullptr;
    objects->wrapMechanisms = wrapMechanismsIn(*_module, token.slot);
    KnownToken fresh{token, std::move(session), std::move(*objects)};
    return &present.emplace(token.fields, std::move(fresh)).first->second.objects;
}

std::optional<Opening> CardModule::prove(ProofRequest request,
                                         const std::function<void(const Proof&)>& tell) {
    const auto slotTokens = _module->tokens();
    for (const SlotToken& slotToken : slotTokens.value_or(std::vector<SlotToken>{})) {
        if (slotToken.result != CKR_OK ||
            tokenIdentifier(slotToken.fields) != request.tokenIdentifier)
            continue;
        const TokenObjects* objects = objectsOf(slotToken, _known);
        if (objects == nullptr) {
            Proof proof;
            proof.reason = "the card \"" + describeToken(slotToken).name + "\" cannot be read";
            tell(proof);
            return {};
        }
        std::optional<TokenProver> prover(std::in_place, *_module, slotToken, *objects);
        const Proof proof = prover->prove(request);
        const bool opens = request.open && proof.outcome == Proof::Outcome::Signed;
        // The card is logged out before anybody hears that it has done all that was asked of it.
        if (!opens) prover.reset();
        tell(proof);
        return opens ? std::optional(prover->open(request)) : std::nullopt;
    }
    tell({Proof::Outcome::NoSuchToken, {}, PinState::Ready, "the card is not inserted"});
    return {};
}

}  // namespace vlm::service
