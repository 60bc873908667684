// AdministratorRight: one change of a pairing for each time that the administrator's right is
// given.
//
// The authority keeps a right for a while, so that a program which asked for it itself is not asked
// again here. It would serve that program for the next card, too, and polkit lets only programs of
// the user's own session take it back. So a right that is kept belongs to the first change that was
// asked about, and counts for nothing else.
//
// Ownership: the authority outlives it, and it outlives every question.
// Threads:   the event loop's. Blocking: never.
// Errors:    a status and a text that is the end of a sentence.
// In tests:  tests/unit/services/administrator_right_test.cpp

#pragma once

#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <string>

#include "services/hints/authority.h"
#include "services/hints/outcome.h"

namespace vlm::service {

class AdministratorRight {
public:
    using Done = std::function<void(std::optional<Refusal>)>;

    explicit AdministratorRight(Authority& authority) : _authority(authority) {}
    AdministratorRight(const AdministratorRight&) = delete;
    AdministratorRight& operator=(const AdministratorRight&) = delete;

    // `change` tells what is to be changed from everything else. Destroying the returned object
    // withdraws the question; else `done` is called once, never before this has returned.
    std::unique_ptr<Authority::Question> ask(const RightQuestion& question,
                                             const std::string& change, Done done);

private:
    std::optional<Refusal> judge(const RightVerdict& verdict, const std::string& change);
    std::optional<Refusal> judgeKept(const std::string& right, const std::string& change);

    Authority& _authority;
    std::map<std::string, std::string> _changes;  // what each right that is kept was used for
};

}  // namespace vlm::service
