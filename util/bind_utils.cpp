#include "util/bind_utils.h"

#include <algorithm>
#include <array>
#include <cstdint>
#include <string_view>

#include "platform/accounts.h"
#include "platform/console_sessions.h"
#include "platform/platform.h"
#include "platform/process_info.h"
#include "platform/text.h"
#include "platform/token_framework.h"
#include "platform/utf.h"

namespace vlm {

using platform::Bytes;
using platform::UserId;

namespace {

// The text's UTF-16 units without the spaces, each cut down to its low eight bits.
std::optional<Bytes> lowBytesWithoutSpaces(const std::string& text) {
    const auto utf16 = platform::utf8ToUtf16(text);
    if (!utf16) return std::nullopt;
    Bytes bytes;
    bytes.reserve(utf16->size());
    for (const char16_t unit : *utf16)
        if (unit != u' ') bytes.push_back(static_cast<std::uint8_t>(unit & 0xFFU));
    return bytes;
}

bool isWhiteSpace(std::uint8_t unit) { return unit == ' ' || (unit >= '\t' && unit <= '\r'); }

std::optional<unsigned> digitValue(std::uint8_t unit) {
    if (unit >= '0' && unit <= '9') return unit - unsigned{'0'};
    if (unit >= 'A' && unit <= 'F') return unit - unsigned{'A'} + 10;
    if (unit >= 'a' && unit <= 'f') return unit - unsigned{'a'} + 10;
    return std::nullopt;
}

// Reads two characters as strtol() with base 16 does in the C locale, and keeps the low byte: white
// space, a sign, then digits up to the first character that is none. A prefix "0x" needs no rule
// of its own: it leaves no room for digits, and its zero is the value.
std::uint8_t byteFromPair(std::array<std::uint8_t, 2> pair) {
    const auto* next = pair.begin();
    while (next != pair.end() && isWhiteSpace(*next)) ++next;
    const bool negative = next != pair.end() && *next == '-';
    if (negative || (next != pair.end() && *next == '+')) ++next;

    unsigned value = 0;
    for (; next != pair.end(); ++next) {
        const auto digit = digitValue(*next);
        if (!digit) break;
        value = value * 16 + *digit;
    }
    return static_cast<std::uint8_t>(negative ? 0 - value : value);
}

}  // namespace

std::optional<std::string> BindUtils::currentUserName() {
    return userNameForUserId(platform::current().processInfo().realUserId());
}

UserId BindUtils::userIdForUserName(const std::string& userName) {
    return platform::current().accounts().userId(userName).value_or(0);
}

std::optional<std::string> BindUtils::userNameForUserId(UserId userId) {
    return platform::current().accounts().userName(userId);
}

// The first session on console decides, also when more follow. The superuser at the console counts
// as nobody: a desktop agent must never act for root.
UserId BindUtils::currentLoggedInUserId() {
    const auto sessions = platform::current().consoleSessions().sessions();
    if (!sessions) return platform::kNobody;
    const auto atConsole = std::ranges::find_if(*sessions, &platform::ConsoleSession::onConsole);
    const UserId user = atConsole == sessions->end() ? 0 : atConsole->userId;
    return user == 0 ? platform::kNobody : user;
}

std::string BindUtils::processOwnerUserName() {
    return platform::current().processInfo().ownerUserName();
}

std::optional<std::string> BindUtils::dataToHex(const std::optional<Bytes>& data) {
    if (!data) return std::nullopt;
    return platform::hexadecimal(*data);
}

std::optional<Bytes> BindUtils::dataFromHex(const std::optional<std::string>& text) {
    const auto digits = text ? lowBytesWithoutSpaces(*text) : std::nullopt;
    if (!digits) return std::nullopt;
    Bytes data;
    data.reserve(digits->size() / 2);
    for (std::size_t i = 0; i + 1 < digits->size(); i += 2)
        data.push_back(byteFromPair({(*digits)[i], (*digits)[i + 1]}));
    return data;
}

const platform::Log& BindUtils::log() {
    static const platform::Log handle(platform::kTokenFramework, "vlmbind");
    return handle;
}

}  // namespace vlm
