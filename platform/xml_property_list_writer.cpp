#include <algorithm>

#include "platform/property_list_reading.h"
#include "platform/property_list_source.h"
#include "platform/utf.h"
#include "platform/xml_property_list_scalars.h"

namespace vlm::platform {

namespace {

using namespace xml_format;

constexpr std::string_view kHead =
    "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<plist version=\"1.0\">\n";
constexpr std::string_view kFoot = "</plist>\n";

class Writer {
public:
    explicit Writer(const PropertyListLimits& limits) : _limits(limits), _budget(limits) {}

    std::optional<std::string> write(const PropertyList& list) {
        _output = kHead;
        if (!put(list, 0)) return std::nullopt;
        _output += kFoot;
        if (_output.size() > _limits.bytes) return std::nullopt;
        return std::move(_output);
    }

private:
    // False for what XML has no form for, and beyond the limits.
    bool put(const PropertyList& value, std::size_t depth) {
        if (!_budget.takeObjects(1) || _output.size() > _limits.bytes) return false;
        if (const auto* array = value.array()) return putArray(*array, depth);
        if (const auto* dictionary = value.dictionary()) return putDictionary(*dictionary, depth);
        if (const auto* text = value.text()) return putText("string", *text, depth);
        if (const auto* bytes = value.bytes()) return putData(*bytes, depth);
        const auto element = scalar(value);
        if (element) line(depth, *element);
        return element.has_value();
    }

    static std::optional<std::string> scalar(const PropertyList& value) {
        if (const auto boolean = value.boolean()) return *boolean ? "<true/>" : "<false/>";
        if (const auto integer = value.integer())
            return "<integer>" + std::to_string(*integer) + "</integer>";
        if (const auto above = value.unsignedInteger())
            return "<integer>" + std::to_string(*above) + "</integer>";
        if (const auto real = value.real()) return "<real>" + textOf(*real) + "</real>";
        if (const auto date = value.date())
            if (const auto text = textOf(*date)) return "<date>" + *text + "</date>";
        return std::nullopt;
    }

    bool putArray(const PropertyList::Array& array, std::size_t depth) {
        if (depth == _limits.depth) return false;
        line(depth, "<array>");
        for (const auto& each : array)
            if (!put(each, depth + 1)) return false;
        line(depth, "</array>");
        return true;
    }

    bool putDictionary(const PropertyList::Dictionary& dictionary, std::size_t depth) {
        if (depth == _limits.depth) return false;
        line(depth, "<dict>");
        for (const auto& [key, value] : dictionary) {
            if (!_budget.takeObjects(1) || !putText("key", key, depth + 1)) return false;
            if (!put(value, depth + 1)) return false;
        }
        line(depth, "</dict>");
        return true;
    }

    bool putText(std::string_view name, std::string_view text, std::size_t depth) {
        if (!_budget.takeBytes(text.size())) return false;
        indent(depth);
        _output.append("<").append(name).append(">");
        while (!text.empty()) {
            const TextPiece piece = firstOfUtf8(text);
            if (!piece.character || !isTextCharacter(*piece.character)) return false;
            putEscaped(text.substr(0, piece.units));
            text.remove_prefix(piece.units);
        }
        _output.append("</").append(name).append(">\n");
        return true;
    }

    // A carriage return as itself would be read as a line feed.
    void putEscaped(std::string_view character) {
        if (character == "&") {
            _output += "&amp;";
        } else if (character == "<") {
            _output += "&lt;";
        } else if (character == ">") {
            _output += "&gt;";
        } else if (character == "\r") {
            _output += "&#13;";
        } else {
            _output += character;
        }
    }

    bool putData(const Bytes& bytes, std::size_t depth) {
        constexpr std::size_t kBytesInLine = 57;  // 76 characters
        if (!_budget.takeBytes(bytes.size())) return false;
        line(depth, "<data>");
        for (std::span<const std::uint8_t> rest = bytes; !rest.empty();) {
            const auto part = rest.first(std::min(kBytesInLine, rest.size()));
            line(depth, base64Of(part));
            rest = rest.subspan(part.size());
        }
        line(depth, "</data>");
        return true;
    }

    void line(std::size_t depth, std::string_view content) {
        indent(depth);
        _output.append(content).append("\n");
    }

    // The outermost value stands at the margin: nobody reads the list for its frame.
    void indent(std::size_t depth) { _output.append(depth, '\t'); }

    const PropertyListLimits& _limits;
    PropertyListBudget _budget;
    std::string _output;
};

}  // namespace

std::optional<std::string> writeXmlPropertyList(const PropertyList& value,
                                                const PropertyListLimits& limits) {
    return Writer(limits).write(value);
}

}  // namespace vlm::platform
