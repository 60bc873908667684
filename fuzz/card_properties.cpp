#include "fuzz/card_properties.h"

#include <algorithm>

#include "services/hints/tokens/worker_protocol.h"
#include "services/keychain/unlock_key_wrapping.h"
#include "services/keychain/wrapped_form.h"

namespace vlm::fuzz {

using namespace service;

namespace {

using Octets = std::span<const std::uint8_t>;
using Request = std::variant<ListRequest, ProofRequest>;

std::optional<Bytes> written(const Request& request) {
    const auto* proof = std::get_if<ProofRequest>(&request);
    return proof == nullptr ? encodeListRequest() : encodeProofRequest(*proof);
}

std::optional<Bytes> written(const Answer& answer) {
    return std::visit([](const auto& each) { return encodeAnswer(each); }, answer);
}

template <typename Message>
bool returns(const std::optional<Message>& message,
             std::optional<Message> (*read)(std::span<const std::uint8_t>)) {
    if (!message) return true;
    const auto once = written(*message);
    const auto again = once ? read(*once) : std::nullopt;
    return again && again->index() == message->index() && written(*again) == once;
}

Bytes bytesOf(Octets octets) { return {octets.begin(), octets.end()}; }

}  // namespace

bool workerRequestIsSound(std::span<const std::uint8_t> data) {
    return returns(decodeRequest(data), decodeRequest);
}

bool workerAnswerIsSound(std::span<const std::uint8_t> data) {
    return returns(decodeAnswer(data), decodeAnswer);
}

bool wrappedUnlockKeyIsSound(std::span<const std::uint8_t> data) {
    const UnlockKeyPurpose purpose{"alice", Bytes(32, 1), Bytes(32, 2)};
    const auto form = readWrappedForm(data);
    const auto task = cardTask(data, purpose.wrapKeyHash);
    if (unwrapUnlockKey(data, Secret("a secret of no card whatever"), purpose)) return false;
    if (!form) return !task;
    if (!task || task->scheme != form->scheme || !std::ranges::equal(task->sealed, form->sealed) ||
        task->sealed.size() > kMostSealedBytes)
        return false;

    Bytes whole = bytesOf(form->front);
    const auto nonce = form->nonce.first<kNonceBytes>();
    if (wrappedFront(form->scheme, task->sealed, nonce) != whole) return false;
    for (const Octets part : {form->ciphertext, form->tag})
        whole.insert(whole.end(), part.begin(), part.end());
    return std::ranges::equal(whole, data);
}

}  // namespace vlm::fuzz
