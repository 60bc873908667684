// Localization: the texts of this program in the user's language, by key.
//
// Threads:   any.
// Errors:    a key without a text in any language answers the empty text.
// Behind it: platform/linux/gettext_localization.h
// In tests:  tests/fakes/fake_localization.h, tests/contracts/localization_contract.h

#pragma once

#include <string>
#include <string_view>

namespace vlm::platform {

class Localization {
public:
    virtual ~Localization() = default;

    // The text for the key from the program's own table ("Bind"), as UTF-8; the English one when
    // the user's language has none.
    virtual std::string text(std::string_view key) = 0;
};

}  // namespace vlm::platform
