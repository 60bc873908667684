// The XML format, taken apart by pugixml.
//
// Choice: pugixml is asked for the text as it stands, and references are resolved here: it would
//         leave one that it does not know in the text, where it could not be told from text that
//         was meant. So no entity of a document's own is ever expanded, and one that is used is a
//         problem. A problem's offset is that of a place in the untouched text.
// Memory: pugixml takes some 64 bytes for an element, a text or an attribute, in no recursion.

#include <algorithm>
#include <pugixml.hpp>

#include "platform/property_list_reading.h"
#include "platform/property_list_source.h"
#include "platform/text.h"
#include "platform/utf.h"
#include "platform/xml_property_list_scalars.h"

namespace vlm::platform {

namespace {

using namespace xml_format;

constexpr unsigned kParseOptions =
    pugi::parse_cdata | pugi::parse_ws_pcdata | pugi::parse_declaration | pugi::parse_fragment;

// What pugixml stumbles over. It tells the place where it gave up, which for something that does
// not end is the end of everything; a person wants to see where that begins.
struct Stumble {
    pugi::xml_parse_status status;
    std::string_view beginning;
    const char* problem;
};
constexpr Stumble kStumbles[] = {
    {pugi::status_bad_pi, "<?", "This instruction does not end, or is out of place."},
    {pugi::status_bad_comment, "<!--", "This comment does not end."},
    {pugi::status_bad_cdata, "<![CDATA[", "This CDATA section does not end."},
    {pugi::status_bad_doctype, "<!DOCTYPE", "This document type does not end, or is out of place."},
    {pugi::status_bad_attribute, "", "This attribute is not well formed."},
    {pugi::status_end_element_mismatch, "", "An element does not end where it should."},
    {pugi::status_out_of_memory, "", "There is not enough memory to read it."},
};

bool isText(pugi::xml_node node) {
    return node.type() == pugi::node_pcdata || node.type() == pugi::node_cdata;
}

// Whether pugixml would make so much of the text that the limits could not hold what it takes. Each
// element, text and attribute comes with one of these characters, a value in its limits with two.
bool hasTooManyPieces(std::string_view text, const PropertyListLimits& limits) {
    constexpr std::size_t kOthers = 4096;  // comments, and the like
    const auto pieces = static_cast<std::size_t>(std::ranges::count_if(
        text, [](char character) { return character == '<' || character == '='; }));
    return pieces > kOthers && (pieces - kOthers) / 2 > limits.objects;
}

std::string problemOfReference(std::string_view name) {
    if (!isEntityName(name)) return "This '&' begins no reference; as a character it is \"&amp;\".";
    return text("The entity {} is not expanded; only those of XML itself are.",
                quotedForPerson(name));
}

class Reader {
public:
    Reader(std::string_view text, const PropertyListLimits& limits)
        : _text(text), _limits(limits), _budget(limits) {}

    PropertyListReading read() {
        auto value = document();
        return std::move(_problem).with(std::move(value));
    }

private:
    std::nullopt_t fail(std::size_t offset, std::string_view sentence) {
        return _problem.at(offset, std::string(sentence));
    }
    std::nullopt_t fail(pugi::xml_node node, std::string_view sentence) {
        return fail(offsetOf(node), sentence);
    }

    std::nullopt_t fail(const pugi::xml_parse_result& result) {
        const auto offset = std::min(static_cast<std::size_t>(result.offset), _text.size());
        const auto stumble = std::ranges::find(kStumbles, result.status, &Stumble::status);
        if (stumble == std::end(kStumbles)) return fail(offset, "This is not well-formed XML.");
        const auto beginning = _text.rfind(stumble->beginning, offset);
        return fail(std::min(beginning, offset), stumble->problem);
    }

    // Of the bracket that opens an element; of the text itself.
    static std::size_t offsetOf(pugi::xml_node node) {
        const auto offset =
            static_cast<std::size_t>(std::max<std::ptrdiff_t>(node.offset_debug(), 0));
        if (node.type() == pugi::node_declaration) return offset - std::min<std::size_t>(offset, 2);
        return isText(node) ? offset : offset - std::min<std::size_t>(offset, 1);
    }

    std::optional<PropertyList> document() {
        if (hasTooManyPieces(_text, _limits)) return fail(std::size_t{0}, kTooManyObjects);
        // pugixml takes the last character for an end, and would not see that it is text.
        _parsed.assign(_text.begin(), _text.end());
        _parsed.push_back('\n');
        pugi::xml_document document;
        const auto result = document.load_buffer_inplace(_parsed.data(), _parsed.size(),
                                                         kParseOptions, pugi::encoding_utf8);
        if (!result) return fail(result);

        pugi::xml_node root;
        for (const pugi::xml_node node : document) {
            if (node.type() == pugi::node_declaration && !isReadableEncoding(node))
                return fail(node, "The encoding is declared to be neither UTF-8 nor UTF-16.");
            if (isText(node) && !isBlank(node.value()))
                return fail(node, "There is text outside of all elements.");
            if (node.type() != pugi::node_element) continue;
            if (root) return fail(node, "There is a second outermost element.");
            root = node;
        }
        if (!root) return fail(_text.size(), "There is no element in it.");
        return plist(root);
    }

    static bool isReadableEncoding(pugi::xml_node declaration) {
        std::string encoding = declaration.attribute("encoding").as_string("utf-8");
        for (char& letter : encoding)
            if (letter >= 'A' && letter <= 'Z') letter = static_cast<char>(letter - 'A' + 'a');
        return encoding == "utf-8" || encoding == "utf-16" || encoding == "us-ascii";
    }

