// What platform/localization.h promises. Verbs: translate(key, text), into the user's language.

#pragma once

#include "platform/localization.h"
#include "tests/contracts/contract_test.h"

namespace vlm::contracts {

template <typename Backend>
class LocalizationContract : public ContractTest<Backend> {};

TYPED_TEST_SUITE_P(LocalizationContract);

TYPED_TEST_P(LocalizationContract, GivesTheTextOfAKey) {
    this->backend().translate("GREETING", "Good day");
    this->backend().translate("FAREWELL", "Good bye");

    EXPECT_EQ(this->backend().get().text("GREETING"), "Good day");
    EXPECT_EQ(this->backend().get().text("FAREWELL"), "Good bye");
}

TYPED_TEST_P(LocalizationContract, GivesUtf8) {
    this->backend().translate("GREETING", "Gr\xC3\xBC\xC3\x9F Gott");

    EXPECT_EQ(this->backend().get().text("GREETING"), "Gr\xC3\xBC\xC3\x9F Gott");
}

TYPED_TEST_P(LocalizationContract, GivesTheEmptyTextForAnUnknownKey) {
    this->backend().translate("GREETING", "Good day");

    EXPECT_EQ(this->backend().get().text("GREET"), "");
    EXPECT_EQ(this->backend().get().text("greeting"), "");
    EXPECT_EQ(this->backend().get().text(""), "");
}

REGISTER_TYPED_TEST_SUITE_P(LocalizationContract, GivesTheTextOfAKey, GivesUtf8,
                            GivesTheEmptyTextForAnUnknownKey);

}  // namespace vlm::contracts
