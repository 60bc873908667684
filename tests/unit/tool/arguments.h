// A command line as main() gets it.

#pragma once

#include <string>
#include <vector>

namespace vlm::fakes {

class Arguments {
public:
    explicit Arguments(const std::vector<std::string>& arguments) {
        _texts.reserve(arguments.size() + 1);
        _texts.emplace_back("vlmbind");
        for (const auto& argument : arguments) _texts.push_back(argument);
        for (auto& text : _texts) _values.push_back(text.data());
        _values.push_back(nullptr);
    }
    Arguments(const Arguments&) = delete;
    Arguments& operator=(const Arguments&) = delete;

    int count() const { return static_cast<int>(_texts.size()); }
    char** values() { return _values.data(); }

private:
    std::vector<std::string> _texts;
    std::vector<char*> _values;
};

}  // namespace vlm::fakes
