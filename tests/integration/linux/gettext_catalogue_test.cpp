#include "platform/linux/gettext_catalogue.h"

#include <gtest/gtest.h>

#include <fstream>
#include <sstream>

#include "tests/integration/linux/child.h"
#include "tests/integration/linux/temporary_folder.h"

namespace vlm::test {

namespace {

using platform::GettextCatalogue;

constexpr const char* kSource =
    "msgid \"\"\n"
    "msgstr \"Content-Type: text/plain; charset=UTF-8\\n\"\n"
    "msgid \"FIRST\"\n"
    "msgstr \"one\\ntwo\"\n"
    "msgid \"SECOND\"\n"
    "msgstr \"gr\xC3\xBC\xC3\x9F\"\n"
    "msgid \"UNTRANSLATED\"\n"
    "msgstr \"\"\n";

// What the translators' own compiler makes of the source.
std::string compiled(const std::vector<std::string>& options = {}) {
    const TemporaryFolder folder;
    std::vector<std::string> command{"msgfmt", "--output-file", folder.path() / "Bind.mo",
                                     folder.write("Bind.po", kSource)};
    command.insert(command.end(), options.begin(), options.end());
    const auto ended = run(command);
    EXPECT_EQ(ended.status, 0) << ended.errors;
    std::ifstream stream(folder.path() / "Bind.mo", std::ios::binary);
    std::ostringstream content;
    content << stream.rdbuf();
    return content.str();
}

// A catalogue of the words given, each four bytes with the least significant first.
std::string words(std::initializer_list<std::uint32_t> values) {
    std::string bytes;
    for (const auto value : values)
        for (unsigned shift = 0; shift < 32; shift += 8)
            bytes += static_cast<char>(value >> shift & 0xFFU);
    return bytes;
}

TEST(GettextCatalogueTest, ReadsWhatTheCompilerWritesInEitherByteOrder) {
    for (const auto* order : {"--endianness=little", "--endianness=big"}) {
        const auto catalogue = GettextCatalogue::parse(compiled({order}));

        ASSERT_TRUE(catalogue) << order;
        EXPECT_EQ(catalogue->text("FIRST"), "one\ntwo") << order;
        EXPECT_EQ(catalogue->text("SECOND"), "gr\xC3\xBC\xC3\x9F") << order;
    }
}

TEST(GettextCatalogueTest, HasNoTextForOtherKeys) {
    const auto catalogue = GettextCatalogue::parse(compiled());

    ASSERT_TRUE(catalogue);
    EXPECT_EQ(catalogue->text("THIRD"), "");
    EXPECT_EQ(catalogue->text("UNTRANSLATED"), "");
    EXPECT_EQ(catalogue->text(""), "") << "the header is no text";
}

TEST(GettextCatalogueTest, RefusesWhatIsNotWellFormed) {
    constexpr std::uint32_t kMagic = 0x950412DE;
    struct Row {
        const char* why;
        std::string content;
    };
    const Row rows[] = {
        {"nothing", ""},
        {"something else", "#!/bin/sh and so on and on and on"},
        {"a later revision", words({kMagic, 0x10000, 0, 28, 28, 0, 0})},
        {"keys outside", words({kMagic, 0, 1, 4000, 28, 0, 0, 1, 0})},
        {"texts outside", words({kMagic, 0, 1, 28, 0xFFFFFFFF, 0, 0, 1, 0})},
        {"a key that is too long", words({kMagic, 0, 1, 28, 36, 0, 0, 100, 0, 1, 0})},
        {"a key far away", words({kMagic, 0, 1, 28, 36, 0, 0, 1, 0xFFFFFFFF, 1, 0})},
        {"a length that wraps around", words({kMagic, 0, 1, 28, 36, 0, 0, 0xFFFFFFFF, 4, 1, 0})},
        {"very many entries", words({kMagic, 0, 0xFFFFFFFF, 28, 28, 0, 0, 1, 0})},
        {"texts that overlap to much more than the file holds",
         words({kMagic, 0, 4, 28, 28, 0, 0, 60, 0, 59, 1, 58, 2, 57, 3})},
    };
    for (const auto& row : rows) EXPECT_FALSE(GettextCatalogue::parse(row.content)) << row.why;
}

TEST(GettextCatalogueTest, RefusesOrReadsAnyPartOfAFile) {
    const auto whole = compiled();

    for (std::size_t size = 0; size < whole.size(); ++size) {
        const auto catalogue = GettextCatalogue::parse(whole.substr(0, size));
        EXPECT_TRUE(!catalogue || catalogue->text("FIRST") == "one\ntwo") << size;
    }
}

TEST(GettextCatalogueTest, TakesAFileThatIsNotThereOrNoFileForNone) {
    const TemporaryFolder folder;

    EXPECT_FALSE(GettextCatalogue::read(folder.path() / "absent.mo"));
    EXPECT_FALSE(GettextCatalogue::read(folder.path()));
}

}  // namespace

}  // namespace vlm::test
