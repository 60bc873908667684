// What a software card is to hold, and the words that say so.
//
// One card is the word "token" with its settings, then "identity" words with theirs; "certificate"
// adds one more certificate to the identity before it, "no-certificate" takes its only one away. A
// setting is name=value; in a value %XX is the byte with that hexadecimal number.
//
//   token label=Demo pin=123456
//   identity key=rsa2048 cn=Alice%20Example
//   identity key=p256 id=05 label=login cn=Bob from=-20 until=-10

#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace vlm::test {

struct CardCertificate {
    std::string commonName{};
    std::string email{};          // in the subject
    std::string alternateName{};  // OpenSSL's notation, as in "email:alice@example.org"
    std::string keyUsage{};       // OpenSSL's notation; empty leaves the extension out
    int fromDay = -1;             // validity in days from now
    int untilDay = 365;
};

struct CardIdentity {
    std::string key = "p256";  // rsa2048, rsa3072, rsa4096, p256, p384, p521
    std::string id;            // hexadecimal; empty takes the identity's number on its card
    std::string label;
    std::vector<CardCertificate> certificates = {CardCertificate{}};
    bool privateKey = true;
    bool publicKey = true;
    bool publicKeyHidden = false;  // seen after login only
    bool sign = true;
    bool decrypt = true;  // RSA
    bool derive = true;   // EC
    bool alwaysAuthenticate = false;
};

struct Card {
    std::string label{};
    std::string pin = "123456";
    std::vector<CardIdentity> identities{};
};

// The cards that the words describe; none, with the reason, when a word is not understood.
std::optional<std::vector<Card>> readCards(const std::vector<std::string>& words,
                                           std::string* reason);

// The words that describe the card; readCards() reads them back.
std::vector<std::string> describeCard(const Card& card);

// An identity with one certificate, as most tests want it.
CardIdentity identity(std::string key, std::string commonName);

}  // namespace vlm::test
