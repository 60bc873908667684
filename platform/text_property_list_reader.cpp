// The old text format, as people write it by hand:
//
//     { name = value; "other name" = ( one, two ); data = <0fb7 01>; }
//
// Shapes: values are text, data, arrays and dictionaries; there are no numbers. Braces around the
//         outermost dictionary may be left out, as in a file of translated strings.
// Choice: a single bare word is no list, since that would make one of nearly any file. A number
//         behind a backslash is a Unicode character, whatever it meant to older machines.

#include "platform/property_list_reading.h"
#include "platform/text_property_list_tokens.h"

namespace vlm::platform {

namespace {

class Reader {
public:
    Reader(std::string_view text, const PropertyListLimits& limits)
        : _tokens(text, _problem), _limits(limits), _budget(limits) {}

    PropertyListReading read() {
        auto value = document();
        if (value && _tokens.skipBlanks() && !_tokens.isAtEnd())
            fail("There is something behind the end of the list.");
        return std::move(_problem).with(std::move(value));
    }

private:
    std::nullopt_t fail(std::string_view sentence) {
        return _problem.at(_tokens.at(), std::string(sentence));
    }

    std::optional<PropertyList> document() {
        if (!_tokens.skipBlanks()) return std::nullopt;
        if (_tokens.isAtEnd()) return fail("There is nothing in it.");
        if (!_tokens.isText()) return value(0);

        const std::size_t start = _tokens.at();
        const bool isQuoted = _tokens.isQuote();
        if (!_budget.takeObjects(1)) return fail(kTooManyObjects);
        auto first = text();
        if (!first || !_tokens.skipBlanks()) return std::nullopt;
        if (isQuoted && _tokens.isAtEnd()) return PropertyList(std::move(*first));
        if (!_tokens.isNext('='))
            return _problem.at(start, "This is neither a list nor a key that '=' follows.");
        if (_limits.depth == 0) return fail(kTooDeep);
        if (!_budget.takeObjects(1)) return fail(kTooManyObjects);
        return dictionary(1, std::move(first));
    }

    std::optional<PropertyList> value(std::size_t depth) {
        if (!_tokens.skipBlanks()) return std::nullopt;
        if (!_budget.takeObjects(1)) return fail(kTooManyObjects);
        if (_tokens.isText()) return text();
        if (_tokens.isNext('<')) return data();
        const bool isArray = _tokens.isNext('(');
        if (!isArray && !_tokens.isNext('{')) return fail("There is a value missing here.");
        if (depth == _limits.depth) return fail(kTooDeep);
        return isArray ? array(depth + 1) : dictionary(depth + 1);
    }

    std::optional<std::string> text() {
        const std::size_t start = _tokens.at();
        auto text = _tokens.takeText();
        if (text && !_budget.takeBytes(text->size()))
            return _problem.at(start, std::string(kTooManyBytes));
        return text;
    }

    std::optional<PropertyList> data() {
        const std::size_t start = _tokens.at();
        auto bytes = _tokens.takeData();
        if (!bytes) return std::nullopt;
        if (!_budget.takeBytes(bytes->size()))
            return _problem.at(start, std::string(kTooManyBytes));
        return PropertyList(std::move(*bytes));
    }

    // A comma behind the last element is allowed.
    std::optional<PropertyList> array(std::size_t depth) {
        _tokens.take('(');
        PropertyList::Array array;
        while (_tokens.skipBlanks() && !_tokens.take(')')) {
            auto element = value(depth);
            if (!element || !_tokens.skipBlanks()) return std::nullopt;
            array.push_back(std::move(*element));
            if (!_tokens.take(',') && !_tokens.isNext(')'))
                return fail("There is a ',' or a ')' missing here.");
        }
        return PropertyList(std::move(array));
    }

    // Without braces when there is a first key, and then it ends with the document.
    std::optional<PropertyList> dictionary(std::size_t depth,
                                           std::optional<std::string> firstKey = {}) {
        const bool isBraced = !firstKey && _tokens.take('{');
        PropertyListEntries entries;
        while (_tokens.skipBlanks() && !(isBraced ? _tokens.take('}') : _tokens.isAtEnd())) {
            auto key = firstKey ? std::exchange(firstKey, {}) : this->key();
            if (!key || !assignment(depth, std::move(*key), entries)) return std::nullopt;
        }
        return dictionaryOf(std::move(entries));
    }

    std::optional<std::string> key() {
        if (!_tokens.isText()) return fail("There is a key missing here.");
        if (!_budget.takeObjects(1)) return fail(kTooManyObjects);
        return text();
    }

    // What follows a key.
    bool assignment(std::size_t depth, std::string key, PropertyListEntries& entries) {
        if (!expect('=', "There is a '=' missing here.")) return false;
        auto assigned = value(depth);
        if (!assigned || !expect(';', "There is a ';' missing here.")) return false;
        entries.emplace_back(std::move(key), std::move(*assigned));
        return true;
    }

    bool expect(char character, std::string_view otherwise) {
        if (!_tokens.skipBlanks()) return false;
        if (_tokens.take(character)) return true;
        fail(otherwise);
        return false;
    }

    FirstProblem _problem;
    TextPropertyListTokens _tokens;
    const PropertyListLimits& _limits;
    PropertyListBudget _budget;
};

}  // namespace

PropertyListReading readTextPropertyList(std::string_view text, const PropertyListLimits& limits) {
    return Reader(text, limits).read();
}

}  // namespace vlm::platform
