#pragma once

#include <deque>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "open_questions.h"
#include "services/keychain/login_keyring.h"

namespace vlm::fakes {

// A keyring that one password opens. It answers when the test lets it.
class FakeLoginKeyring final : public service::LoginKeyring {
public:
    // What a test does to the world.
    void makeOne(const std::string& password) {
        _found = service::FoundKeyring{"/keyring/login", true};
        _password = password;
    }
    void checkNothing() { _found->checksPasswords = false; }
    void hang() { _hangs = true; }
    void fail() { _fails = true; }

    // Lets it answer everything that was asked of it, also in the course of it.
    void settle() {
        while (!_hangs && (_finds.count() > 0 || _tries.count() > 0)) {
            if (_finds.count() > 0)
                _finds.answerOldest(_found);
            else
                _tries.answerOldest(verdict());
        }
    }

    // What happened.
    std::vector<std::string> tried;
    std::size_t open() const { return _finds.count() + _tries.count(); }

    std::unique_ptr<Work> find(
        std::function<void(std::optional<service::FoundKeyring>)> answer) override {
        return _finds.add(std::move(answer));
    }
    std::unique_ptr<Work> tryPassword(
        const service::Secret& password,
        std::function<void(service::KeyringVerdict)> answer) override {
        tried.emplace_back(password.text());
        return _tries.add(std::move(answer));
    }

private:
    service::KeyringVerdict verdict() const {
        if (_fails) return service::KeyringVerdict::Failed;
        return tried.back() == _password ? service::KeyringVerdict::Opened
                                         : service::KeyringVerdict::Refused;
    }

    std::optional<service::FoundKeyring> _found;
    std::string _password;
    bool _hangs = false;
    bool _fails = false;
    OpenQuestions<Work, std::optional<service::FoundKeyring>> _finds;
    OpenQuestions<Work, service::KeyringVerdict> _tries;
};

}  // namespace vlm::fakes
