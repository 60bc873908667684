// SessionCards: with which card each session was logged in, for as long as the session lasts.
//
// The daemon records it, and the instance of the session's user reads it. A file named by the
// session holds the token's identifier in one line.
//
// Shapes:    a session is named as logind names it, by letters and digits.
// Threads:   any. Blocking: for a file system in memory.
// Errors:    a sentence for the log; what cannot be read was not recorded.
// In tests:  tests/unit/services/session_cards_test.cpp

#pragma once

#include <functional>
#include <optional>
#include <string>
#include <utility>

namespace vlm::service {

class SessionCards {
public:
    static constexpr const char* kUsualFolder = "/run/vlm/sessions";

    explicit SessionCards(std::string folder = kUsualFolder) : _folder(std::move(folder)) {}

    // Why it is not recorded; none when it is. What was recorded for the session before is
    // replaced.
    std::optional<std::string> record(const std::string& session, const std::string& token) const;

    std::optional<std::string> tokenOf(const std::string& session) const;

    // Forgets the sessions of which this is not true.
    void forgetUnless(const std::function<bool(const std::string& session)>& isThere) const;

private:
    const std::string _folder;
};

}  // namespace vlm::service
