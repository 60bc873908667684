#include "fuzz/pam_properties.h"

#include <security/pam_modules.h>

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <optional>
#include <string>

#include "platform/harmless_text.h"
#include "platform/message.h"
#include "platform/token_framework.h"
#include "services/hints/secret_pipe.h"
#include "services/pam/authentication.h"
#include "services/pam/conversation.h"

namespace vlm::fuzz {

namespace {

// What the data chooses, from its front; zeros when it is used up.
class Choices {
public:
    explicit Choices(std::span<const std::uint8_t> data) : _data(data) {}

    std::uint8_t byte() {
        if (_data.empty()) return 0;
        const auto first = _data.front();
        _data = _data.subspan(1);
        return first;
    }
    bool flag() { return byte() % 2 != 0; }
    // Every status is among them.
    std::int64_t number() {
        const std::int64_t low = byte();
        return flag() ? low : low - 2200;
    }
    std::string text() {
        const std::size_t wanted = std::size_t{byte()} * 2;
        const auto size = std::min(wanted, _data.size());
        std::string taken(_data.begin(), _data.begin() + static_cast<std::ptrdiff_t>(size));
        _data = _data.subspan(size);
        return taken;
    }

private:
    std::span<const std::uint8_t> _data;
};

// What the card is called ends neither the line of a prompt nor its quotes.
bool isHarmless(std::string_view shown, int style) {
    const bool isPrompt = style == PAM_PROMPT_ECHO_OFF;
    return platform::harmlessText(shown, platform::kAllCharacters) == shown &&
           (!isPrompt || std::ranges::count(shown, '"') == 2);
}

// Whoever PAM talks to: answers, fails, and answers while failing.
struct Application {
    Choices& choices;
    bool isTextHarmless = true;

    static int converse(int, const pam_message** messages, pam_response** responses, void* self) {
        auto& application = *static_cast<Application*>(self);
        const std::string_view shown = messages[0]->msg;
        if (!isHarmless(shown, messages[0]->msg_style)) application.isTextHarmless = false;
        auto& choices = application.choices;
        *responses = nullptr;
        if (choices.flag()) {
            *responses = static_cast<pam_response*>(std::calloc(1, sizeof(pam_response)));
            if (choices.flag()) (*responses)->resp = strdup(choices.text().c_str());
        }
        return choices.flag() ? PAM_SUCCESS : choices.byte() % 40 - 1;
    }
};

class FuzzedTransaction final : public pam::Transaction {
public:
    explicit FuzzedTransaction(Choices& choices) : _choices(choices), _application{choices} {
        if (choices.flag()) _user = choices.text();
    }

    bool isTextHarmless() const { return _application.isTextHarmless; }

    std::string user() override { return _user; }
    int askForUser() override {
        if (!_choices.flag()) return PAM_CONV_ERR;
        _user = "n" + _choices.text();
        return PAM_SUCCESS;
    }
    int setUser(const std::string& user) override {
        _user = user;
        return _choices.flag() ? PAM_SUCCESS : PAM_SYSTEM_ERR;
    }
    Answer askSecretly(const std::string& prompt) override {
        return pam::Conversation(&_conv).askSecretly(prompt);
    }
    void inform(const std::string& text) override { tell(PAM_TEXT_INFO, text); }
    void warn(const std::string& text) override { tell(PAM_ERROR_MSG, text); }
    void debug(const std::string&) override {}
    int giveToken(const service::Secret&) override {
        return _choices.flag() ? PAM_SUCCESS : PAM_AUTHTOK_ERR;
    }
    std::optional<service::Secret> token() override { return std::nullopt; }
    bool knowsFormerToken() override { return false; }
    std::string terminal() override { return _choices.text(); }
    std::string remoteHost() override { return {}; }
    std::string sessionId() override { return {}; }
    int remember(const pam::LoggedIn&) override { return PAM_SUCCESS; }
    void forget() override {}
    std::optional<pam::LoggedIn> remembered() override { return std::nullopt; }

private:
    void tell(int style, const std::string& text) { pam::Conversation(&_conv).tell(style, text); }

    Choices& _choices;
    Application _application;
    const pam_conv _conv{Application::converse, &_application};
    std::string _user;
};

platform::Message::Value valueFrom(Choices& choices) {
    switch (choices.byte() % 4) {
        case 0:
            return std::uint64_t{choices.byte()};
        case 1:
            return choices.number();
        case 2:
            return choices.text();
        default: {
            const auto text = choices.text();
            return platform::Bytes(text.begin(), text.end());
        }
    }
}

// A reply as the service gives it, or anything else under the same keys.
std::optional<platform::Message> replyFrom(Choices& choices) {
    if (choices.byte() % 8 == 0) return std::nullopt;
    platform::Message reply;
    if (choices.flag()) {
        reply.set("res", std::int64_t{0});
        reply.set("str1", choices.text());
        reply.set("str2", choices.text());
        reply.set("str3", choices.text());
        reply.set("dat1", platform::Bytes(32, 7));
        reply.set("num1", std::int64_t{choices.byte()});
    }
    constexpr const char* kKeys[] = {"res", "str1", "str2", "str3", "dat1", "num1", "err"};
    while (choices.flag()) {
        const char* key = kKeys[choices.byte() % 7];
        reply.set(key, valueFrom(choices));
    }
    return reply;
}

}  // namespace

bool pamConversationIsSound(std::span<const std::uint8_t> data) {
    Choices choices(data);
    FuzzedTransaction transaction(choices);
    bool wasLetIn = false;
    const auto exchange = [&](const platform::Message& request, std::chrono::seconds) {
        auto reply = replyFrom(choices);
        wasLetIn = request.unsignedInteger("op") == 12 && reply && reply->integer("res") == 0;
        return reply;
    };
    const bool isRequired = choices.flag();
    const int result = pam::Authentication({transaction, exchange, std::chrono::seconds(5),
                                            [&](const std::string&) { return isRequired; }})
                           .run();
    return transaction.isTextHarmless() && result != PAM_IGNORE &&
           (result != PAM_SUCCESS || wasLetIn);
}

}  // namespace vlm::fuzz
