#include "platform/string.h"

#include <algorithm>

#include "platform/utf.h"

namespace vlm::platform {

namespace {

constexpr char32_t kReplacement = 0xFFFD;

TextPiece firstOf(std::string_view text) { return firstOfUtf8(text); }
TextPiece firstOf(std::u16string_view text) { return firstOfUtf16(text); }

std::size_t utf16Length(std::u16string_view text) { return text.size(); }

std::size_t utf16Length(std::string_view text) {
    std::size_t length = 0;
    while (!text.empty()) {
        const TextPiece piece = firstOfUtf8(text);
        length += piece.character.value_or(kReplacement) > 0xFFFF ? 2 : 1;
        text.remove_prefix(piece.units);
    }
    return length;
}

// Straight into the buffer, without a copy in between that would outlive a secret.
template <typename View>
bool copyAsUtf8(View text, std::span<char> buffer) {
    while (!text.empty()) {
        const TextPiece piece = firstOf(text);
        if (!piece.character) return false;
        const Utf8Character character = encodeUtf8(*piece.character);
        if (character.size > buffer.size()) return false;
        std::ranges::copy(character.view(), buffer.begin());
        buffer = buffer.subspan(character.size);
        text.remove_prefix(piece.units);
    }
    if (buffer.empty()) return false;
    buffer.front() = '\0';
    return true;
}

template <typename View>
std::string readable(View text) {
    std::string utf8;
    while (!text.empty()) {
        const TextPiece piece = firstOf(text);
        utf8 += encodeUtf8(piece.character.value_or(kReplacement)).view();
        text.remove_prefix(piece.units);
    }
    return utf8;
}

// Runs the function on a view of the text, in the encoding that it is stored in.
template <typename Storage, typename Function>
auto onView(const Storage& storage, Function function) {
    if (const auto* utf8 = std::get_if<std::string>(&storage))
        return function(std::string_view(*utf8));
    return function(std::u16string_view(std::get<std::u16string>(storage)));
}

}  // namespace

String String::fromUtf16(std::u16string utf16) { return String(std::move(utf16)); }

std::optional<std::string_view> String::directUtf8() const {
    if (const auto* utf8 = std::get_if<std::string>(&_storage)) return *utf8;
    return std::nullopt;
}

std::size_t String::length() const {
    return onView(_storage, [](auto text) { return utf16Length(text); });
}

bool String::copyUtf8(std::span<char> buffer) const {
    return onView(_storage, [buffer](auto text) { return copyAsUtf8(text, buffer); });
}

std::string String::utf8() const {
    return onView(_storage, [](auto text) { return readable(text); });
}

}  // namespace vlm::platform
