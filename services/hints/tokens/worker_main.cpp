// vlm-token-worker: answers for the tokens of one card module. The hints service starts it with a
// socket as descriptor 3; it serves that until the other side closes it.
//
//   vlm-token-worker LOOK-AGAIN-MILLISECONDS MODULE-PATH
//   vlm-token-worker anchors MODULE-PATH
//
// In the second form the module is one that holds trust anchors: these are told, without a
// question, and that is all.

#include <sys/stat.h>
#include <unistd.h>

#include <charconv>
#include <ctime>
#include <iostream>
#include <string>

#include "services/hints/closed_process.h"
#include "services/hints/tokens/anchor_reader.h"
#include "services/hints/tokens/card_module.h"
#include "services/hints/tokens/frames.h"
#include "services/hints/tokens/worker_protocol.h"

namespace vlm::service {
namespace {

constexpr int kSocket = 3;
constexpr unsigned kSecondsToLeave = 5;

class Worker {
public:
    Worker(std::string modulePath, std::chrono::milliseconds lookAgainAfter)
        : _modulePath(std::move(modulePath)), _lookAgainAfter(lookAgainAfter) {}

    void serve() {
        while (const auto message = readFrame(kSocket)) {
            auto request = decodeRequest(*message);
            if (!request) return;
            bool answered = false;
            if (auto* proof = std::get_if<ProofRequest>(&*request)) {
                auto pin = readSecretFrame(kSocket, kMostPinBytes);
                if (!pin) return;
                proof->pin = std::move(*pin);
                answered = prove(std::move(*proof));
            } else {
                answered = write(list());
            }
            if (!answered) return;
        }
    }

private:
    // Why the module is of no use; none when it is loaded.
    std::optional<FailedAnswer> load() {
        if (_module) return {};
        FailedAnswer failed;
        auto module = Pkcs11Module::load(_modulePath, &failed.reason);
        if (!module) return failed;
        _module.emplace(std::move(module), _lookAgainAfter);
        return {};
    }

    std::optional<Bytes> list() {
        if (const auto failed = load()) return encodeAnswer(*failed);
        auto [tokens, problems] = _module->list(std::time(nullptr));
        ListAnswer answer{std::nullopt, std::move(problems), _module->announcesNothing()};
        if (_told != tokens) answer.tokens = _told = std::move(tokens);
        return encodeAnswer(answer);
    }

    bool prove(ProofRequest request) {
        if (const auto failed = load()) return write(encodeAnswer(*failed));
        bool told = false;
        const auto opening = _module->prove(
            std::move(request), [&told](const Proof& proof) { told = write(encodeAnswer(proof)); });
        if (!told || !opening) return told;
        return write(encodeAnswer(OpeningAnswer{opening->whyNot})) &&
               writeFrame(kSocket, opening->opened.octets());
    }

    static bool write(const std::optional<Bytes>& answer) {
        return answer && writeFrame(kSocket, *answer);
    }

    std::string _modulePath;
    std::chrono::milliseconds _lookAgainAfter;
    std::optional<CardModule> _module;
    std::optional<std::vector<Token>> _told;  // what the other side knows
};

bool hasSocket() {
    struct stat status = {};
    return fstat(kSocket, &status) == 0 && S_ISSOCK(status.st_mode);
}

// False when the words are none that this program is started with.
bool serve(std::string_view word, const std::string& modulePath) {
    if (word == "anchors") {
        if (const auto anchors = readAnchors(modulePath)) {
            if (const auto message = encodeAnchors(*anchors)) writeFrame(kSocket, *message);
        }
        return true;
    }
    int milliseconds = 0;
    const char* end = word.data() + word.size();
    if (word.empty() || std::from_chars(word.data(), end, milliseconds).ptr != end) return false;
    Worker(modulePath, std::chrono::milliseconds(milliseconds)).serve();
    return true;
}

int run(int argc, char* argv[]) {
    closeToOthers();
    if (argc != 3 || !hasSocket() || !serve(argv[1], argv[2])) {
        std::cerr << "vlm-token-worker: it is started by the hints service, not by hand\n";
        return 2;
    }
    // Nobody waits any more; a module that does not come to an end is cut short.
    alarm(kSecondsToLeave);
    return 0;
}

}  // namespace
}  // namespace vlm::service

int main(int argc, char* argv[]) {
    const int status = vlm::service::run(argc, argv);
    // The module's own clean-up at exit is not waited for: some crash in it.
    _exit(status);
}