    std::optional<PropertyList> plist(pugi::xml_node root) {
        if (root.name() != std::string_view("plist"))
            return fail(root, text("The outermost element is {}, not \"plist\".",
                                   quotedForPerson(root.name())));
        for (const pugi::xml_attribute attribute : root.attributes()) {
            const bool isVersion = attribute == root.first_attribute() &&
                                   attribute.name() == std::string_view("version") &&
                                   attribute.value() == std::string_view("1.0");
            if (!isVersion) return fail(root, "The element \"plist\" takes version=\"1.0\" only.");
        }

        const auto contents = elementsIn(root);
        if (!contents) return std::nullopt;
        if (contents->empty()) return fail(root, "The element \"plist\" holds no value.");
        if (contents->size() > 1)
            return fail((*contents)[1], "The element \"plist\" holds more than one value.");
        return value(contents->front(), 0);
    }

    // The elements in one that may hold no text.
    std::optional<std::vector<pugi::xml_node>> elementsIn(pugi::xml_node parent) {
        std::vector<pugi::xml_node> elements;
        for (const pugi::xml_node node : parent) {
            if (!isText(node)) {
                elements.push_back(node);
            } else if (!isBlank(node.value())) {
                return fail(node, text("Text has no place in the element {}.",
                                       quotedForPerson(parent.name())));
            }
        }
        return elements;
    }

    std::optional<PropertyList> value(pugi::xml_node element, std::size_t depth) {
        const std::string_view name = element.name();
        if (name == "key") return fail(element, "A key has its place in a dictionary only.");
        if (!enter(element)) return std::nullopt;
        if (name == "dict" || name == "array") {
            if (depth == _limits.depth) return fail(element, kTooDeep);
            return name == "dict" ? dictionary(element, depth + 1) : array(element, depth + 1);
        }

        const Scalar* kind = scalarNamed(name);
        if (!kind)
            return fail(element,
                        text("No value is written as the element {}.", quotedForPerson(name)));
        const auto content = contentOf(element);
        if (!content) return std::nullopt;
        auto scalar = kind->read(*content);
        if (!scalar) return fail(element, kind->problem);
        return scalar;
    }

    // Whether one more value or key may be made of the element.
    bool enter(pugi::xml_node element) {
        if (!_budget.takeObjects(1)) {
            fail(element, kTooManyObjects);
        } else if (element.first_attribute()) {
            fail(element,
                 text("The element {} takes no attribute.", quotedForPerson(element.name())));
        } else {
            return true;
        }
        return false;
    }

    std::optional<PropertyList> array(pugi::xml_node element, std::size_t depth) {
        const auto elements = elementsIn(element);
        if (!elements) return std::nullopt;
        PropertyList::Array array;
        array.reserve(elements->size());
        for (const pugi::xml_node each : *elements) {
            auto made = value(each, depth);
            if (!made) return std::nullopt;
            array.push_back(std::move(*made));
        }
        return PropertyList(std::move(array));
    }

    std::optional<PropertyList> dictionary(pugi::xml_node element, std::size_t depth) {
        const auto elements = elementsIn(element);
        if (!elements) return std::nullopt;
        PropertyListEntries entries;
        entries.reserve(elements->size() / 2);
        for (std::size_t at = 0; at < elements->size(); at += 2) {
            const pugi::xml_node key = (*elements)[at];
            if (key.name() != std::string_view("key"))
                return fail(key, "There is a key missing before this element.");
            auto name = enter(key) ? contentOf(key) : std::nullopt;
            if (!name) return std::nullopt;
            if (at + 1 == elements->size()) return fail(key, "This key has no value.");
            auto made = value((*elements)[at + 1], depth);
            if (!made) return std::nullopt;
            entries.emplace_back(std::move(*name), std::move(*made));
        }
        return dictionaryOf(std::move(entries));
    }

    // The text in an element that may hold nothing else.
    std::optional<std::string> contentOf(pugi::xml_node element) {
        std::string content;
        for (const pugi::xml_node node : element) {
            if (!isText(node))
                return fail(node, text("The element {} holds no other elements.",
                                       quotedForPerson(element.name())));
            if (!append(content, node)) return std::nullopt;
        }
        if (!_budget.takeBytes(content.size())) return fail(element, kTooManyBytes);
        return content;
    }

    // Line breaks become line feeds, as XML has it, and references what they stand for.
    bool append(std::string& content, pugi::xml_node node) {
        const std::string_view stops = node.type() == pugi::node_cdata ? "\r" : "\r&";
        const std::string_view whole = node.value();
        for (std::size_t at = 0; at < whole.size();) {
            const std::size_t stop = std::min(whole.find_first_of(stops, at), whole.size());
            content += whole.substr(at, stop - at);
            at = stop;
            if (at == whole.size()) break;
            if (whole[at] == '\r') {
                at += whole.substr(at, 2) == "\r\n" ? 2 : 1;
                content += '\n';
                continue;
            }
            const std::size_t end = whole.find(';', at);
            const auto name = end == std::string_view::npos ? std::string_view()
                                                            : whole.substr(at + 1, end - at - 1);
            const auto character = characterOf(name);
            if (!character) {
                fail(offsetOf(node) + at, problemOfReference(name));
                return false;
            }
            content += encodeUtf8(*character).view();
            at = end + 1;
        }
        return true;
    }

    const std::string_view _text;
    const PropertyListLimits& _limits;
    PropertyListBudget _budget;
    FirstProblem _problem;
    std::vector<char> _parsed;  // what the document's nodes point into
};

}  // namespace

PropertyListReading readXmlPropertyList(std::string_view text, const PropertyListLimits& limits) {
    return Reader(text, limits).read();
}

}  // namespace vlm::platform
