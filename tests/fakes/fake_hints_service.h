// A hints service in memory: cards, their identities, pairings. A test plugs it into the fake IPC,
// and may script any operation's reply.

#pragma once

#include <algorithm>
#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "fake_named_service_ipc.h"
#include "platform/property_list.h"

namespace vlm::fakes {

class FakeHintsService {
public:
    enum Operation : std::uint64_t {
        kPerformLogin = 0,
        kCopyAvailableTokensInfo = 1,
        kBindUser = 2,
        kUnbindUser = 3,
        kIsUserBound = 6,
    };

    struct Identity {
        platform::Bytes hash;
        std::string name;
        bool offered = true;  // valid and able to sign
    };

    struct Card {
        std::string identifier;
        std::string name;
        std::vector<Identity> identities;
        std::optional<platform::Bytes> wrapKeyHash;
    };

    static constexpr platform::Status kNotPaired = -2012;
    static constexpr platform::Status kNoSuchKey = -2005;

    // What a test does to the world.
    void plugInto(FakeNamedServiceIpc& ipc) {
        ipc.serve([this](const platform::Message& request) { return answer(request); });
    }
    void insert(Card card) { _cards.push_back(std::move(card)); }
    void remove(const std::string& identifier) {
        std::erase_if(_cards, [&](const Card& card) { return card.identifier == identifier; });
    }
    void pair(const std::string& account, const platform::Bytes& hash) {
        pairings.emplace_back(account, hash);
    }

    // An operation answers this from now on, whatever it is asked.
    void script(Operation operation, platform::Message reply) {
        _scripted[operation] = std::move(reply);
    }
    void failWith(Operation operation, platform::Status status,
                  const std::optional<platform::Error>& error = std::nullopt) {
        script(operation, result(status, error));
    }
    // What the service tells about the tokens, in place of the cards that are inserted.
    void tell(const platform::PropertyList& record) {
        script(kCopyAvailableTokensInfo, tokensInfo(record));
    }

    // What happened.
    std::vector<std::pair<std::string, platform::Bytes>> pairings;  // account and hash, in order
    std::map<std::uint64_t, int> requests;                          // how many, by operation

    // Replies, for scripts.
    static platform::Message result(platform::Status status,
                                    const std::optional<platform::Error>& error = std::nullopt) {
        platform::Message reply;
        if (error) platform::encodeReplyError(*error, &reply);
        reply.set("res", std::int64_t{status});
        return reply;
    }
    static platform::Message propertyList(const platform::PropertyList& list) {
        platform::Message reply;
        reply.set("res", *platform::writeBinaryPropertyList(list));
        return reply;
    }
    static platform::Message tokensInfo(const platform::PropertyList& record) {
        return propertyList(Dictionary{{"ctx", *platform::writeBinaryPropertyList(record)}});
    }

    platform::Message answer(const platform::Message& request) {
        const auto operation = request.unsignedInteger("op").value_or(~std::uint64_t{0});
        ++requests[operation];
        if (const auto scripted = _scripted.find(operation); scripted != _scripted.end())
            return scripted->second;
        switch (operation) {
            case kPerformLogin:
                return result(holds(textOf(request), hashOf(request)) ? 0 : kNoSuchKey);
            case kCopyAvailableTokensInfo:
                return tokensInfo(record(tokenAskedFor(request)));
            case kBindUser:
                pair(textOf(request), hashOf(request));
                return result(0);
            case kUnbindUser:
                return result(std::erase(pairings, std::pair(textOf(request), hashOf(request))) > 0
                                  ? 0
                                  : kNotPaired);
            case kIsUserBound:
                return result(isPaired(textOf(request)) ? 1 : 0);
            default:
                return result(-2002);
        }
    }

private:
    using Array = platform::PropertyList::Array;
    using Dictionary = platform::PropertyList::Dictionary;

    static std::string textOf(const platform::Message& request) {
        const auto* text = request.text("str1");
        return text ? *text : "";
    }

    static platform::Bytes hashOf(const platform::Message& request) {
        const auto* bytes = request.bytes("dat1");
        return bytes ? *bytes : platform::Bytes();
    }

    static std::optional<std::string> tokenAskedFor(const platform::Message& request) {
        const auto* query = request.bytes("dat1");
        const auto list = query ? platform::readPropertyList(*query) : std::nullopt;
        const auto* token =
            list && list->dictionary() ? list->dictionary()->find("tokid") : nullptr;
        if (!token || !token->text()) return std::nullopt;
        return *token->text();
    }

    bool holds(const std::string& token, const platform::Bytes& hash) const {
        for (const auto& card : _cards)
            for (const auto& identity : card.identities)
                if (card.identifier == token && identity.hash == hash) return true;
        return false;
    }

    bool isPaired(const std::string& account) const {
        return std::ranges::any_of(pairings,
                                   [&](const auto& each) { return each.first == account; });
    }

    bool isPaired(const platform::Bytes& hash) const {
        return std::ranges::any_of(pairings, [&](const auto& each) { return each.second == hash; });
    }

    // Of an account's pairings on these cards the latest is used for authentication.
    platform::PropertyList record(const std::optional<std::string>& token) const {
        Array tnh, tni, unk, unv, hsk, hsv, uth, uti, fnh, fni;
        Dictionary hsh, ftn;
        for (const auto& card : _cards) {
            if (token && card.identifier != *token) continue;
            ftn.set(card.identifier, card.name);
            if (card.wrapKeyHash) {
                uth.emplace_back(*card.wrapKeyHash);
                uti.emplace_back(card.identifier);
            }
            for (const auto& identity : card.identities) {
                tnh.emplace_back(identity.hash);
                tni.emplace_back(card.identifier);
                fnh.emplace_back(identity.hash);
                fni.emplace_back(identity.name);
                if (!identity.offered || isPaired(identity.hash)) continue;
                unk.emplace_back(identity.hash);
                unv.emplace_back(identity.name);
            }
        }
        for (const auto& [account, hash] : pairings) {
            hsk.emplace_back(hash);
            hsv.emplace_back(account);
            if (std::ranges::find(tnh, platform::PropertyList(hash)) != tnh.end())
                hsh.set(account, hash);
        }
        return Dictionary{{"tnh", tnh}, {"tni", tni}, {"unk", unk}, {"unv", unv},
                          {"hsk", hsk}, {"hsv", hsv}, {"uth", uth}, {"uti", uti},
                          {"fnh", fnh}, {"fni", fni}, {"hsh", hsh}, {"ftn", ftn}};
    }

    std::vector<Card> _cards;
    std::map<std::uint64_t, platform::Message> _scripted;
};

}  // namespace vlm::fakes
