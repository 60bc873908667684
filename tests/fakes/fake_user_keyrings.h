#pragma once

#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "open_questions.h"
#include "services/hints/user_keyrings.h"

namespace vlm::fakes {

// Users whose keyrings and who themselves answer when the test says so.
class FakeUserKeyrings final : public service::UserKeyrings {
public:
    // What a user's side does. Each answers the oldest question of its kind that is still open.
    void tellName(service::Outcome<std::string> name) { names.answerOldest(std::move(name)); }
    void enter(const std::string& password) { passwords.answerOldest(service::Secret(password)); }
    void refuse(service::Refusal why) { passwords.answerOldest(std::move(why)); }
    void finishUnlocking(std::optional<service::Refusal> refusal) {
        unlockings.answerOldest(std::move(refusal));
    }

    // What happened.
    std::vector<platform::UserId> users;  // asked, in whatever way
    std::vector<service::KeyringQuestion> questions;
    std::vector<std::string> passwordsGiven;

    OpenQuestions<Question, service::Outcome<std::string>> names;
    OpenQuestions<Question, service::Outcome<service::Secret>> passwords;
    OpenQuestions<Question, std::optional<service::Refusal>> unlockings;

    std::unique_ptr<Question> name(
        platform::UserId user, std::function<void(service::Outcome<std::string>)> answer) override {
        users.push_back(user);
        return names.add(std::move(answer));
    }
    std::unique_ptr<Question> askPassword(
        platform::UserId user, const service::KeyringQuestion& question,
        std::function<void(service::Outcome<service::Secret>)> answer) override {
        users.push_back(user);
        questions.push_back(question);
        return passwords.add(std::move(answer));
    }
    std::unique_ptr<Question> unlock(
        platform::UserId user, const service::Secret& password,
        std::function<void(std::optional<service::Refusal>)> answer) override {
        users.push_back(user);
        passwordsGiven.emplace_back(password.text());
        return unlockings.add(std::move(answer));
    }
};

}  // namespace vlm::fakes
