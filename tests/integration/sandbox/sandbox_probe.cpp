// Confines itself as the tool does, then tries one thing:
//
//     sandbox_probe [--open] [--profile NAME] [--lacking MECHANISM] ATTEMPT [ARGUMENT...]
//
//     --open       do not confine
//     --profile    another profile than the tool's
//     --lacking    as on a kernel that answers no to "landlock", "landlock-rights" or "seccomp"
//
// Prints "log: TEXT" for each line that the confinement logs, "refused: STATUS TEXT" when it cannot
// be entered, and else "result: N", the error number of what was tried.

#include <seccomp.h>
#include <sys/prctl.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <exception>
#include <iostream>
#include <stdexcept>
#include <vector>

#include "attempts.h"
#include "platform/platform.h"
#include "platform/sandbox.h"
#include "platform/system_log.h"

namespace vlm::platform {

namespace {

class PrintingSystemLog final : public SystemLog {
public:
    bool collects(LogLevel) const override { return true; }
    void write(const LogRecord& record) override {
        std::cout << "log: " << record.subsystem << ' ' << record.category << ' '
                  << static_cast<int>(record.level) << ' ' << record.text << std::endl;
    }
};

}  // namespace

SystemLog& Platform::systemLog() {
    static PrintingSystemLog log;
    return log;
}

}  // namespace vlm::platform

namespace vlm::test {

namespace {

struct Order {
    bool open = false;
    std::string profile = "org.vlm.vlmbind";
    std::string lacking;
    std::vector<std::string> attempt;
};

Order parse(const std::vector<std::string>& arguments) {
    Order order;
    std::size_t next = 0;
    for (; next < arguments.size() && arguments[next].starts_with("--"); ++next) {
        if (arguments[next] == "--open") order.open = true;
        if (arguments[next] == "--profile") order.profile = arguments.at(++next);
        if (arguments[next] == "--lacking") order.lacking = arguments.at(++next);
    }
    order.attempt.assign(arguments.begin() + static_cast<std::ptrdiff_t>(next), arguments.end());
    if (order.attempt.empty()) throw std::invalid_argument("nothing to attempt");
    // An attempt reads no further than its second argument, one in a child no further than the
    // third.
    order.attempt.resize(std::max<std::size_t>(order.attempt.size(), 4));
    return order;
}

// Takes a mechanism away from this process, as an older kernel or a container does.
void takeAway(const std::string& mechanism) {
    const auto filter = seccomp_init(SCMP_ACT_ALLOW);
    const auto refuse = [&](int number, unsigned error, std::vector<scmp_arg_cmp> when = {}) {
        seccomp_rule_add_array(filter, SCMP_ACT_ERRNO(error), number,
                               static_cast<unsigned>(when.size()), when.data());
    };
    if (mechanism == "landlock") refuse(SCMP_SYS(landlock_create_ruleset), ENOSYS);
    if (mechanism == "landlock-rights") refuse(SCMP_SYS(landlock_restrict_self), EPERM);
    if (mechanism == "seccomp") {
        refuse(SCMP_SYS(seccomp), ENOSYS);
        refuse(SCMP_SYS(prctl), EINVAL, {{0, SCMP_CMP_EQ, PR_SET_SECCOMP, 0}});
    }
    if (seccomp_load(filter) != 0) throw std::runtime_error("cannot take away " + mechanism);
    seccomp_release(filter);
}

// Begins anew in a process that lacks the mechanism. A program that starts there finds out for
// itself what it has; this one already knows better.
void startAgainWithout(const Order& order) {
    takeAway(order.lacking);
    std::vector<std::string> arguments{"sandbox_probe", "--profile", order.profile};
    arguments.insert(arguments.end(), order.attempt.begin(), order.attempt.end());
    std::vector<char*> pointers;
    for (auto& each : arguments) pointers.push_back(each.data());
    pointers.push_back(nullptr);
    execv("/proc/self/exe", pointers.data());
    throw std::runtime_error("cannot start again");
}

platform::SandboxAnswer confine(const std::string& profile) {
    auto& sandbox = platform::current().sandbox();
    const auto cache = sandbox.userCacheFolder();
    const auto temporary = sandbox.userTemporaryFolder();
    if (cache.path.empty() || temporary.path.empty()) return {cache.errorNumber, "no folders"};
    return sandbox.enter(profile, {{"KESTRA_USER_CACHE_DIR", cache.path},
                                   {"KESTRA_USER_TEMP_DIR", temporary.path},
                                   {"HOME_DIR", getenv("HOME")}});
}

int probe(const std::vector<std::string>& arguments) {
    const Order order = parse(arguments);
    if (!order.lacking.empty()) startAgainWithout(order);
    if (!order.open) {
        const auto answer = confine(order.profile);
        if (answer.status != platform::kSuccess) {
            std::cout << "refused: " << answer.status << ' ' << answer.errorText << std::endl;
            return EXIT_SUCCESS;
        }
    }
    const int error = attempt(order.attempt);
    std::cout << "result: " << error << std::endl;
    return EXIT_SUCCESS;
}

}  // namespace

}  // namespace vlm::test

int main(int argc, char* argv[]) {
    try {
        return vlm::test::probe(std::vector<std::string>(argv + 1, argv + argc));
    } catch (const std::exception& error) {
        std::cerr << "sandbox_probe: " << error.what() << std::endl;
        return EXIT_FAILURE;
    }
}
