// What platform/windowing.h promises, on the window that "BindDialog" describes. Verbs, which act
// on the window that was loaded last: click(button), clickClose(), dismissSheet(); isShown(),
// sheets(). settle() has the toolkit do what it put off.

#pragma once

#include <algorithm>

#include "platform/windowing.h"
#include "tests/contracts/contract_test.h"

namespace vlm::contracts {

template <typename Backend>
class WindowingContract : public ContractTest<Backend> {
protected:
    using Window = platform::Window;

    void SetUp() override {
        ContractTest<Backend>::SetUp();
        if (this->IsSkipped()) return;
        window = this->backend().get().loadWindow("BindDialog");
        ASSERT_TRUE(window);
    }

    platform::PopUpButton& popUp() { return *window->popUpButton("identityPopup"); }

    void show() { window->makeKeyAndOrderFront(); }

    static std::vector<platform::Control*> controlsBelow(platform::View& view) {
        std::vector<platform::Control*> controls;
        for (auto* part : view.subviews()) {
            if (auto* control = part->control()) controls.push_back(control);
            for (auto* below : controlsBelow(*part)) controls.push_back(below);
        }
        return controls;
    }

    std::unique_ptr<Window> window;
    int calls = 0;
};

TYPED_TEST_SUITE_P(WindowingContract);

TYPED_TEST_P(WindowingContract, GivesNoWindowForAnUnknownDescription) {
    EXPECT_EQ(this->backend().get().loadWindow("NoSuchWindow"), nullptr);
    EXPECT_EQ(this->backend().get().loadWindow(""), nullptr);
    EXPECT_EQ(this->backend().get().loadWindow("../ui/BindDialog"), nullptr);
}

TYPED_TEST_P(WindowingContract, FindsPartsByTheirNamesAndKinds) {
    EXPECT_TRUE(this->window->popUpButton("identityPopup"));
    EXPECT_TRUE(this->window->iconView("iconView"));
    EXPECT_TRUE(this->window->textLabel("identityLabel"));

    EXPECT_EQ(this->window->popUpButton("identityPopupp"), nullptr);
    EXPECT_EQ(this->window->popUpButton("identityLabel"), nullptr);
    EXPECT_EQ(this->window->iconView("identityPopup"), nullptr);
    EXPECT_EQ(this->window->textLabel("iconView"), nullptr);
}

TYPED_TEST_P(WindowingContract, ALoadedWindowIsNotShownYet) {
    EXPECT_FALSE(this->backend().isShown());

    this->show();

    EXPECT_TRUE(this->backend().isShown());
}

TYPED_TEST_P(WindowingContract, ShowsTheFirstItemAppendedToAnEmptyPopUp) {
    EXPECT_EQ(this->popUp().selectedItem(), std::nullopt);

    this->popUp().append({"Alice", platform::Bytes{0, 0xFF}, false});
    this->popUp().append({"Bob", platform::Bytes{2}, false});

    const auto selected = this->popUp().selectedItem();
    ASSERT_TRUE(selected);
    EXPECT_EQ(selected->title, "Alice");
    EXPECT_EQ(selected->object, (platform::Bytes{0, 0xFF}));
    EXPECT_FALSE(selected->isSeparator);
}

TYPED_TEST_P(WindowingContract, ForgetsTheSelectionWithTheItems) {
    this->popUp().append({"Alice", platform::Bytes{1}, false});
    this->popUp().append({"Bob", platform::Bytes{2}, false});

    this->popUp().removeAllItems();
    EXPECT_EQ(this->popUp().selectedItem(), std::nullopt);

    this->popUp().append({"Carol", platform::Bytes{3}, false});
    this->popUp().append({"Alice", platform::Bytes{1}, false});
    EXPECT_EQ(this->popUp().selectedItem()->title, "Carol");
}

TYPED_TEST_P(WindowingContract, SelectsAlsoASeparatorThatIsFirst) {
    this->popUp().append({"", std::nullopt, true});
    this->popUp().append({"Alice", platform::Bytes{1}, false});

    const auto selected = this->popUp().selectedItem();
    ASSERT_TRUE(selected);
    EXPECT_TRUE(selected->isSeparator);
    EXPECT_EQ(selected->object, std::nullopt);
}

TYPED_TEST_P(WindowingContract, KeepsTitlesAsTheyAre) {
    const std::string title = "<b>A&lice</b> && \xC3\x9Cmit\tx";

    this->popUp().append({title, platform::Bytes{1}, false});

    EXPECT_EQ(this->popUp().selectedItem()->title, title);
}

TYPED_TEST_P(WindowingContract, DisablesAndEnablesEachControl) {
    const auto controls = this->controlsBelow(this->window->contentView());
    ASSERT_EQ(controls.size(), 4U);  // the pop-up and three buttons

    for (auto* control : controls) {
        EXPECT_TRUE(control->isEnabled());
        control->setEnabled(false);
        EXPECT_FALSE(control->isEnabled());
        control->setEnabled(true);
        EXPECT_TRUE(control->isEnabled());
    }
}

TYPED_TEST_P(WindowingContract, GivesTheSameControlEachTime) {
    EXPECT_EQ(this->controlsBelow(this->window->contentView()),
              this->controlsBelow(this->window->contentView()));
}

TYPED_TEST_P(WindowingContract, CallsForEachClickAndOnlyForThatButton) {
    int cancels = 0;
    this->window->onClick("okButton", [&] { ++this->calls; });
    this->window->onClick("cancelButton", [&] { ++cancels; });
    this->show();

    this->backend().click("okButton");
    this->backend().click("okButton");

    EXPECT_EQ(this->calls, 2);
    EXPECT_EQ(cancels, 0);
}

TYPED_TEST_P(WindowingContract, ADisabledButtonIsNotClicked) {
    this->window->onClick("okButton", [&] { ++this->calls; });
    this->show();
    for (auto* control : this->controlsBelow(this->window->contentView()))
        control->setEnabled(false);

    this->backend().click("okButton");

    EXPECT_EQ(this->calls, 0);
}

TYPED_TEST_P(WindowingContract, ItsCloseButtonClicksTheOneThatTheDescriptionNames) {
    this->window->onClick("cancelButton", [&] { ++this->calls; });
    this->show();

    this->backend().clickClose();

    EXPECT_EQ(this->calls, 1);
    EXPECT_TRUE(this->backend().isShown()) << "the program closes it, or does not";
}

TYPED_TEST_P(WindowingContract, ItsCloseButtonDoesNothingWhileThatOneIsDisabled) {
    this->window->onClick("cancelButton", [&] { ++this->calls; });
    this->show();
    for (auto* control : this->controlsBelow(this->window->contentView()))
        control->setEnabled(false);

    this->backend().clickClose();

    EXPECT_EQ(this->calls, 0);
    EXPECT_TRUE(this->backend().isShown());
}

TYPED_TEST_P(WindowingContract, CallsOnceWhenASheetIsDismissed) {
    this->show();
    this->window->showSheet({platform::AlertStyle::Critical, "Failed", "Because", "OK"},
                            [&] { ++this->calls; });
    EXPECT_EQ(this->backend().sheets(), 1U);
    EXPECT_EQ(this->calls, 0);

    this->backend().dismissSheet();

    EXPECT_EQ(this->calls, 1);
    EXPECT_EQ(this->backend().sheets(), 0U);
    EXPECT_TRUE(this->backend().isShown());
}

TYPED_TEST_P(WindowingContract, ClosesWithoutAnyClickOrDismissal) {
    for (const char* button : {"okButton", "cancelButton", "dontShowAgainButton"})
        this->window->onClick(button, [&] { ++this->calls; });
    this->show();
    this->window->showSheet({platform::AlertStyle::Critical, "Failed", "", "OK"},
                            [&] { ++this->calls; });

    this->window->close();
    this->window->close();

    EXPECT_EQ(this->calls, 0);
    EXPECT_EQ(this->backend().sheets(), 0U);
    EXPECT_FALSE(this->backend().isShown());
}

TYPED_TEST_P(WindowingContract, IsHiddenForGood) {
    this->show();
    this->window->close();

    this->show();

    EXPECT_FALSE(this->backend().isShown());
}

TYPED_TEST_P(WindowingContract, GoesFromTheScreenWithItsOwner) {
    this->show();

    this->window.reset();

    EXPECT_FALSE(this->backend().isShown());
}

TYPED_TEST_P(WindowingContract, MayBeLetGoByAClick) {
    this->window->onClick("okButton", [&] {
        this->window.reset();
        ++this->calls;
    });
    this->show();

    this->backend().click("okButton");

    EXPECT_EQ(this->calls, 1);
    EXPECT_FALSE(this->backend().isShown());
}

TYPED_TEST_P(WindowingContract, MayBeLetGoByItsCloseButton) {
    this->window->onClick("cancelButton", [&] {
        this->window.reset();
        ++this->calls;
    });
    this->show();

    this->backend().clickClose();

    EXPECT_EQ(this->calls, 1);
    EXPECT_FALSE(this->backend().isShown());
}

TYPED_TEST_P(WindowingContract, MayBeLetGoByADismissal) {
    this->show();
    this->window->showSheet({platform::AlertStyle::Critical, "Failed", "", "OK"}, [&] {
        this->window.reset();
        ++this->calls;
    });

    this->backend().dismissSheet();

    EXPECT_EQ(this->calls, 1);
    EXPECT_FALSE(this->backend().isShown());
}

TYPED_TEST_P(WindowingContract, CallsNothingOnceItWasLetGo) {
    this->window->onClick("okButton", [&] { ++this->calls; });
    this->show();
    this->window->showSheet({platform::AlertStyle::Critical, "Failed", "", "OK"},
                            [&] { ++this->calls; });

    this->window.reset();
    this->backend().settle();

    EXPECT_EQ(this->calls, 0);
    EXPECT_EQ(this->backend().sheets(), 0U);
}

REGISTER_TYPED_TEST_SUITE_P(WindowingContract, GivesNoWindowForAnUnknownDescription,
                            FindsPartsByTheirNamesAndKinds, ALoadedWindowIsNotShownYet,
                            ShowsTheFirstItemAppendedToAnEmptyPopUp,
                            ForgetsTheSelectionWithTheItems, SelectsAlsoASeparatorThatIsFirst,
                            KeepsTitlesAsTheyAre, DisablesAndEnablesEachControl,
                            GivesTheSameControlEachTime, CallsForEachClickAndOnlyForThatButton,
                            ADisabledButtonIsNotClicked,
                            ItsCloseButtonClicksTheOneThatTheDescriptionNames,
                            ItsCloseButtonDoesNothingWhileThatOneIsDisabled,
                            CallsOnceWhenASheetIsDismissed, ClosesWithoutAnyClickOrDismissal,
                            IsHiddenForGood, GoesFromTheScreenWithItsOwner, MayBeLetGoByAClick,
                            MayBeLetGoByItsCloseButton, MayBeLetGoByADismissal,
                            CallsNothingOnceItWasLetGo);

}  // namespace vlm::contracts
