#include "services/hints/bus_caller_watch.h"
#include "services/hints/bus_connection.h"
#include "services/hints/bus_daemon_link.h"
#include "services/hints/bus_server.h"
#include "services/hints/desktop_password_prompt.h"
#include "services/hints/desktop_pin_prompt.h"
#include "services/hints/forwarding_service.h"
#include "services/hints/hints_log.h"
#include "services/hints/instances.h"
#include "services/hints/keyring_errands.h"
#include "services/hints/logind_user_sessions.h"
#include "services/hints/pin_asking.h"
#include "services/hints/prompter_registration.h"
#include "services/hints/removal_action.h"
#include "services/hints/service_names.h"
#include "services/hints/session_tokens.h"
#include "services/keychain/secret_service_keyring.h"
#include "settings/smartcard_settings_worker.h"

namespace vlm::service {

namespace {

// What this instance does for the daemon, on the system bus.
class DesktopPrompter {
public:
    DesktopPrompter(sd_event* event, sd_bus* systemBus, const std::string& pinentry,
                    LoginKeyring& keyring)
        : _pins(event, pinentry),
          _passwords(event, pinentry),
          _callers(systemBus),
          _pinAsking(_pins, _callers),
          _naming(keyring, _callers),
          _passwordAsking(_passwords, keyring, _callers),
          _opening(keyring, _callers),
          _server(systemBus, kPrompterInterface,
                  {{"AskPin", _pinAsking},
                   {"NameKeyring", _naming},
                   {"AskKeyringPassword", _passwordAsking},
                   {"UnlockKeyring", _opening}}),
          _registration(systemBus) {}

    bool start() { return _server.start() && _registration.start(); }

private:
    DesktopPinPrompt _pins;
    DesktopPasswordPrompt _passwords;
    BusCallerWatch _callers;
    PinAsking _pinAsking;
    KeyringNaming _naming;
    KeyringPasswordAsking _passwordAsking;
    KeyringOpening _opening;
    BusServer _server;
    PrompterRegistration _registration;
};

std::int32_t removalSetting() { return settingNow("tokenRemovalAction"); }

}  // namespace

InstanceEnd runUserInstance(ServiceLoop& loop, const Options& options) {
    const auto bus = BusConnection::open(loop.get(), BusKind::Session,
                                         [&](const std::string& reason) { loop.fail(reason); });
    if (!bus) return {bus.refusal().text};
    sd_bus* const connection = (*bus)->get();

    BusCallerWatch callers(connection);
    BusDaemonLink daemon(loop.get());
    SecretServiceKeyring keyring(loop.get(), connection, runtimeFolder());
    ForwardingService service(daemon, keyring, callers);
    BusServer server(connection, kHintsInterface, {{"Exchange", service}});
    // Without a system bus there is no daemon that could ask; requests say so themselves.
    const auto systemBus =
        BusConnection::open(loop.get(), BusKind::System, [](const std::string& reason) {
            kLog.error("the daemon can no longer ask for PINs here: {}", reason);
        });
    const SessionCards cards;
    LogindUserSessions sessions(systemBus ? (*systemBus)->get() : nullptr);
    RemovalAction removal({cards, sessions, removalSetting});
    SessionTokens tokens({loop.get(), connection, callers, daemon,
                          [&](const std::string& token) { removal.cardRemoved(token); }});
    if (!server.start() || !tokens.start()) return {"the bus does not take the service"};

    std::optional<DesktopPrompter> prompter;
    if (systemBus) prompter.emplace(loop.get(), (*systemBus)->get(), options.pinentry, keyring);
    if (!prompter || !prompter->start())
        kLog.error(
            "the daemon cannot ask for PINs on this desktop: {}",
            systemBus ? "the system bus does not take the service" : systemBus.refusal().text);

    if (auto reason = (*bus)->claim(kAgentName); !reason.empty()) return {reason};
    return {{}, loop.run()};
}

}  // namespace vlm::service
