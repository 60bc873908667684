#include <map>
#include <set>

#include "fake_localization.h"
#include "platform/linux/gettext_localization.h"
#include "tests/contracts/localization_contract.h"
#include "tests/integration/linux/child.h"
#include "tests/integration/linux/probe.h"
#include "tests/integration/linux/temporary_folder.h"

namespace vlm::test {

namespace {

using platform::GettextLocalization;

class FakeLocalizationBackend : public contracts::FakeBackend<fakes::FakeLocalization> {
public:
    void translate(const std::string& key, const std::string& text) { get().translate(key, text); }
};

// Catalogues as a translator makes them.
class Catalogues {
public:
    void translate(const std::string& language, const std::string& key, const std::string& text) {
        auto& source = _sources[language];
        if (source.empty())
            source = "msgid \"\"\nmsgstr \"Content-Type: text/plain; charset=UTF-8\\n\"\n";
        source += "msgid \"" + key + "\"\nmsgstr \"" + text + "\"\n";
        const auto file = _folder.write(language + "/LC_MESSAGES/Bind.po", source);
        const auto ended =
            run({"msgfmt", "--output-file", file.parent_path() / "Bind.mo", file.string()});
        EXPECT_EQ(ended.status, 0) << ended.errors;
    }

    const std::filesystem::path& folder() const { return _folder.path(); }

private:
    TemporaryFolder _folder;
    std::map<std::string, std::string> _sources;
};

class GettextBackend {
public:
    std::optional<std::string> unavailable() { return std::nullopt; }
    GettextLocalization& get() { return _localization; }
    void translate(const std::string& key, const std::string& text) {
        _catalogues.translate("en", key, text);
    }

private:
    Catalogues _catalogues;
    GettextLocalization _localization{{_catalogues.folder()}, {"en"}};
};

TEST(GettextLocalizationTest, PrefersTheBestLanguageThatHasTheText) {
    Catalogues catalogues;
    catalogues.translate("de", "BOTH", "beide");
    catalogues.translate("en", "BOTH", "both");
    catalogues.translate("en", "ENGLISH", "english");
    GettextLocalization localization({catalogues.folder()}, {"fr", "de", "en"});

    EXPECT_EQ(localization.text("BOTH"), "beide");
    EXPECT_EQ(localization.text("ENGLISH"), "english");
    EXPECT_EQ(localization.text("NEITHER"), "");
}

TEST(GettextLocalizationTest, TakesTheFirstFolderThatHasTheLanguage) {
    Catalogues near, far;
    near.translate("en", "PLACE", "near");
    far.translate("en", "PLACE", "far");
    far.translate("de", "PLACE", "fern");

    EXPECT_EQ(GettextLocalization({near.folder(), far.folder()}, {"en"}).text("PLACE"), "near");
    EXPECT_EQ(GettextLocalization({near.folder(), far.folder()}, {"de"}).text("PLACE"), "fern");
}

TEST(GettextLocalizationTest, DerivesTheLanguagesFromTheEnvironment) {
    struct Row {
        const char* why;
        platform::LanguageEnvironment environment;
        std::vector<std::string> expected;
    };
    const Row rows[] = {
        {"nothing is set", {"", ""}, {"en"}},
        {"the plain locale", {"", "C"}, {"en"}},
        {"it has no use for LANGUAGE", {"de", "C"}, {"en"}},
        {"nor has its other name", {"de", "POSIX"}, {"en"}},
        {"a locale", {"", "de_AT.UTF-8"}, {"de_AT", "de", "en"}},
        {"a plain language", {"", "de"}, {"de", "en"}},
        {"a modifier",
         {"", "ca_ES.UTF-8@valencia"},
         {"ca_ES@valencia", "ca@valencia", "ca_ES", "ca", "en"}},
        {"LANGUAGE wins", {"fr_CA:pt", "de_AT.UTF-8"}, {"fr_CA", "fr", "pt", "en"}},
        {"also in the plain locale with UTF-8", {"de", "C.UTF-8"}, {"de", "en"}},
        {"English once", {"", "en_GB.UTF-8"}, {"en_GB", "en"}},
        {"English before others", {"en:de", "de_DE"}, {"en", "de"}},
        {"C ends the list", {"fr:C:de", "de_DE"}, {"fr", "en"}},
        {"empty pieces", {"::fr::", "de_DE"}, {"fr", "en"}},
        {"no way to other folders", {"../../evil:/etc:de/../fr", "de_DE"}, {"en"}},
    };
    for (const auto& row : rows)
        EXPECT_EQ(platform::wantedLanguages(row.environment), row.expected) << row.why;
}

std::string textInEnvironment(std::map<std::string, std::optional<std::string>> environment,
                              const std::string& key = "SC_IS_ALREADY_PAIRED") {
    for (const auto* name : {"LANGUAGE", "LC_ALL", "LC_MESSAGES", "LANG"})
        environment.try_emplace(name, std::nullopt);
    const auto ended = run(probe({"text", key}), {.environment = environment, .user = {}});
    EXPECT_EQ(ended.status, 0) << ended.errors;
    return ended.output;
}

TEST(InstalledTextsTest, AreEnglishInThePlainLocaleAndWithoutOne) {
    const std::string english = "This smart card is already paired with an account.";

    EXPECT_EQ(textInEnvironment({}), english);
    EXPECT_EQ(textInEnvironment({{"LC_ALL", "C"}}), english);
    EXPECT_EQ(textInEnvironment({{"LANG", "en_GB.UTF-8"}}), english);
    EXPECT_EQ(textInEnvironment({{"LANG", "tlh_XX.UTF-8"}}), english);
}

TEST(InstalledTextsTest, AreGermanForGermans) {
    const std::string german = "Diese Smartcard ist bereits mit einem Benutzerkonto gekoppelt.";

    EXPECT_EQ(textInEnvironment({{"LANG", "de_AT.UTF-8"}}), german);
    EXPECT_EQ(textInEnvironment({{"LANG", "en_US.UTF-8"}, {"LC_MESSAGES", "de_DE"}}), german);
    EXPECT_EQ(textInEnvironment({{"LANG", "en_US.UTF-8"}, {"LC_ALL", "de_DE"}}), german);
    EXPECT_EQ(textInEnvironment({{"LANG", "en_US.UTF-8"}, {"LANGUAGE", "tlh:de"}}), german);
    EXPECT_EQ(textInEnvironment({{"LANG", "de_DE"}, {"LC_ALL", ""}}), german);
}

TEST(InstalledTextsTest, NameTheReasonOfAFailedPairingInEveryLanguage) {
    std::set<std::string> seen;
    for (const std::string language :
         {"en_GB.UTF-8", "de_DE.UTF-8", "fr_CA.UTF-8", "es_MX.UTF-8", "it_IT.UTF-8", "pt_BR.UTF-8",
          "ja_JP.UTF-8", "zh_CN.UTF-8", "ar_EG.UTF-8"}) {
        const auto textOf = [&](const std::string& key) {
            return textInEnvironment({{"LANG", language}}, key);
        };
        EXPECT_NE(textOf("OK"), "") << language;
        EXPECT_NE(textOf("PAIRING_FAILED"), "") << language;
        EXPECT_EQ(textOf("PAIRING_FAILED").find("{}"), std::string::npos) << language;

        for (const std::string key : {"PAIRING_ERROR", "AUTH_ERROR"}) {
            const std::string pattern = textOf(key);
            EXPECT_NE(pattern.find("{}"), std::string::npos) << language << " " << key;
            EXPECT_EQ(pattern.find("{}"), pattern.rfind("{}")) << language << " " << key;
        }
        EXPECT_TRUE(seen.insert(textOf("PAIRING_ERROR") + textOf("PAIRING_FAILED")).second)
            << language;
    }
}

TEST(InstalledTextsTest, TellOfAPairingWithoutAnUnlockKeyInEveryLanguage) {
    for (const std::string key : {"STORE_UNLOCK_KEY_FAILED", "STORE_UNLOCK_KEY_FAILED_INFO"}) {
        const auto english = textInEnvironment({{"LANG", "en_GB.UTF-8"}}, key);
        const auto german = textInEnvironment({{"LANG", "de_DE.UTF-8"}}, key);
        EXPECT_NE(english, "") << key;
        EXPECT_NE(german, english) << key;
        for (const auto& text : {english, german})
            EXPECT_EQ(text.find("{}"), std::string::npos) << text;
    }
}

}  // namespace

}  // namespace vlm::test

namespace vlm::contracts {
INSTANTIATE_TYPED_TEST_SUITE_P(Fake, LocalizationContract, test::FakeLocalizationBackend);
INSTANTIATE_TYPED_TEST_SUITE_P(Gettext, LocalizationContract, test::GettextBackend);
}  // namespace vlm::contracts
