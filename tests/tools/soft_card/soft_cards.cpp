#include "tests/tools/soft_card/soft_cards.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdlib>
#include <fstream>
#include <set>

namespace vlm::test {
namespace {

namespace fs = std::filesystem;

// In memory where that is possible: the module cuts and writes a file for each attribute that it
// stores, and on a disk it would wait for each.
fs::path makeFolder() {
    for (const fs::path& parent : {fs::path("/dev/shm"), fs::temp_directory_path()}) {
        std::string pattern = parent / "vlm-cards-XXXXXX";
        if (mkdtemp(pattern.data()) != nullptr) return pattern;
    }
    return {};
}

std::set<fs::path> entriesOf(const fs::path& folder) {
    std::set<fs::path> entries;
    for (const auto& entry : fs::directory_iterator(folder)) entries.insert(entry.path());
    return entries;
}

}  // namespace

SoftCards::SoftCards() : _folder(makeFolder()) {
    if (_folder.empty()) {
        ADD_FAILURE() << "no folder for software cards can be made";
        std::abort();
    }
    fs::create_directory(tokenStore());
    fs::create_directory(moduleDirectory());
    std::ofstream(_folder / "softhsm2.conf")
        << "directories.tokendir = " << tokenStore().string() << "\nobjectstore.backend = file"
        << "\nlog.level = ERROR"
        << "\nslots.removable = true\n";
    configureModule("softhsm", "module: " + modulePath() + "\n");
}

SoftCards::~SoftCards() {
    std::error_code ignored;
    fs::remove_all(_folder, ignored);
}

void SoftCards::add(const std::string& label, std::vector<CardIdentity> identities) {
    add(Card{.label = label, .identities = std::move(identities)});
}

void SoftCards::add(const Card& card) {
    const auto before = entriesOf(tokenStore());
    add(std::vector{card});
    for (const fs::path& entry : entriesOf(tokenStore()))
        if (!before.contains(entry)) _tokensByLabel.emplace(card.label, entry);
}

void SoftCards::add(const std::vector<Card>& cards) {
    std::string description;
    for (const Card& card : cards)
        for (const std::string& word : describeCard(card)) description += word + "\n";
    const auto result = run({VLM_SOFT_CARD}, {.environment = environment()}, description);
    ASSERT_EQ(result.status, 0) << result.errors;
}

void SoftCards::remove(const std::string& label) {
    const auto [first, last] = _tokensByLabel.equal_range(label);
    ASSERT_NE(first, last) << "no card is called " << label;
    for (auto token = first; token != last; ++token) fs::remove_all(token->second);
    _tokensByLabel.erase(first, last);
}

Child::Environment SoftCards::environment() const {
    return {{"SOFTHSM2_CONF", _folder / "softhsm2.conf"}};
}

void SoftCards::configureModule(const std::string& name, const std::string& content) {
    std::ofstream(fs::path(moduleDirectory()) / (name + ".module")) << content;
}

std::string SoftCards::modulePath() { return VLM_SOFTHSM_MODULE; }

}  // namespace vlm::test
