#include "services/hints/keyring_errands.h"

#include <utility>

#include "services/hints/keyring_messages.h"
#include "services/hints/keyring_password.h"
#include "services/hints/keyring_unlocking.h"
#include "services/hints/reply.h"
#include "services/hints/status.h"

namespace vlm::service {

namespace {

Refusal notUnderstood() { return {status::kBadRequest, "the question cannot be understood"}; }

}  // namespace

Outcome<DaemonErrand::Work> KeyringNaming::begin(const Caller&, const platform::Message&,
                                                 Reply reply) {
    return Work(_keyring.find([reply = std::move(reply)](const std::optional<FoundKeyring>& found) {
        reply(found ? writeKeyringName(found->path)
                    : refusalReply({status::kNoKeyring, "the user has no login keyring."}));
    }));
}

Outcome<DaemonErrand::Work> KeyringPasswordAsking::begin(const Caller&,
                                                         const platform::Message& request,
                                                         Reply reply) {
    auto question = readKeyringQuestion(request);
    if (!question) return notUnderstood();
    return Work(std::make_shared<KeyringPassword>(
        _prompt, _keyring, std::move(*question),
        [reply = std::move(reply)](const Outcome<Secret>& password) {
            reply(password ? writeKeyringPassword(*password) : refusalReply(password.refusal()));
        }));
}

Outcome<DaemonErrand::Work> KeyringOpening::begin(const Caller&, const platform::Message& request,
                                                  Reply reply) {
    auto password = readUnlocking(request);
    if (!password) return notUnderstood();
    return Work(std::make_shared<KeyringUnlocking>(
        _keyring, std::move(*password),
        [reply = std::move(reply)](const std::optional<Refusal>& refusal) {
            reply(refusal ? refusalReply(*refusal) : numberReply(status::kSuccess));
        }));
}

}  // namespace vlm::service
