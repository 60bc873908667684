#include "services/vlmctl/doctor/pam_stack.h"

#include <sstream>

namespace vlm::control::doctor {

namespace {

// Files that include each other in a circle come to an end.
constexpr int kDeepest = 8;

std::vector<std::string> wordsIn(const std::string& line) {
    std::istringstream stream(line.substr(0, line.find('#')));
    std::vector<std::string> words;
    std::string word;
    while (stream >> word) {
        // "[success=1 default=ignore]" is one word to PAM.
        if (!words.empty() && words.back().starts_with('[') && !words.back().ends_with(']'))
            words.back() += " " + word;
        else
            words.push_back(word);
    }
    return words;
}

std::string nameOf(const std::string& module) {
    const auto name = module.substr(module.rfind('/') + 1);
    return name.substr(0, name.find(".so"));
}

class Stack {
public:
    explicit Stack(const MachineFiles& files) : _files(files) {}

    bool add(const std::string& service, int depth) {
        if (depth > kDeepest || service.find('/') != std::string::npos) return false;
        const auto path = _files.firstOf({"/etc/pam.d/" + service, "/usr/lib/pam.d/" + service});
        const auto text = path ? _files.text(*path) : std::nullopt;
        if (!text) return false;
        std::istringstream lines(*text);
        std::string line;
        while (std::getline(lines, line)) addLine(wordsIn(line), depth);
        return true;
    }

    std::vector<std::string> modules;

private:
    void addLine(const std::vector<std::string>& words, int depth) {
        if (words.size() >= 2 && words[0] == "@include") add(words[1], depth + 1);
        // With the mark in front, a module that is not there is no matter.
        if (words.size() < 3 || (words[0] != "auth" && words[0] != "-auth")) return;
        if (words[1] == "include" || words[1] == "substack")
            add(words[2], depth + 1);
        else
            modules.push_back(nameOf(words[2]));
    }

    const MachineFiles& _files;
};

}  // namespace

std::optional<std::vector<std::string>> authenticationModules(const MachineFiles& files,
                                                              const std::string& service) {
    Stack stack(files);
    if (!stack.add(service, 0)) return std::nullopt;
    return std::move(stack.modules);
}

}  // namespace vlm::control::doctor
