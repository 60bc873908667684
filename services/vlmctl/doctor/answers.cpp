#include "services/vlmctl/doctor/answers.h"

#include <chrono>
#include <future>
#include <memory>
#include <set>
#include <thread>
#include <utility>

#include "bind/bind_operation.h"
#include "bind/token_info.h"
#include "hints/hints_client.h"
#include "services/hints/pcsc_connection.h"

namespace vlm::control::doctor {

namespace {

using std::chrono::steady_clock;

constexpr auto kPatience = std::chrono::milliseconds(1500);

template <typename Answer>
using Question = std::future<std::optional<Answer>>;

// Asks on a thread of its own, which is left to itself when no answer comes in time.
template <typename Answer, typename Ask>
Question<Answer> begin(Ask ask) {
    auto promise = std::make_shared<std::promise<std::optional<Answer>>>();
    auto question = promise->get_future();
    std::thread([promise, ask] { promise->set_value(ask()); }).detach();
    return question;
}

template <typename Answer>
std::optional<Answer> end(Question<Answer>& question, steady_clock::time_point until) {
    if (question.wait_until(until) != std::future_status::ready) return std::nullopt;
    return question.get();
}

std::optional<std::vector<std::string>> askForReaders() {
    const service::PcscConnection pcscd;
    if (!pcscd.isOpen()) return std::nullopt;
    return pcscd.readers();
}

Card cardOf(const TokenInfo& info, const std::string& token, const std::string& name) {
    Card card{name, 0, 0};
    const auto hashes = info.hashesByToken.find(token);
    if (hashes == info.hashesByToken.end()) return card;
    for (const auto& hash : hashes->second) {
        ++card.identities;
        if (info.offered.contains(hash) || info.bound.contains(hash)) ++card.usable;
    }
    return card;
}

std::optional<std::vector<Card>> askForCards() {
    const auto record = BindOperation::init()->tokenData(std::nullopt);
    if (!record) return std::nullopt;
    const TokenInfo info(*record);
    std::vector<Card> cards;
    for (const auto& [token, name] : info.cardNames) cards.push_back(cardOf(info, token, name));
    return cards;
}

std::optional<std::size_t> askForPairings(const std::string& account) {
    const auto hashes = VLCopyLegacyBindings(platform::String(account), /*flag=*/false);
    if (!hashes) return std::nullopt;
    return hashes->size();
}

}  // namespace

Answers askAround(const std::string& account) {
    const auto until = steady_clock::now() + kPatience;
    auto readers = begin<std::vector<std::string>>(askForReaders);
    auto cards = begin<std::vector<Card>>(askForCards);
    auto pairings = begin<std::size_t>([account] { return askForPairings(account); });
    return {end(readers, until), end(cards, until), end(pairings, until)};
}

}  // namespace vlm::control::doctor
