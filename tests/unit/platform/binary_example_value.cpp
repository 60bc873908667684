// The notation of values in the file of examples: like JSON, but each kind of a list has a form.

#include <charconv>
#include <limits>
#include <sstream>

#include "binary_example_file.h"
#include "binary_list.h"

namespace vlm::platform {

namespace {

class Notation {
public:
    explicit Notation(std::string_view text) : _rest(text) {}

    std::optional<PropertyList> whole() {
        auto value = next();
        if (!value || !_rest.empty()) return std::nullopt;
        return value;
    }

private:
    std::optional<PropertyList> next() {
        if (take("false")) return false;
        if (take("true")) return true;
        if (take("real ")) return asValue(real());
        if (take("date ")) return date();
        if (take("<")) return bytes();
        if (take("\"")) return text();
        if (take("[")) return array();
        if (take("{")) return dictionary();
        if (_rest.starts_with('-')) return asValue(plain<std::int64_t>());
        return asValue(plain<std::uint64_t>());
    }

    template <typename Number>
    static std::optional<PropertyList> asValue(std::optional<Number> number) {
        if (!number) return std::nullopt;
        return PropertyList(*number);
    }

    bool take(std::string_view word) {
        if (!_rest.starts_with(word)) return false;
        _rest.remove_prefix(word.size());
        return true;
    }

    template <typename Number>
    std::optional<Number> plain() {
        Number number = 0;
        const char* const end = _rest.data() + _rest.size();
        const auto [stop, error] = std::from_chars(_rest.data(), end, number);
        if (error != std::errc{}) return std::nullopt;
        _rest.remove_prefix(static_cast<std::size_t>(stop - _rest.data()));
        return number;
    }

    std::optional<double> real() { return plain<double>(); }  // "inf" and "-inf" too

    std::optional<PropertyList> date() {
        const auto seconds = real();
        if (!seconds) return std::nullopt;
        return PropertyList::Date{*seconds};
    }

    std::optional<PropertyList> bytes() {
        const std::size_t end = _rest.find('>');
        if (end == std::string_view::npos) return std::nullopt;
        Bytes bytes;
        std::istringstream tokens{std::string(_rest.substr(0, end))};
        for (std::string token; tokens >> token;)
            if (!appendToken(bytes, token)) return std::nullopt;
        _rest.remove_prefix(end + 1);
        return bytes;
    }

    // A text in quotes, whose first one was taken, and how often it is repeated.
    std::optional<std::string> text() {
        std::string once;
        while (!take("\"")) {
            if (_rest.empty()) return std::nullopt;
            if (take("\\x")) {
                if (_rest.size() < 2 || !appendHexDigits(once)) return std::nullopt;
                continue;
            }
            take("\\");
            if (_rest.empty()) return std::nullopt;
            once += _rest.front();
            _rest.remove_prefix(1);
        }
        return repeated(once);
    }

    bool appendHexDigits(std::string& text) {
        Bytes byte;
        if (!appendToken(byte, _rest.substr(0, 2))) return false;
        text.append(byte.begin(), byte.end());
        _rest.remove_prefix(2);
        return true;
    }

    // How often whatever stands before this is there.
    std::optional<std::uint64_t> times() {
        return take("*") ? plain<std::uint64_t>() : std::optional<std::uint64_t>(1);
    }

    std::optional<std::string> repeated(const std::string& once) {
        const auto count = times();
        if (!count) return std::nullopt;
        std::string text;
        for (std::uint64_t each = 0; each < *count; ++each) text += once;
        return text;
    }

    std::optional<PropertyList> array() {
        PropertyList::Array array;
        while (!take("]")) {
            if (!array.empty() && !take(", ")) return std::nullopt;
            const auto each = next();
            const auto count = times();
            if (!each || !count) return std::nullopt;
            array.insert(array.end(), *count, *each);
        }
        return array;
    }

    std::optional<PropertyList> dictionary() {
        PropertyList::Dictionary dictionary;
        while (!take("}")) {
            if (!dictionary.empty() && !take(", ")) return std::nullopt;
            auto key = take("\"") ? text() : std::nullopt;
            if (!key || dictionary.contains(*key) || !take(": ")) return std::nullopt;
            auto value = next();
            if (!value) return std::nullopt;
            dictionary.append(std::move(*key), std::move(*value));
        }
        return dictionary;
    }

    std::string_view _rest;
};

}  // namespace

std::optional<PropertyList> exampleValue(std::string_view notation) {
    return Notation(notation).whole();
}

}  // namespace vlm::platform
