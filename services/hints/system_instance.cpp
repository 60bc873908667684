#include <sys/random.h>
#include <systemd/sd-daemon.h>
#include <systemd/sd-login.h>

#include <chrono>
#include <filesystem>
#include <system_error>

#include "services/hints/bus_caller_watch.h"
#include "services/hints/bus_connection.h"
#include "services/hints/bus_server.h"
#include "services/hints/bus_user_keyrings.h"
#include "services/hints/caller_pin_prompt.h"
#include "services/hints/certificate_trust.h"
#include "services/hints/counted_work.h"
#include "services/hints/hints_log.h"
#include "services/hints/hints_service.h"
#include "services/hints/idleness.h"
#include "services/hints/instances.h"
#include "services/hints/judged_tokens.h"
#include "services/hints/logind_caller_sessions.h"
#include "services/hints/polkit_authority.h"
#include "services/hints/prompter_registry.h"
#include "services/hints/service_names.h"
#include "services/hints/sqlite_pairing_store.h"
#include "services/hints/tokens/signature.h"
#include "services/hints/tokens/worker_anchors.h"
#include "services/hints/tokens/worker_tokens.h"
#include "settings/smartcard_settings_worker.h"

namespace vlm::service {

namespace {

std::optional<Bytes> randomBytes(std::size_t size) {
    Bytes bytes(size);
    if (getrandom(bytes.data(), bytes.size(), 0) != static_cast<ssize_t>(size)) return std::nullopt;
    return bytes;
}

std::int64_t secondsNow() {
    const auto since = std::chrono::system_clock::now().time_since_epoch();
    return std::chrono::duration_cast<std::chrono::seconds>(since).count();
}

bool isTrustChecked() { return settingNow("checkCertificateTrust") != 0; }

bool isSession(const std::string& name) {
    uid_t user = 0;
    return sd_session_get_uid(name.c_str(), &user) >= 0;
}

std::int64_t milliseconds() {
    const auto since = std::chrono::steady_clock::now().time_since_epoch();
    return std::chrono::duration_cast<std::chrono::milliseconds>(since).count();
}

WorkerTokensOptions workersFor(const Options& options) {
    WorkerTokensOptions workers;
    workers.workerProgram = options.worker;
    if (options.worker.empty()) {
        std::error_code failed;
        const auto self = std::filesystem::read_symlink("/proc/self/exe", failed);
        workers.workerProgram = self.parent_path() / "vlm-token-worker";
    }
    if (!options.moduleFolder.empty()) {
        workers.folders.packageFiles = options.moduleFolder;
        workers.folders.adminFiles.clear();
    }
    return workers;
}

Idleness::Parts idlenessOf(sd_event* event, const Options& options, const Proofs& proofs) {
    return {.enough = options.idleTime,
            .untilProofsEnd = [&proofs] { return proofs.timeLeft(); },
            .callAfter =
                [event](std::chrono::milliseconds delay, std::function<void()> call) {
                    auto timer = callAfter(event, delay, std::move(call));
                    // A call that is there when the time is over is served first, and ends the
                    // quiet.
                    sd_event_source_set_priority(timer.get(), SD_EVENT_PRIORITY_IDLE);
                    return std::shared_ptr<void>(std::move(timer));
                }};
}

// Whoever asks from now on starts the service anew; what came before is still answered. A question
// to a person would keep the new one waiting for as long as that person takes.
void leave(ServiceLoop& loop, BusConnection& bus, CallerPinPrompt& prompt,
           BusUserKeyrings& keyrings, PolkitAuthority& polkit, Idleness& idleness) {
    kLog.info("leaving after a quiet time");
    // First, so that systemd neither ends this process for the loss of its name nor takes it for
    // the one that serves.
    sd_notify(0, "STOPPING=1");
    prompt.askNobody();
    keyrings.askNobody();
    polkit.askNobody();
    bus.release([&] { idleness.callWhenDone([&] { loop.end(); }); });
}

}  // namespace

InstanceEnd runSystemInstance(ServiceLoop& loop, const Options& options) {
    const auto bus = BusConnection::open(loop.get(), BusKind::System,
                                         [&](const std::string& reason) { loop.fail(reason); });
    if (!bus) return {bus.refusal().text};
    const auto pairings = SqlitePairingStore::open(options.database);
    if (!pairings) return {pairings.refusal().text};
    sd_bus* const connection = (*bus)->get();

    BusCallerWatch callers(connection);
    PrompterRegistry prompters(connection, callers, milliseconds);
    Proofs proofs(milliseconds);
    Idleness idleness(idlenessOf(loop.get(), options, proofs));
    const auto workers = workersFor(options);
    WorkerTokens cards(loop.get(), workers);
    WorkerAnchors anchors(loop.get(), workers);
    CertificateTrust trust;
    JudgedTokens judged({cards, anchors, trust, isTrustChecked, secondsNow});
    CountedTokens tokens(judged, idleness);
    CallerPinPrompt prompt(loop.get(), prompters, options.pinentry);
    BusUserKeyrings keyrings(loop.get(), prompters, {});
    LogindCallerSessions sessions(connection);
    PolkitAuthority polkit(connection);
    AdministratorRight right(polkit);
    const SessionCards sessionCards;
    HintsService service({.login = {tokens, prompt, verifySignature, randomBytes},
                          .changes = {tokens, **pairings, proofs, sessions, right, secondsNow},
                          .unlockKeys = {tokens, **pairings, **pairings, keyrings},
                          .sessionLogin = {sessionCards, isSession},
                          .callers = callers});
    CountedExchanges requests(service, idleness);
    BusServer server(connection, kHintsInterface, {{"Exchange", requests}});

    if (!server.start() || !prompters.start()) return {"the bus does not take the service"};
    if (auto reason = (*bus)->claim(kDaemonName); !reason.empty()) return {reason};
    idleness.callWhenIdle([&] { leave(loop, **bus, prompt, keyrings, polkit, idleness); });
    return {{}, loop.run()};
}

}  // namespace vlm::service
