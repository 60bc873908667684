// Answers: what the running parts of this machine say when the doctor asks them.
//
// All are asked at the same time, and none is waited for longer than a moment: a doctor who hangs
// with the patient is no help.
//
// In tests: tests/lab/scenarios/doctor.py

#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace vlm::control::doctor {

struct Card {
    std::string name;
    std::size_t identities = 0;
    std::size_t usable = 0;  // of these: paired, or fit for it
};

struct Answers {
    // None where pcscd cannot be reached.
    std::optional<std::vector<std::string>> readers;
    // None where the hints service does not tell.
    std::optional<std::vector<Card>> cards;
    // How many pairings the caller's account has; none where the daemon does not tell.
    std::optional<std::size_t> pairings;
};

Answers askAround(const std::string& account);

}  // namespace vlm::control::doctor
