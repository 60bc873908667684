// The world of the tests of BindOperation: a hints service in memory, and two cards to insert.

#pragma once

#include <memory>
#include <string>
#include <utility>

#include "bind/bind_operation.h"
#include "fake_hints_service.h"
#include "platform_test.h"

namespace vlm {

class BindOperationTest : public fakes::PlatformTest {
protected:
    using Service = fakes::FakeHintsService;
    using Bytes = platform::Bytes;
    using Identities = BindOperation::UnpairedIdentities;
    using WrapKeys = BindOperation::WrapKeysHashMap;

    const std::string blue = "pkcs11:token=blue";
    const std::string red = "pkcs11:token=red";
    const Bytes blueSigning{0xB1};
    const Bytes blueMail{0xB2};
    const Bytes blueWrap{0xBB};
    const Bytes redSigning{0xA1};
    const Bytes redWrap{0xAA};

    void SetUp() override { service.plugInto(ipc()); }

    void insertBlue() {
        service.insert(
            {blue, "Blue Card", {{blueSigning, "Alice"}, {blueMail, "Alice (mail)"}}, blueWrap});
    }
    void insertRed() { service.insert({red, "Red Card", {{redSigning, "Bob"}}, redWrap}); }
    void insertRedWithoutWrapKey() {
        service.insert({red, "Red Card", {{redSigning, "Bob"}}, std::nullopt});
    }

    int askedForTokens() { return service.requests[Service::kCopyAvailableTokensInfo]; }

    // What the cache offers; none when there is no cache.
    std::optional<Identities> offered() const {
        const auto map = operation->unpairedIdentities();
        return map ? std::optional(*map) : std::nullopt;
    }
    std::optional<WrapKeys> wrapKeys() const {
        const auto map = operation->wrapKeysHashMap();
        return map ? std::optional(*map) : std::nullopt;
    }

    bool debugged(const std::string& text) { return log().has(platform::LogLevel::Debug, text); }
    bool noticed(const std::string& text) { return log().has(platform::LogLevel::Default, text); }
    bool complained(const std::string& text) { return log().has(platform::LogLevel::Error, text); }

    Service service;
    std::shared_ptr<BindOperation> operation = BindOperation::initWithUserName("alice");
};

}  // namespace vlm
