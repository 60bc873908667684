#include "services/pam/conversation.h"

#include <cstdlib>
#include <cstring>
#include <memory>

namespace vlm::pam {

namespace {

// The application allocated it with the C library.
struct Wiped {
    void operator()(char* text) const {
        service::wipeMemory({text, std::strlen(text)});
        std::free(text);
    }
};

struct Freed {
    void operator()(pam_response* response) const { std::free(response); }
};

}  // namespace

Transaction::Answer Conversation::hold(int style, const std::string& text) const {
    if (!_application || !_application->conv) return {PAM_CONV_ERR, {}};
    const pam_message message{style, text.c_str()};
    const pam_message* messages = &message;
    pam_response* made = nullptr;
    const int result = _application->conv(1, &messages, &made, _application->appdata_ptr);
    const std::unique_ptr<pam_response, Freed> response(made);
    const std::unique_ptr<char, Wiped> answer(response ? response->resp : nullptr);
    if (result == PAM_CONV_AGAIN) return {PAM_INCOMPLETE, {}};
    if (result != PAM_SUCCESS || !response) return {PAM_CONV_ERR, {}};
    if (!answer) return {PAM_AUTH_ERR, {}};
    return {PAM_SUCCESS, service::Secret(answer.get())};
}

Transaction::Answer Conversation::askSecretly(const std::string& prompt) const {
    return hold(PAM_PROMPT_ECHO_OFF, prompt);
}

void Conversation::tell(int style, const std::string& text) const { hold(style, text); }

}  // namespace vlm::pam
