// A pairing that is offered where no window can be shown: the program lives on to say so, and the
// operation ends at once.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>

#include "fake_hints_service.h"
#include "hints/hints_connection.h"
#include "tests/integration/linux/bus_service.h"
#include "tests/integration/linux/child.h"
#include "tests/integration/linux/private_bus.h"
#include "tests/integration/linux/token_service.h"

namespace vlm::test {
namespace {

using testing::HasSubstr;

const std::string kToken = "pkcs11:token=blue";
constexpr int kNotOffered = 3;

class WithoutWindow : public testing::Test {
protected:
    WithoutWindow() {
        service.insert({kToken, "Blue Card", {{{0xB1}, "Alice"}}, platform::Bytes{0xBB}});
    }

    // With a card in, for a user whose requests the daemon answers.
    Ended offer(const std::filesystem::path& program, Child::Environment environment) {
        environment.merge(Child::Environment{{"DBUS_SYSTEM_BUS_ADDRESS", machine.address()},
                                             {"DBUS_SESSION_BUS_ADDRESS", session.address()},
                                             {"QT_QPA_PLATFORM", std::nullopt},
                                             {"QT_QPA_PLATFORMTHEME", std::nullopt},
                                             {"WAYLAND_DISPLAY", std::nullopt},
                                             {"DISPLAY", std::nullopt},
                                             {"VLM_LOG_TARGET", "stderr"}});
        return run({program}, {.environment = environment, .user = {}});
    }

    static PrivateBus::Options sessionBus() {
        PrivateBus::Options options;
        options.type = "session";
        return options;
    }

    static std::filesystem::path builtProgram() {
        return std::filesystem::read_symlink("/proc/self/exe").parent_path() / "offer_pairing";
    }

    static void expectEnd(const Ended& ended, const std::string& reason) {
        EXPECT_EQ(ended.status, 0) << ended.errors;
        EXPECT_EQ(ended.output, "result " + std::to_string(kNotOffered) + '\n') << ended.errors;
        EXPECT_THAT(ended.errors, HasSubstr(reason));
        EXPECT_THAT(ended.errors, HasSubstr("the pairing dialog cannot be shown"));
    }

    fakes::FakeHintsService service;
    PrivateBus machine;
    PrivateBus session{sessionBus()};
    BusService daemon{machine.address(), std::string(hints::kDaemonService),
                      [this](const platform::Message& request) { return service.answer(request); }};
    TokenService tokens{session.address(), {kToken}};
};

TEST_F(WithoutWindow, EndsOnAMachineWithoutAScreen) {
    expectEnd(offer(builtProgram(), {}), "there is no screen");
}

TEST_F(WithoutWindow, EndsWhenNoScreenAnswers) {
    expectEnd(offer(builtProgram(), {{"DISPLAY", ":31999"}, {"WAYLAND_DISPLAY", "wayland-31999"}}),
              "there is no screen");
}

TEST_F(WithoutWindow, EndsWhenTheScreenThatTheEnvironmentWantsIsNotThere) {
    for (const char* screen : {"xcb", "wayland;xcb", "nonesuch", ""})
        expectEnd(offer(builtProgram(), {{"QT_QPA_PLATFORM", screen}}), "there is no screen");
}

TEST_F(WithoutWindow, EndsAlsoUnderAThemeThatNeedsAScreen) {
    if (!std::filesystem::exists(VLM_TOOLKITS_PLUGINS "/platformthemes/libqgtk3.so"))
        GTEST_SKIP() << "the theme gtk3 is not installed (Debian: qt6-gtk-platformtheme)";
    // The leak sanitizer stumbles over a thread that the theme leaves behind.
    for (const char* display : {"", ":31999"})
        expectEnd(offer(builtProgram(), {{"QT_QPA_PLATFORMTHEME", "gtk3"},
                                         {"DISPLAY", display},
                                         {"ASAN_OPTIONS", "detect_leaks=0"}}),
                  "there is no screen");
}

TEST_F(WithoutWindow, EndsWhenTheModuleOfTheWindowsIsNotInstalled) {
    const TemporaryFolder folder;
    const auto alone = folder.path() / "tests" / "offer_pairing";
    std::filesystem::create_directory(alone.parent_path());
    std::filesystem::copy_file(builtProgram(), alone);

    expectEnd(offer(alone, {}), "is not installed");
}

}  // namespace
}  // namespace vlm::test
