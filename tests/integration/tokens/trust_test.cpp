// Whom the machine trusts, told by real modules in worker processes, and what that means for a
// card.

#include <gmock/gmock.h>
#include <sys/stat.h>
#include <unistd.h>

#include <ctime>
#include <filesystem>
#include <fstream>

#include "services/hints/judged_tokens.h"
#include "services/hints/tokens/worker_anchors.h"
#include "tests/integration/tokens/tokens_test.h"

namespace vlm::test {
namespace {

using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::SizeIs;

class TrustedCardsTest : public TokensTest {
protected:
    // Its cards are those of the software module as well.
    void configureTrustModule(const std::string& name) {
        cards.configureModule(
            name, "module: " VLM_TEST_MODULES "/" + name + "_module.so\ntrust-policy: yes\n");
    }

    service::MachineAnchors readAnchors() {
        std::optional<service::MachineAnchors> told;
        anchors.read([&told](const service::MachineAnchors& all) { told = all; });
        EXPECT_FALSE(told) << "answered before the call returned";
        runUntil([&told] { return told.has_value(); });
        return told.value_or(service::MachineAnchors{});
    }

    std::vector<Token> listJudged() {
        service::CertificateTrust trust(service::TrustFolder(cards.folder() / "trust", geteuid()));
        service::JudgedTokens judged({tokens(), anchors, trust, [] { return true; },
                                      [] { return std::int64_t{std::time(nullptr)}; }});
        std::optional<std::vector<Token>> answer;
        judged.list([&answer](std::vector<Token> all) { answer = std::move(all); });
        runUntil([&answer] { return answer.has_value(); });
        return answer.value_or(std::vector<Token>{});
    }

    void putAnchor(const platform::Bytes& der) {
        const auto folder = cards.folder() / "trust" / "anchors";
        std::filesystem::create_directories(folder);
        std::ofstream(folder / "anchor.der", std::ios::binary)
            .write(reinterpret_cast<const char*>(der.data()),
                   static_cast<std::streamsize>(der.size()));
        for (const auto& path : {folder.parent_path(), folder}) chmod(path.c_str(), 0755);
        chmod((folder / "anchor.der").c_str(), 0644);
    }

    service::WorkerAnchors anchors{event(), options};
};

constexpr const char* kSelfSigned = "it is self-signed, and no anchor of this machine";

TEST_F(TrustedCardsTest, TakesTheAnchorsOfATrustModule) {
    cards.add("card", {identity("p256", "Alice")});
    configureTrustModule("trusting");

    const auto told = readAnchors();

    ASSERT_THAT(told.trusted, SizeIs(1));
    EXPECT_EQ(told.trusted[0], tokenCalled("card").identities.at(0).certificate);
    EXPECT_THAT(told.distrusted, IsEmpty());
    EXPECT_THAT(warnings(), IsEmpty());
}

TEST_F(TrustedCardsTest, TellsDistrustedCertificatesApart) {
    auto bad = identity("p256", "Mallory");
    bad.label = "distrusted";
    cards.add("card", {identity("p256", "Alice"), bad});
    configureTrustModule("trusting");

    const auto told = readAnchors();

    EXPECT_THAT(told.trusted, SizeIs(1));
    EXPECT_THAT(told.distrusted, SizeIs(1));
}

TEST_F(TrustedCardsTest, AreNoneOfAModuleThatCrashes) {
    configureTrustModule("aborting");

    EXPECT_THAT(readAnchors().trusted, IsEmpty());

    EXPECT_THAT(warnings(), ElementsAre(HasSubstr("the trust module aborting is of no use")));
}

TEST_F(TrustedCardsTest, AreReadFromThisMachinesOwnTrustModule) {
    if (service::configuredModules(service::ModuleFolders::ofThisMachine(),
                                   service::ModuleKind::Trust)
            .empty())
        GTEST_SKIP() << "no trust module is configured on this machine";
    options.folders = service::ModuleFolders::ofThisMachine();
    service::WorkerAnchors machine(event(), options);
    bool isAnswered = false;

    machine.read([&isAnswered](const service::MachineAnchors&) { isAnswered = true; });
    runUntil([&isAnswered] { return isAnswered; });

    EXPECT_THAT(warnings(), IsEmpty());
}

TEST_F(TrustedCardsTest, TrustsACardWhoseCertificateIsAnAnchorOfTheAdministrator) {
    cards.add("card", {identity("p256", "Alice")});
    ASSERT_EQ(listJudged().at(0).identities.at(0).distrust, kSelfSigned);

    putAnchor(tokenCalled("card").identities.at(0).certificate);

    EXPECT_EQ(listJudged().at(0).identities.at(0).distrust, "");
    EXPECT_THAT(warnings(), IsEmpty());
}

TEST_F(TrustedCardsTest, TrustsACardWhoseCertificateIsAnAnchorOfTheMachine) {
    cards.add("card", {identity("rsa2048", "Alice")});
    configureTrustModule("trusting");

    EXPECT_EQ(listJudged().at(0).identities.at(0).distrust, "");
}

}  // namespace
}  // namespace vlm::test
