#include "tests/contracts/windowing_contract.h"

#include "fake_bind_dialog_window.h"

namespace vlm::contracts {

namespace {

class FakeWindowingBackend : public FakeBackend<fakes::FakeWindowing> {
public:
    FakeWindowingBackend() { fakes::describeBindDialog(get()); }

    void click(const std::string& button) { screen().click(button); }
    void clickClose() { screen().clickClose(); }
    void dismissSheet() { screen().dismissSheet(); }
    bool isShown() { return screen().shown; }
    void settle() {}
    std::size_t sheets() { return screen().sheets.size(); }

private:
    fakes::FakeScreenWindow& screen() { return *get().windows.back(); }
};

}  // namespace

INSTANTIATE_TYPED_TEST_SUITE_P(Fake, WindowingContract, FakeWindowingBackend);

}  // namespace vlm::contracts
