#include <QPushButton>
#include <QTest>

#include "tests/contracts/windowing_contract.h"
#include "tests/integration/windowing/screen.h"

namespace vlm::contracts {

namespace {

class QtWindowingBackend {
public:
    ~QtWindowingBackend() { test::settle(); }

    std::optional<std::string> unavailable() { return std::nullopt; }
    platform::Windowing& get() { return test::windowingOnScreen(); }

    void click(const std::string& button) { test::click(button); }
    void clickClose() { test::bindDialog()->close(); }
    void dismissSheet() {
        auto* box = test::sheet();
        ASSERT_TRUE(box);
        QTest::mouseClick(box->defaultButton(), Qt::LeftButton);
    }
    bool isShown() { return test::bindDialog() && test::bindDialog()->isVisible(); }
    void settle() { test::settle(); }
    std::size_t sheets() { return test::sheet() ? 1 : 0; }
};

}  // namespace

INSTANTIATE_TYPED_TEST_SUITE_P(Qt, WindowingContract, QtWindowingBackend);

}  // namespace vlm::contracts
