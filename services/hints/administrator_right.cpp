#include "services/hints/administrator_right.h"

#include <utility>

#include "platform/harmless_text.h"
#include "platform/text.h"
#include "services/hints/status.h"

namespace vlm::service {

std::unique_ptr<Authority::Question> AdministratorRight::ask(const RightQuestion& question,
                                                             const std::string& change, Done done) {
    return _authority.ask(question,
                          [this, change, done = std::move(done)](const RightVerdict& verdict) {
                              done(judge(verdict, change));
                          });
}

std::optional<Refusal> AdministratorRight::judge(const RightVerdict& verdict,
                                                 const std::string& change) {
    switch (verdict.outcome) {
        case RightVerdict::Outcome::Granted:
            return verdict.kept.empty() ? std::nullopt : judgeKept(verdict.kept, change);
        case RightVerdict::Outcome::Dismissed:
            return Refusal{status::kCancelled,
                           "the question for an administrator's password was dismissed."};
        case RightVerdict::Outcome::Denied:
            return Refusal{status::kNotPermitted,
                           "an administrator has to allow this, and did not: the password was "
                           "wrong, or the rules of this machine forbid it."};
        case RightVerdict::Outcome::NobodyToAsk:
            return Refusal{status::kRightUnknown,
                           "an administrator has to allow this, and no program of this desktop "
                           "asks for a password. Run the command with sudo if you are one."};
        case RightVerdict::Outcome::Failed:
            break;
    }
    return Refusal{status::kRightUnknown,
                   platform::text("an administrator has to allow this, and polkit could not be "
                                  "asked: {}. Try again, and see the system log.",
                                  platform::harmlessText(verdict.reason, 512))};
}

std::optional<Refusal> AdministratorRight::judgeKept(const std::string& right,
                                                     const std::string& change) {
    const auto [first, isNew] = _changes.try_emplace(right, change);
    if (isNew || first->second == change) return std::nullopt;
    return Refusal{status::kNotPermitted,
                   "an administrator allowed this program one other change a short time ago. Run "
                   "it anew, or try again in five minutes."};
}

}  // namespace vlm::service
