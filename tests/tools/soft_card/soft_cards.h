// SoftCards: a set of software cards for one test, in a folder of its own that goes with it.
//
//   SoftCards cards;
//   cards.add("card1", {identity("rsa2048", "Alice Example")});
//   ... run a program with cards.environment() and cards.moduleDirectory() ...
//   cards.remove("card1");
//
// Nothing here loads a card module into the test's own process.

#pragma once

#include <filesystem>
#include <map>
#include <string>
#include <vector>

#include "tests/integration/linux/child.h"
#include "tests/tools/soft_card/card_description.h"

namespace vlm::test {

class SoftCards {
public:
    static constexpr const char* kPin = "123456";

    SoftCards();
    ~SoftCards();
    SoftCards(const SoftCards&) = delete;
    SoftCards& operator=(const SoftCards&) = delete;

    // Puts a card in; fails the running test when that does not work.
    void add(const std::string& label, std::vector<CardIdentity> identities);
    void add(const Card& card);

    // Puts many cards in at once, much faster; these stay in.
    void add(const std::vector<Card>& cards);

    // Pulls all cards out that were put in one by one under the label.
    void remove(const std::string& label);

    // What a program needs in its environment to see these cards.
    Child::Environment environment() const;

    // A folder of .module files with the software module in it.
    std::string moduleDirectory() const { return _folder / "modules"; }

    // One more .module file, or another content of one.
    void configureModule(const std::string& name, const std::string& content);

    // The folder of all this; a test may keep other files in it.
    const std::filesystem::path& folder() const { return _folder; }

    // The software module itself, for tools that take it by path.
    static std::string modulePath();

private:
    std::filesystem::path tokenStore() const { return _folder / "tokens"; }

    std::filesystem::path _folder;
    std::multimap<std::string, std::filesystem::path> _tokensByLabel;
};

}  // namespace vlm::test
