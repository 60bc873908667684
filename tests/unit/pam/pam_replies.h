// The hints service's replies to a login, and a service that gives them.

#pragma once

#include <chrono>
#include <deque>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "platform/message.h"
#include "platform/property_list.h"
#include "platform/token_framework.h"
#include "services/hints/reply.h"
#include "services/hints/secret_pipe.h"
#include "services/pam/exchange.h"

namespace vlm::pam {

using Reply = std::optional<platform::Message>;

inline platform::Message numbered(std::int64_t number) {
    platform::Message reply;
    reply.set("res", number);
    return reply;
}

inline Reply refusal(std::int64_t status, const std::string& text = "the reason.") {
    auto reply = numbered(status);
    platform::encodeReplyError(
        {std::string(platform::VLErrorDomain), static_cast<platform::Status>(status), text},
        &reply);
    return reply;
}

inline Reply card(std::int64_t flags = 0, const std::string& account = "alice") {
    auto reply = numbered(0);
    reply.set("str1", account);
    reply.set("str2", std::string("pkcs11:token=a"));
    reply.set("str3", std::string("PIV Card"));
    reply.set("dat1", platform::Bytes(32, 1));
    reply.set("num1", flags);
    return reply;
}

inline Reply letIn() {
    auto reply = numbered(0);
    reply.set("str1", std::string("No key is stored."));
    return reply;
}

inline Reply letInWith(const std::string& unlockKey) {
    auto reply = numbered(0);
    reply.set("dat1", *service::pipeHolding(service::Secret(unlockKey)));
    return reply;
}

inline Reply silence() { return std::nullopt; }

// Answers each operation with what the test has laid out for it, and with silence after that.
class ScriptedService {
public:
    void answer(std::uint64_t operation, Reply reply) {
        _script.emplace_back(operation, std::move(reply));
    }

    Exchange exchange() {
        return [this](const platform::Message& request, std::chrono::seconds patience) -> Reply {
            requests.push_back(request);
            patiences.push_back(patience);
            const auto operation = request.unsignedInteger("op");
            for (auto each = _script.begin(); each != _script.end(); ++each) {
                if (each->first != operation) continue;
                auto reply = std::move(each->second);
                _script.erase(each);
                return reply;
            }
            return std::nullopt;
        };
    }

    std::vector<platform::Message> requests;
    std::vector<std::chrono::seconds> patiences;

private:
    std::deque<std::pair<std::uint64_t, Reply>> _script;
};

}  // namespace vlm::pam
