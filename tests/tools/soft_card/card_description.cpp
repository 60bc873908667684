#include "tests/tools/soft_card/card_description.h"

#include <charconv>
#include <functional>
#include <map>

namespace vlm::test {
namespace {

using Setter = std::function<bool(std::string value)>;
using Settings = std::map<std::string, Setter, std::less<>>;

std::optional<std::string> decode(std::string_view text) {
    std::string decoded;
    for (std::size_t i = 0; i < text.size(); ++i) {
        if (text[i] != '%') {
            decoded += text[i];
            continue;
        }
        unsigned byte = 0;
        const std::string_view digits = text.substr(i + 1, 2);
        const auto [end, error] =
            std::from_chars(digits.data(), digits.data() + digits.size(), byte, 16);
        if (error != std::errc() || digits.size() != 2 || end != digits.data() + 2) return {};
        decoded += static_cast<char>(byte);
        i += 2;
    }
    return decoded;
}

std::string encode(std::string_view text) {
    constexpr char kDigits[] = "0123456789ABCDEF";
    std::string encoded;
    for (const char c : text) {
        if (c > ' ' && c < 0x7F && c != '%') {
            encoded += c;
        } else {
            const auto byte = static_cast<unsigned char>(c);
            encoded += {'%', kDigits[byte >> 4U], kDigits[byte & 15U]};
        }
    }
    return encoded;
}

Setter intoText(std::string& place) {
    return [&place](std::string value) {
        place = std::move(value);
        return true;
    };
}

Setter intoNumber(int& place) {
    return [&place](const std::string& value) {
        const char* end = value.data() + value.size();
        const auto [last, error] = std::from_chars(value.data(), end, place);
        return error == std::errc() && last == end;
    };
}

Setter intoFlag(bool& place) {
    return [&place](const std::string& value) {
        place = value == "yes";
        return place || value == "no";
    };
}

Settings settingsOf(Card& card) {
    return {{"label", intoText(card.label)}, {"pin", intoText(card.pin)}};
}

Settings settingsOf(CardCertificate& certificate) {
    return {{"cn", intoText(certificate.commonName)},
            {"email", intoText(certificate.email)},
            {"alternate-name", intoText(certificate.alternateName)},
            {"key-usage", intoText(certificate.keyUsage)},
            {"from", intoNumber(certificate.fromDay)},
            {"until", intoNumber(certificate.untilDay)}};
}

Settings settingsOf(CardIdentity& identity) {
    Settings settings = {{"key", intoText(identity.key)},
                         {"id", intoText(identity.id)},
                         {"label", intoText(identity.label)},
                         {"private-key", intoFlag(identity.privateKey)},
                         {"public-key", intoFlag(identity.publicKey)},
                         {"hidden", intoFlag(identity.publicKeyHidden)},
                         {"sign", intoFlag(identity.sign)},
                         {"decrypt", intoFlag(identity.decrypt)},
                         {"derive", intoFlag(identity.derive)},
                         {"always-authenticate", intoFlag(identity.alwaysAuthenticate)}};
    if (!identity.certificates.empty()) settings.merge(settingsOf(identity.certificates.front()));
    return settings;
}

}  // namespace

std::optional<std::vector<Card>> readCards(const std::vector<std::string>& words,
                                           std::string* reason) {
    std::vector<Card> cards;
    Settings settings;
    for (const std::string& word : words) {
        if (word == "token") {
            settings = settingsOf(cards.emplace_back());
        } else if (word == "identity" && !cards.empty()) {
            settings = settingsOf(cards.back().identities.emplace_back());
        } else if (word == "certificate" && !cards.empty() && !cards.back().identities.empty()) {
            settings = settingsOf(cards.back().identities.back().certificates.emplace_back());
        } else if (word == "no-certificate" && !cards.empty() && !cards.back().identities.empty()) {
            cards.back().identities.back().certificates.clear();
            settings = settingsOf(cards.back().identities.back());
        } else {
            const std::size_t equals = word.find('=');
            const auto setting = settings.find(word.substr(0, equals));
            const auto value = equals == std::string::npos
                                   ? std::nullopt
                                   : decode(std::string_view(word).substr(equals + 1));
            if (setting == settings.end() || !value || !setting->second(*value)) {
                *reason = "not understood here: " + word;
                return {};
            }
        }
    }
    return cards;
}

std::vector<std::string> describeCard(const Card& card) {
    std::vector<std::string> words;
    const auto say = [&words](const char* name, const std::string& value) {
        words.push_back(std::string(name) + "=" + encode(value));
    };
    const auto sayFlag = [&say](const char* name, bool value) { say(name, value ? "yes" : "no"); };
    const auto sayCertificate = [&say](const CardCertificate& certificate) {
        say("cn", certificate.commonName);
        say("email", certificate.email);
        say("alternate-name", certificate.alternateName);
        say("key-usage", certificate.keyUsage);
        say("from", std::to_string(certificate.fromDay));
        say("until", std::to_string(certificate.untilDay));
    };

    words.emplace_back("token");
    say("label", card.label);
    say("pin", card.pin);
    for (const CardIdentity& identity : card.identities) {
        words.emplace_back("identity");
        say("key", identity.key);
        say("id", identity.id);
        say("label", identity.label);
        sayFlag("private-key", identity.privateKey);
        sayFlag("public-key", identity.publicKey);
        sayFlag("hidden", identity.publicKeyHidden);
        sayFlag("sign", identity.sign);
        sayFlag("decrypt", identity.decrypt);
        sayFlag("derive", identity.derive);
        sayFlag("always-authenticate", identity.alwaysAuthenticate);
        if (identity.certificates.empty()) words.emplace_back("no-certificate");
        for (std::size_t i = 0; i < identity.certificates.size(); ++i) {
            if (i > 0) words.emplace_back("certificate");
            sayCertificate(identity.certificates[i]);
        }
    }
    return words;
}

CardIdentity identity(std::string key, std::string commonName) {
    CardIdentity identity;
    identity.key = std::move(key);
    identity.certificates.front().commonName = std::move(commonName);
    return identity;
}

}  // namespace vlm::test
