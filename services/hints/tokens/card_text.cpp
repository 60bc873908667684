#include "services/hints/tokens/card_text.h"

#include "platform/harmless_text.h"

namespace vlm::service {
namespace {

std::string_view trimmed(std::string_view text) {
    const auto isPadding = [](char c) { return c == ' ' || c == '\0'; };
    while (!text.empty() && isPadding(text.front())) text.remove_prefix(1);
    while (!text.empty() && isPadding(text.back())) text.remove_suffix(1);
    return text;
}

}  // namespace

std::string cardText(std::string_view text, std::size_t most) {
    return platform::harmlessText(trimmed(text), most);
}

}  // namespace vlm::service
