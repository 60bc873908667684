#include "binary_example_file.h"

#include <charconv>
#include <sstream>
#include <stdexcept>

#include "binary_list.h"

namespace vlm::platform {

namespace {

constexpr std::string_view kDigits = "0123456789ABCDEF";

bool isHex(std::string_view text) {
    return !text.empty() && text.size() % 2 == 0 &&
           text.find_first_not_of(kDigits) == std::string_view::npos;
}

std::optional<std::uint64_t> number(std::string_view text, int base) {
    std::uint64_t value = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), value, base);
    if (error != std::errc{} || end != text.data() + text.size()) return std::nullopt;
    return value;
}

struct Halves {
    std::string_view before;
    std::optional<std::string_view> behind;  // none when the separator is not there
};

Halves split(std::string_view text, std::string_view separator) {
    const std::size_t at = text.find(separator);
    if (at == std::string_view::npos) return {text, {}};
    return {text.substr(0, at), text.substr(at + separator.size())};
}

bool appendRange(Bytes& bytes, std::string_view first, std::string_view lastAndStep) {
    const auto [last, step] = split(lastAndStep, "+");
    const auto begin = number(first, 16);
    const auto end = number(last, 16);
    const auto apart = number(step.value_or("1"), 10);
    if (!isHex(first) || first.size() != last.size() || !begin || !end || apart.value_or(0) == 0)
        return false;
    for (std::uint64_t each = *begin; each <= *end; each += *apart)
        appendNumber(bytes, each, first.size() / 2);
    return true;
}

std::string_view trimmed(std::string_view text) {
    const std::size_t begin = text.find_first_not_of(' ');
    if (begin == std::string_view::npos) return {};
    return text.substr(begin, text.find_last_not_of(' ') + 1 - begin);
}

class Reader {
public:
    explicit Reader(std::istream& file) : _file(file) {}

    std::vector<BinaryExample> read() {
        for (std::string line; std::getline(_file, line);) {
            ++_line;
            if (line.starts_with('#')) continue;
            if (trimmed(line).empty())
                finish();
            else if (line.starts_with(' '))
                takeBytes(split(line, "#").before);
            else
                takeField(line);
        }
        finish();
        return std::move(_examples);
    }

private:
    [[noreturn]] void fail(const std::string& what) const {
        throw std::runtime_error("line " + std::to_string(_line) + ": " + what);
    }

    void takeField(std::string_view line) {
        const auto [field, rest] = split(line, ":");
        const std::string_view content = trimmed(rest.value_or(""));
        if (field == "name") {
            _current.emplace().name = content;
        } else if (!_current) {
            fail("an example begins with its name");
        } else if (field == "why") {
            _current->why = content;
        } else if (field == "form") {
            takeForm(content);
        } else if (field == "value") {
            _current->value = exampleValue(content);
            if (!_current->value) fail("this is no value");
        } else {
            fail("there is no such field");
        }
    }

    void takeForm(std::string_view form) {
        if (form == "canonical")
            _current->form = ExampleForm::Canonical;
        else if (form == "readable")
            _current->form = ExampleForm::Readable;
        else if (form == "malformed")
            _current->form = ExampleForm::Malformed;
        else
            fail("there is no such form");
        _hasForm = true;
    }

    // An offset that is not where the bytes come to lie is a mistake in the working.
    void takeBytes(std::string_view line) {
        if (!_current) fail("an example begins with its name");
        const auto [offset, tokens] = split(trimmed(line), ":");
        if (number(offset, 16) != _current->bytes.size()) {
            std::ostringstream place;
            place << std::hex << std::uppercase << _current->bytes.size();
            fail("these bytes lie at " + place.str());
        }
        std::istringstream all{std::string(tokens.value_or(""))};
        for (std::string token; all >> token;)
            if (!appendToken(_current->bytes, token)) fail("'" + token + "' stands for no bytes");
    }

    void finish() {
        if (!_current) return;
        if (_current->why.empty() || !_hasForm) fail("an example needs a why and a form");
        if ((_current->form == ExampleForm::Malformed) == _current->value.has_value())
            fail("an example has a value unless it is malformed");
        _examples.push_back(std::move(*_current));
        _current.reset();
        _hasForm = false;
    }

    std::istream& _file;
    std::size_t _line = 0;
    std::optional<BinaryExample> _current;
    bool _hasForm = false;
    std::vector<BinaryExample> _examples;
};

}  // namespace

bool appendToken(Bytes& bytes, std::string_view token) {
    if (const auto [first, last] = split(token, ".."); last)
        return appendRange(bytes, first, *last);
    const auto [digits, times] = split(token, "*");
    const auto count = number(times.value_or("1"), 10);
    if (!isHex(digits) || !count) return false;
    const Bytes once = fromHex(digits);
    for (std::uint64_t each = 0; each < *count; ++each) append(bytes, once);
    return true;
}

std::vector<BinaryExample> readBinaryExamples(std::istream& file) { return Reader(file).read(); }

}  // namespace vlm::platform
