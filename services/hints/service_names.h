// The names under which the hints service is found.

#pragma once

namespace vlm::service {

inline constexpr const char* kDaemonName = "org.vlm.token.hints.daemon";  // on the system bus
inline constexpr const char* kAgentName = "org.vlm.token.hints.agent";    // on the session bus

inline constexpr const char* kObjectPath = "/org/vlm/token/hints";

// Exchange(a{sv} request) -> a{sv} reply
inline constexpr const char* kHintsInterface = "org.vlm.token.hints";

// The daemon's, for the instances that ask their users for PINs: RegisterPrompter()
inline constexpr const char* kPromptersInterface = "org.vlm.token.hints.Prompters";

// Such an instance's, for the daemon: AskPin, NameKeyring, AskKeyringPassword, UnlockKeyring, each
// (a{sv} question) -> a{sv} answer
inline constexpr const char* kPrompterInterface = "org.vlm.token.hints.Prompter";

// The agent's, for programs that watch tokens: Watch() -> as; signals Inserted(s) and Removed(s)
inline constexpr const char* kTokensInterface = "org.vlm.token.hints.Tokens";

// The right that changes one's own pairings, as polkit knows it: resources/polkit/
inline constexpr const char* kAdministratorRight = "org.vlm.vlmbind.admin";

}  // namespace vlm::service
