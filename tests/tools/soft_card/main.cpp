// soft-card: makes software cards in the token store that SOFTHSM2_CONF names, from a description
// in its arguments or, without any, on standard input.

#include <iostream>
#include <string>
#include <vector>

#include "tests/tools/soft_card/card_description.h"
#include "tests/tools/soft_card/soft_token.h"

int main(int argc, char* argv[]) {
    std::vector<std::string> words(argv + 1, argv + argc);
    if (words.empty())
        for (std::string word; std::cin >> word;) words.push_back(word);

    std::string reason;
    const auto cards = vlm::test::readCards(words, &reason);
    if (!cards || cards->empty()) {
        if (cards)
            reason = "usage: soft-card token label=NAME pin=PIN identity key=KIND cn=NAME ...";
        std::cerr << "soft-card: " << reason << "\n";
        return 2;
    }
    vlm::test::SoftTokenStore store(VLM_SOFTHSM_MODULE);
    for (const auto& card : *cards) {
        if (const auto failure = store.write(card)) {
            std::cerr << "soft-card: " << *failure << "\n";
            return 1;
        }
    }
    return 0;
}
