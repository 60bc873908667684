#include "platform/linux/loaded_windowing.h"

#include <dlfcn.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <array>

#include "platform/linux/windowing_module.h"
#include "tests/integration/linux/child.h"
#include "tests/integration/windowing/screen.h"

namespace vlm::test {
namespace {

std::filesystem::path buildFolder() {
    return std::filesystem::read_symlink("/proc/self/exe").parent_path().parent_path();
}

std::filesystem::path moduleFile() { return buildFolder() / "lib/vlm/vlm_qt_windowing.so"; }

template <typename Entry>
Entry entry(const char* name) {
    void* found = dlsym(dlopen(moduleFile().c_str(), RTLD_NOW | RTLD_LOCAL), name);
    EXPECT_TRUE(found) << name;
    return reinterpret_cast<Entry>(found);
}

TEST(LoadedWindowingTest, HasNoWindowsWithoutAModule) {
    platform::LoadedWindowing windowing({"/nonexistent/module.so"});

    EXPECT_EQ(windowing.loadWindow("BindDialog"), nullptr);
    windowing.activateIgnoringOthers();
}

TEST(LoadedWindowingTest, HasNoWindowsByAFileThatIsNoModule) {
    EXPECT_EQ(platform::LoadedWindowing({"/etc/passwd"}).loadWindow("BindDialog"), nullptr);
    EXPECT_EQ(platform::LoadedWindowing({"libm.so.6", "/etc/passwd"}).loadWindow("BindDialog"),
              nullptr);
}

TEST(LoadedWindowingTest, TakesTheFirstModuleThatIsThere) {
    windowingOnScreen();
    platform::LoadedWindowing windowing({"/nonexistent/module.so", moduleFile()});

    EXPECT_NE(windowing.loadWindow("BindDialog"), nullptr);
    windowing.activateIgnoringOthers();
    settle();
}

TEST(LoadedWindowingTest, RunsTheToolkitsLoopWithTheQueuesDescriptor) {
    struct Queue {
        std::array<int, 2> pipe{};
        int dispatches = 0;
        platform::EndLoopEntry end = entry<platform::EndLoopEntry>(platform::kEndLoopEntry);
    } queue;
    windowingOnScreen();
    ASSERT_EQ(pipe(queue.pipe.data()), 0);
    ASSERT_EQ(write(queue.pipe[1], "ab", 2), 2);

    const auto run = entry<platform::RunLoopEntry>(platform::kRunLoopEntry);
    const int status = run(
        queue.pipe[0],
        [](void* context) {
            auto& self = *static_cast<Queue*>(context);
            char byte = 0;
            ASSERT_EQ(read(self.pipe[0], &byte, 1), 1);
            if (++self.dispatches == 2) self.end();
        },
        &queue);

    EXPECT_EQ(status, 0);
    EXPECT_EQ(queue.dispatches, 2);
    for (const int descriptor : queue.pipe) close(descriptor);
}

}  // namespace
}  // namespace vlm::test
