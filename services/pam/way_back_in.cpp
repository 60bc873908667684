#include "services/pam/way_back_in.h"

#include <algorithm>
#include <string_view>

#include "platform/accounts.h"
#include "platform/platform.h"

namespace vlm::pam {

namespace {

bool isConsole(std::string_view terminal) {
    constexpr std::string_view kFolder = "/dev/";
    constexpr std::string_view kVirtual = "tty";
    if (terminal.starts_with(kFolder)) terminal.remove_prefix(kFolder.size());
    if (terminal == "console") return true;
    if (!terminal.starts_with(kVirtual)) return false;
    terminal.remove_prefix(kVirtual.size());
    return !terminal.empty() &&
           std::ranges::all_of(terminal, [](char each) { return each >= '0' && each <= '9'; });
}

}  // namespace

bool isRootAtConsole(const std::string& user, const std::string& terminal,
                     const std::string& remoteHost) {
    return remoteHost.empty() && isConsole(terminal) &&
           platform::current().accounts().userId(user) == platform::UserId{0};
}

}  // namespace vlm::pam
