// Writes cards into the token store that SOFTHSM2_CONF names. The module keeps state for the whole
// process, so this runs in a program of its own.

#pragma once

#include <p11-kit/pkcs11.h>

#include <optional>
#include <string>

#include "tests/tools/soft_card/card_description.h"

namespace vlm::test {

class SoftTokenStore {
public:
    explicit SoftTokenStore(const std::string& modulePath);
    ~SoftTokenStore();
    SoftTokenStore(const SoftTokenStore&) = delete;
    SoftTokenStore& operator=(const SoftTokenStore&) = delete;

    // The reason why the card could not be written; none when it was.
    std::optional<std::string> write(const Card& card);

private:
    CK_FUNCTION_LIST* _module = nullptr;
};

}  // namespace vlm::test
