#include "platform/utf.h"

#include <gtest/gtest.h>

namespace vlm::platform {
namespace {

TEST(UtfTest, LooksNoFurtherThanTheTextGoes) {
    const std::string_view utf8 = "\xE6\xB0\xB4";
    const std::u16string_view utf16 = u"\xD83D\xDCB3";

    EXPECT_EQ(firstOfUtf8(utf8).character, U'\u6C34');
    EXPECT_FALSE(firstOfUtf8(utf8.substr(0, 2)).character);
    EXPECT_EQ(firstOfUtf8(utf8.substr(0, 2)).units, 2u);
    EXPECT_EQ(firstOfUtf16(utf16).character, U'\U0001F4B3');
    EXPECT_FALSE(firstOfUtf16(utf16.substr(0, 1)).character);
    EXPECT_EQ(firstOfUtf16(utf16.substr(0, 1)).units, 1u);
}

TEST(UtfTest, ConvertsEveryCharacterThereAndBack) {
    for (char32_t character = 0; character <= 0x10FFFF; ++character) {
        if (character >= 0xD800 && character <= 0xDFFF) continue;
        const Utf8Character encoded = encodeUtf8(character);
        const TextPiece piece = firstOfUtf8(encoded.view());
        ASSERT_EQ(piece.character, character);
        ASSERT_EQ(piece.units, encoded.size);
        const auto utf16 = utf8ToUtf16(encoded.view());
        ASSERT_TRUE(utf16);
        ASSERT_EQ(utf16ToUtf8(*utf16), encoded.view());
    }
}

TEST(UtfTest, ConvertsNoTextWithAnIllFormedPiece) {
    EXPECT_EQ(utf8ToUtf16("abc\xFF"), std::nullopt);
    EXPECT_EQ(utf16ToUtf8(u"abc\xDCB3"), std::nullopt);
}

}  // namespace
}  // namespace vlm::platform
