#pragma once

#include <security/pam_modules.h>

#include <string>
#include <utility>
#include <vector>

#include "services/pam/transaction.h"

namespace vlm::fakes {

// A transaction whose person does what the test says, and that writes down what was asked and told.
class FakeTransaction final : public pam::Transaction {
public:
    // What a test does to the world. The name that the person gives when asked for it; empty for
    // one who gives none.
    void name(const std::string& user) { _user = user; }
    void willNameThemselves(const std::string& user) { _typedUser = user; }
    void willType(const std::string& pin) { _typed.push_back(pin); }
    void willFailToAnswer(int result) { _answerResult = result; }
    void beAt(const std::string& terminal, const std::string& remoteHost = "") {
        _terminal = terminal;
        _remoteHost = remoteHost;
    }
    void openSession(const std::string& id) { _session = id; }
    void changePassword(const std::string& former, const std::string& password) {
        _formerToken = former;
        givenToken = password;
    }
    void refuseData() { _takesData = false; }

    // What happened.
    std::vector<std::string> prompts;
    std::vector<std::string> told;  // "info: ..." and "error: ..."
    std::string givenToken;

    std::string user() override { return _user; }
    int askForUser() override {
        prompts.emplace_back("(name)");
        if (_typedUser.empty()) return PAM_CONV_ERR;
        _user = _typedUser;
        return PAM_SUCCESS;
    }
    int setUser(const std::string& user) override {
        _user = user;
        return PAM_SUCCESS;
    }
    Answer askSecretly(const std::string& prompt) override {
        prompts.push_back(prompt);
        if (_answerResult != PAM_SUCCESS) return {_answerResult, {}};
        if (_typed.empty()) return {PAM_AUTH_ERR, {}};
        service::Secret answer(_typed.front());
        _typed.erase(_typed.begin());
        return {PAM_SUCCESS, std::move(answer)};
    }
    void inform(const std::string& text) override { told.push_back("info: " + text); }
    void warn(const std::string& text) override { told.push_back("error: " + text); }
    void debug(const std::string&) override {}
    int giveToken(const service::Secret& token) override {
        givenToken = token.text();
        return PAM_SUCCESS;
    }
    std::optional<service::Secret> token() override {
        if (givenToken.empty()) return std::nullopt;
        return service::Secret(givenToken);
    }
    bool knowsFormerToken() override { return !_formerToken.empty(); }
    std::string terminal() override { return _terminal; }
    std::string remoteHost() override { return _remoteHost; }
    std::string sessionId() override { return _session; }
    int remember(const pam::LoggedIn& login) override {
        if (!_takesData) return PAM_SYSTEM_ERR;
        _login = login;
        return PAM_SUCCESS;
    }
    void forget() override { _login.reset(); }
    std::optional<pam::LoggedIn> remembered() override { return _login; }

private:
    std::string _user;
    std::string _typedUser;
    std::vector<std::string> _typed;
    int _answerResult = PAM_SUCCESS;
    std::string _terminal;
    std::string _remoteHost;
    std::string _session;
    std::string _formerToken;
    bool _takesData = true;
    std::optional<pam::LoggedIn> _login;
};

}  // namespace vlm::fakes
