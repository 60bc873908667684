#include "platform/linux/sandbox_profile.h"

#include <algorithm>
#include <utility>

#include "platform/text.h"

namespace vlm::platform {

namespace {

constexpr std::string_view kBlanks = " \t";

std::string_view trimmed(std::string_view text) {
    const auto first = text.find_first_not_of(kBlanks);
    if (first == std::string_view::npos) return {};
    return text.substr(first, text.find_last_not_of(kBlanks) - first + 1);
}

bool isControl(char character) {
    const auto code = static_cast<unsigned char>(character);
    return (code < 0x20 && character != '\t') || code == 0x7F;
}

// A step upwards would leave the folder that the reader of the profile sees in the path.
bool stepsUp(std::string_view path) {
    while (!path.empty()) {
        const auto end = std::min(path.find('/'), path.size());
        if (path.substr(0, end) == "..") return true;
        path.remove_prefix(std::min(end + 1, path.size()));
    }
    return false;
}

class ProfileParser {
public:
    explicit ProfileParser(const std::vector<SandboxParameter>& parameters)
        : _parameters(parameters) {}

    SandboxProfileAnswer parse(std::string_view text) {
        if (!parametersAreUsable()) return {std::nullopt, _error};
        std::size_t number = 0;
        while (!text.empty()) {
            const auto end = std::min(text.find('\n'), text.size());
            ++number;
            if (!parseLine(text.substr(0, end), number))
                return {std::nullopt, platform::text("line {}: {}", number, _error)};
            text.remove_prefix(std::min(end + 1, text.size()));
        }
        return {std::move(_profile), {}};
    }

private:
    bool fail(std::string error) {
        _error = std::move(error);
        return false;
    }

    const SandboxParameter* find(std::string_view name) const {
        const auto found = std::ranges::find(_parameters, name, &SandboxParameter::name);
        return found == _parameters.end() ? nullptr : &*found;
    }

    bool parametersAreUsable() {
        for (const auto& each : _parameters) {
            if (find(each.name) != &each)
                return fail(text("the parameter {} is given twice", each.name));
            if (!each.value.starts_with('/') || each.value.find('\0') != std::string::npos)
                return fail(text("the parameter {} is not an absolute path", each.name));
        }
        return true;
    }

    bool parseLine(std::string_view line, std::size_t number) {
        if (std::ranges::any_of(line, isControl)) return fail("a control character");
        line = trimmed(line);
        if (line.empty() || line.front() == '#') return true;
        const auto end = std::min(line.find_first_of(kBlanks), line.size());
        const std::string_view word = line.substr(0, end);
        const std::string_view argument = trimmed(line.substr(end));
        if (word == "read") return parsePath(PathAccess::Read, argument, number);
        if (word == "write") return parsePath(PathAccess::Write, argument, number);
        if (word == "socket") return parseSocket(argument);
        return fail(text("the word \"{}\" is unknown", word));
    }

    bool parseSocket(std::string_view family) {
        if (family != "unix") return fail(text("\"{}\" is no family that can be allowed", family));
        _profile.unixSockets = true;
        return true;
    }

    bool parsePath(PathAccess access, std::string_view argument, std::size_t number) {
        if (argument.empty()) return fail("the path is missing");
        std::string path;
        if (argument.starts_with("$(")) {
            const auto close = argument.find(')');
            if (close == std::string_view::npos) return fail("a \")\" is missing");
            const auto name = argument.substr(2, close - 2);
            const auto* parameter = find(name);
            if (parameter == nullptr) return fail(text("the parameter \"{}\" is unknown", name));
            path = parameter->value;
            argument.remove_prefix(close + 1);
        }
        if (!argument.empty() && !argument.starts_with('/'))
            return fail(path.empty() ? "the path is not absolute"
                                     : "after a parameter comes a \"/\" or nothing");
        if (argument.find("$(") != std::string_view::npos)
            return fail("a parameter stands at the beginning of a path only");
        if (stepsUp(argument)) return fail("a path goes down only, without \"..\"");
        _profile.paths.push_back({access, path.append(argument), number});
        return true;
    }

    const std::vector<SandboxParameter>& _parameters;
    SandboxProfile _profile;
    std::string _error;
};

}  // namespace

SandboxProfileAnswer parseSandboxProfile(std::string_view text,
                                         const std::vector<SandboxParameter>& parameters) {
    return ProfileParser(parameters).parse(text);
}

}  // namespace vlm::platform
