// What the doctor finds: one line for each thing that it looks at.

#pragma once

#include <string>
#include <utility>
#include <vector>

namespace vlm::control::doctor {

enum class Verdict {
    Ok,
    Warning,  // cards may work, or not for everybody
    Problem,  // they do not, or somebody is locked out
};

struct Finding {
    Verdict verdict = Verdict::Ok;
    std::string check;   // a word for what was looked at
    std::string words;   // how it is
    std::string remedy;  // what to do about it; empty when it is well
};
using Findings = std::vector<Finding>;

inline Finding ok(std::string check, std::string words) {
    return {Verdict::Ok, std::move(check), std::move(words), {}};
}
inline Finding warning(std::string check, std::string words, std::string remedy) {
    return {Verdict::Warning, std::move(check), std::move(words), std::move(remedy)};
}
inline Finding problem(std::string check, std::string words, std::string remedy) {
    return {Verdict::Problem, std::move(check), std::move(words), std::move(remedy)};
}

}  // namespace vlm::control::doctor
