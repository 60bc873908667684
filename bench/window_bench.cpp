// How long a person who inserts a card looks at a screen without the pairing window, against the
// start of the least program that shows a dialog. The agent is not running when the card's event
// leaves for it; the hints service answers at once.
//
//   window_bench FOLDER-OF-VLMBIND BARE-DIALOG

#include <poll.h>
#include <sys/prctl.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <functional>
#include <map>
#include <string>
#include <vector>

#include "bench/console_seat.h"
#include "bench/interleaved.h"
#include "bench/temporary_folder.h"
#include "bench/watched_screen.h"
#include "fake_hints_service.h"
#include "platform/linux/file_descriptor.h"
#include "platform/linux/send_notification.h"
#include "platform/linux/session_bus_notifications.h"
#include "platform/token_framework.h"
#include "tests/integration/linux/log_socket.h"
#include "tests/integration/linux/private_bus.h"
#include "tests/integration/linux/token_service.h"

namespace vlm::bench {
namespace {

using Clock = std::chrono::steady_clock;
using Seconds = std::chrono::duration<double>;
using test::eventually;

constexpr int kTurns = 40;
constexpr double kGoal = 1.5;
constexpr useconds_t kBetweenLooks = 200;  // microseconds
constexpr const char* kToken = "pkcs11:token=blue";

// What the agent logs when a part of its way begins, in the order of the way.
struct Part {
    const char* name;
    const char* firstLine;
};
constexpr std::array kParts{
    Part{"activation, from the event to the agent's main", nullptr},
    Part{"confinement, and coming to the bus", "starting"},
    Part{"checks", "starting vlm bind"},
    Part{"reading the token", "VLCopyAvailableTokensInfo"},
    Part{"toolkit, window and first paint", "token inserted"},
};

// A desktop with a session bus that starts the agent, and a service that knows a card.
class Desktop {
public:
    Desktop(const std::filesystem::path& agent, const std::filesystem::path& folder);

    // From the event of a card to its window, and after that the way back to an empty screen.
    Seconds untilOffered();
    // From the start of this program.
    Seconds untilShown(const std::string& program);

    using Parts = std::array<std::vector<Seconds>, kParts.size()>;
    const Parts& parts() const { return _parts; }
    void forgetParts() { _parts = {}; }

private:
    Clock::time_point awaitPaint();
    void takeParts(Clock::time_point event, Clock::time_point painted);
    void awaitEmptyScreen();
    platform::FileDescriptor runningAgent();
    static void awaitEnd(const platform::FileDescriptor& process);

    static test::PrivateBus::Options sessionBus(const std::filesystem::path& agent,
                                                const std::filesystem::path& folder);

    WatchedScreen _screen;
    test::LogSocket _log{"/run/systemd/journal/socket"};
    std::vector<std::pair<Clock::time_point, std::string>> _lines;
    Parts _parts;

