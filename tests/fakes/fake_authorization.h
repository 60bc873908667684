// An authority on rights, and an administrator in front of it, who decides as a test says.

#pragma once

#include <memory>
#include <set>
#include <string>
#include <vector>

#include "platform/authorization.h"

namespace vlm::fakes {

class FakeAuthorization final : public platform::Authorization {
public:
    // What a test does to the world. Who is asked allows until the test says otherwise.
    void allow() { _decision = platform::kSuccess; }
    void deny() { _decision = platform::kAuthorizationDenied; }
    void dismiss() { _decision = platform::kAuthorizationCanceled; }
    void leave() { _decision = platform::kInteractionNotAllowed; }  // there is nobody to be asked
    void answerWith(platform::Status status) { _decision = status; }
    void keep(const std::string& right) { _kept.insert(right); }  // granted without a question
    void refuseSessions(platform::Status status) { _sessionStatus = status; }

    // What happened.
    std::vector<std::string> requested;  // rights, whether somebody was asked or not
    std::vector<std::string> asked;      // those that a person was asked for
    int sessions = 0;                    // made
    int openSessions = 0;                // and not yet gone

    platform::CreatedAuthorizationSession createSession() override {
        if (_sessionStatus != platform::kSuccess) return {_sessionStatus, nullptr};
        return {platform::kSuccess, std::make_unique<FakeSession>(*this)};
    }

private:
    class FakeSession final : public platform::AuthorizationSession {
    public:
        explicit FakeSession(FakeAuthorization& world) : _world(world) {
            ++_world.sessions;
            ++_world.openSessions;
        }
        FakeSession(const FakeSession&) = delete;
        FakeSession& operator=(const FakeSession&) = delete;
        ~FakeSession() override { --_world.openSessions; }

        platform::Status request(std::string_view right,
                                 platform::AuthorizationFlags flags) override {
            _world.requested.emplace_back(right);
            if (_world._kept.contains(std::string(right))) return platform::kSuccess;
            if (!flags.interactionAllowed || !flags.extendRights)
                return platform::kInteractionNotAllowed;
            if (_world._decision != platform::kInteractionNotAllowed)
                _world.asked.emplace_back(right);
            return _world._decision;
        }

    private:
        FakeAuthorization& _world;
    };

    platform::Status _decision = platform::kSuccess;
    platform::Status _sessionStatus = platform::kSuccess;
    std::set<std::string> _kept;
};

}  // namespace vlm::fakes
