#include <sys/random.h>

#include <chrono>
#include <filesystem>
#include <system_error>

#include "services/hints/bus_caller_watch.h"
#include "services/hints/bus_connection.h"
#include "services/hints/bus_server.h"
#include "services/hints/caller_pin_prompt.h"
#include "services/hints/hints_service.h"
#include "services/hints/instances.h"
#include "services/hints/prompter_registry.h"
#include "services/hints/service_names.h"
#include "services/hints/sqlite_pairing_store.h"
#include "services/hints/tokens/signature.h"
#include "services/hints/tokens/worker_tokens.h"

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

}  // namespace

InstanceEnd runSystemInstance(ServiceLoop& loop, const Options& options) {
    const auto bus = BusConnection::open(loop.get(), BusKind::System,
                                         [&](const std::string& reason) { loop.fail(reason); });
    if (!bus) return {bus.refusal().text};
    const auto pairings = SqlitePairingStore::open(options.database);
    if (!pairings) return {pairings.refusal().text};
    sd_bus* const connection = (*bus)->get();

    BusCallerWatch callers(connection);
    PrompterRegistry prompters(connection, callers);
    WorkerTokens tokens(loop.get(), workersFor(options));
    CallerPinPrompt prompt(loop.get(), prompters, options.pinentry);
    HintsService service({.login = {tokens, prompt, verifySignature, randomBytes},
                          .pairings = **pairings,
                          .callers = callers,
                          .milliseconds = milliseconds,
                          .now = secondsNow});
    BusServer server(connection, kHintsInterface, "Exchange", service);

    if (!server.start() || !prompters.start()) return {"the bus does not take the service"};
    if (auto reason = (*bus)->claim(kDaemonName); !reason.empty()) return {reason};
    return {{}, loop.run()};
}

}  // namespace vlm::service