    fakes::FakeHintsService _cards;
    std::unique_ptr<test::PrivateBus> _bus;
    std::unique_ptr<test::TokenService> _service;
    platform::SdBus _poster;
};

[[noreturn]] void fail(const char* what) {
    std::printf("%s\n", what);
    std::exit(2);
}

Desktop::Desktop(const std::filesystem::path& agent, const std::filesystem::path& folder) {
    setenv("DISPLAY", _screen.name().c_str(), 1);
    _bus = std::make_unique<test::PrivateBus>(sessionBus(agent, folder));
    setenv("DBUS_SESSION_BUS_ADDRESS", _bus->address().c_str(), 1);
    _cards.insert({kToken, "Blue Card", {{{0xB1}, "Alice"}}, platform::Bytes{0xBB}});
    _service = std::make_unique<test::TokenService>(_bus->address());
    _service->answerRequests([this](const auto& request) { return _cards.answer(request); });
    _poster = test::connectTo(_bus->address());
}

test::PrivateBus::Options Desktop::sessionBus(const std::filesystem::path& agent,
                                              const std::filesystem::path& folder) {
    const auto services = folder / "services";
    std::filesystem::create_directory(services);
    std::ofstream(services / "agent.service")
        << "[D-BUS Service]\nName=" << platform::kNotificationsService
        << "\nExec=" << agent.string() << '\n';
    test::PrivateBus::Options options;
    options.type = "session";
    options.serviceFolders = {services};
    return options;
}

Clock::time_point Desktop::awaitPaint() {
    const auto deadline = Clock::now() + test::Child::kPatience;
    _lines.clear();
    while (!_screen.isPainted()) {
        if (Clock::now() > deadline) fail("no window came");
        for (const auto& packet : _log.take())
            _lines.emplace_back(Clock::now(), test::journalFields(packet)["MESSAGE"]);
        usleep(kBetweenLooks);
    }
    return Clock::now();
}

void Desktop::awaitEmptyScreen() {
    if (!eventually([this] { return !_screen.isPainted(); })) fail("the window does not go");
}

Seconds Desktop::untilOffered() {
    _service->insert(kToken);
    const auto event = Clock::now();
    platform::sendNotification(_poster.get(), std::string(platform::kNewTokenNotification));
    sd_bus_flush(_poster.get());
    const auto painted = awaitPaint();
    takeParts(event, painted);
    const auto agent = runningAgent();
    _service->pull(kToken);
    awaitEmptyScreen();
    awaitEnd(agent);
    _log.take();  // what it says at its end is no part of the next one's way
    return painted - event;
}

platform::FileDescriptor Desktop::runningAgent() {
    sd_bus_creds* found = nullptr;
    pid_t process = 0;
    if (sd_bus_get_name_creds(_poster.get(), platform::kNotificationsService, SD_BUS_CREDS_PID,
                              &found) < 0 ||
        sd_bus_creds_get_pid(found, &process) < 0)
        fail("the window is not the agent's");
    sd_bus_creds_unref(found);
    return platform::FileDescriptor(static_cast<int>(syscall(SYS_pidfd_open, process, 0)));
}

// To the last of it: what a program does at its end would make the next one wait.
void Desktop::awaitEnd(const platform::FileDescriptor& process) {
    pollfd end{process.get(), POLLIN, 0};
    constexpr std::chrono::milliseconds kPatience = test::Child::kPatience;
    if (poll(&end, 1, static_cast<int>(kPatience.count())) != 1) fail("the agent does not end");
    siginfo_t ended{};
    waitid(P_PIDFD, static_cast<id_t>(process.get()), &ended, WEXITED);
}

void Desktop::takeParts(Clock::time_point event, Clock::time_point painted) {
    auto begin = event;
    for (std::size_t part = 0; part < kParts.size(); ++part) {
        auto end = painted;
        if (part + 1 < kParts.size()) {
            const auto next = std::ranges::find_if(_lines, [&](const auto& line) {
                return line.second.starts_with(kParts[part + 1].firstLine);
            });
            if (next != _lines.end()) end = next->first;
        }
        _parts[part].push_back(end - begin);
        begin = end;
    }
}

Seconds Desktop::untilShown(const std::string& program) {
    const auto start = Clock::now();
    auto shown = std::make_unique<test::Child>(std::vector{program});
    const auto painted = awaitPaint();
    shown.reset();
    awaitEmptyScreen();
    return painted - start;
}

void setEnvironment(const std::filesystem::path& home) {
    setenv("HOME", home.c_str(), 1);
    setenv("VLM_LOG_LEVEL", "debug", 1);
    setenv("LC_ALL", "C.UTF-8", 1);
    for (const char* name : {"XDG_CONFIG_HOME", "XDG_CACHE_HOME", "XDG_RUNTIME_DIR",
                             "WAYLAND_DISPLAY", "QT_QPA_PLATFORM", "VLM_LOG_TARGET"})
        unsetenv(name);
}

void printTimes(const char* what, const std::vector<Seconds>& times) {
    std::printf("  %-50s %9s, 95 of 100 within %9s\n", what,
                bench::shown(quantile(times, 0.5)).c_str(),
                bench::shown(quantile(times, 0.95)).c_str());
}

bool measure(const std::filesystem::path& agent, const std::string& bareDialog) {
    const TemporaryFolder run, home;
    sitAtConsole(run.path(), home.path());
    setEnvironment(home.path());
    prctl(PR_SET_CHILD_SUBREAPER, 1);  // the bus lets go of a program once it is started
    Desktop desktop(agent, home.path());

    // The first ones find nothing in the kernel's caches.
    desktop.untilShown(bareDialog);
    desktop.untilOffered();
    desktop.forgetParts();

    std::vector<Seconds> shown, offered;
    for (int turn = 0; turn < kTurns; ++turn) {
        shown.push_back(desktop.untilShown(bareDialog));
        offered.push_back(desktop.untilOffered());
    }
    for (std::size_t part = 0; part < kParts.size(); ++part)
        printTimes(kParts[part].name, desktop.parts()[part]);
    printTimes("from the event to the window", offered);
    printTimes("a bare dialog's start", shown);
    return report("a card's event to its window", quantile(offered, 0.5), "a bare dialog's start",
                  quantile(shown, 0.5), kGoal);
}

}  // namespace
}  // namespace vlm::bench

int main(int argc, char* argv[]) {
    if (argc != 3) {
        std::fprintf(stderr, "usage: window_bench VLMBIND BARE-DIALOG\n");
        return 2;
    }
    return vlm::bench::measure(argv[1], argv[2]) ? 0 : 1;
}
