#include "ui/window_controller.h"

#include "platform_test.h"

namespace vlm {
namespace {

class TracingController final : public WindowController {
public:
    explicit TracingController(std::vector<std::string>& record)
        : WindowController("Traced"), _record(record) {}

private:
    void connectOutlets(platform::Window&) override { _record.emplace_back("outlets"); }
    void windowDidLoad() override {
        _record.emplace_back("loaded");
        EXPECT_NE(window(), nullptr);
    }

    std::vector<std::string>& _record;
};

class WindowControllerTest : public fakes::PlatformTest {
protected:
    using Strings = std::vector<std::string>;

    void SetUp() override {
        windowing().describe("Traced", [](fakes::FakeScreenWindow&) {});
    }

    TracingController controller{windowing().record};
};

TEST_F(WindowControllerTest, LoadsItsWindowOnFirstUseAndOnce) {
    EXPECT_EQ(windowing().record, Strings{});

    auto* first = controller.window();

    EXPECT_NE(first, nullptr);
    EXPECT_EQ(controller.window(), first);
    EXPECT_EQ(windowing().record, (Strings{"load Traced", "outlets", "loaded"}));
}

TEST_F(WindowControllerTest, BringsItsWindowToTheFrontEachTime) {
    EXPECT_TRUE(controller.showWindow());
    EXPECT_TRUE(controller.showWindow());

    EXPECT_EQ(windowing().record, (Strings{"load Traced", "outlets", "loaded", "key", "key"}));
}

TEST_F(WindowControllerTest, TriesAgainToLoadAWindow) {
    windowing().describe("Traced", nullptr);
    EXPECT_EQ(controller.window(), nullptr);
    EXPECT_FALSE(controller.showWindow());

    windowing().describe("Traced", [](fakes::FakeScreenWindow&) {});
    EXPECT_NE(controller.window(), nullptr);
}

TEST_F(WindowControllerTest, HasNoWindowOnceItIsClosed) {
    controller.showWindow();

    controller.close();
    EXPECT_FALSE(controller.showWindow());

    EXPECT_EQ(controller.window(), nullptr);
    EXPECT_FALSE(windowing().windows.at(0)->shown);
    EXPECT_EQ(windowing().windows.size(), 1U);
}

TEST_F(WindowControllerTest, ClosingLoadsNothing) {
    controller.close();

    EXPECT_EQ(windowing().record, Strings{});
}

}  // namespace
}  // namespace vlm
