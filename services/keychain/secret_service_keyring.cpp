#include "services/keychain/secret_service_keyring.h"

#include <systemd/sd-event.h>
#include <unistd.h>

#include <chrono>
#include <cstdlib>
#include <string_view>
#include <utility>

#include "platform/linux/sd_bus_handles.h"
#include "platform/text.h"
#include "services/hints/hints_log.h"
#include "services/hints/tokens/event_source.h"
#include "services/keychain/keyring_control.h"

namespace vlm::service {

namespace {

constexpr std::uint64_t kPatienceMicroseconds = 5'000'000;

constexpr const char* kBus = "org.freedesktop.DBus";
constexpr const char* kSecrets = "org.freedesktop.secrets";
constexpr const char* kGnomeKeyring = "org.gnome.keyring";
constexpr const char* kCollection = "org.freedesktop.Secret.Collection";
constexpr const char* kUsualPath = "/org/freedesktop/secrets/collection/login";

using Answer = std::function<void(std::optional<FoundKeyring>)>;

// One call after the other: who is the provider, where is the keyring, is it there, and whose is
// it.
class Search final : public LoginKeyring::Work {
public:
    Search(sd_event* event, sd_bus* bus, Answer answer) : _bus(bus), _answer(std::move(answer)) {
        if (!askForOwner(kSecrets, onProvider)) _later = callSoon(event, [this] { end({}); });
    }
    Search(const Search&) = delete;
    Search& operator=(const Search&) = delete;
    ~Search() override = default;

private:
    static int onProvider(sd_bus_message* reply, void* self, sd_bus_error*) {
        auto& search = *static_cast<Search*>(self);
        search._provider = textIn(reply, 's');
        if (search._provider.empty() || !search.askForAlias()) search.end({});
        return 1;
    }

    static int onAlias(sd_bus_message* reply, void* self, sd_bus_error*) {
        auto& search = *static_cast<Search*>(self);
        const auto path = textIn(reply, 'o');
        search._path = path == "/" ? kUsualPath : path;
        if (path.empty() || !search.askWhetherItIsThere()) search.end({});
        return 1;
    }

    static int onThere(sd_bus_message* reply, void* self, sd_bus_error*) {
        auto& search = *static_cast<Search*>(self);
        const bool isThere = sd_bus_message_get_error(reply) == nullptr;
        if (!isThere || !search.askForOwner(kGnomeKeyring, onGnomeKeyring)) search.end({});
        return 1;
    }

    static int onGnomeKeyring(sd_bus_message* reply, void* self, sd_bus_error*) {
        auto& search = *static_cast<Search*>(self);
        search.end(FoundKeyring{search._path, textIn(reply, 's') == search._provider});
        return 1;
    }

    // Empty for a failure, too.
    static std::string textIn(sd_bus_message* reply, char type) {
        const char* text = nullptr;
        if (sd_bus_message_get_error(reply) ||
            sd_bus_message_read_basic(reply, type, static_cast<void*>(&text)) < 0)
            return {};
        return text;
    }

    bool askForOwner(const char* name, sd_bus_message_handler_t answered) {
        const auto call = newCall(kBus, "/org/freedesktop/DBus", kBus, "GetNameOwner");
        return call && sd_bus_message_append(call.get(), "s", name) >= 0 && send(call, answered);
    }
    bool askForAlias() {
        const auto call = newCall(_provider.c_str(), "/org/freedesktop/secrets",
                                  "org.freedesktop.Secret.Service", "ReadAlias");
        return call && sd_bus_message_append(call.get(), "s", "login") >= 0 && send(call, onAlias);
    }
    bool askWhetherItIsThere() {
        const auto call =
            newCall(_provider.c_str(), _path.c_str(), "org.freedesktop.DBus.Properties", "Get");
        return call && sd_bus_message_append(call.get(), "ss", kCollection, "Locked") >= 0 &&
               send(call, onThere);
    }

    // The provider is called by its unique name, which starts nobody.
    platform::SdBusMessage newCall(const char* destination, const char* path, const char* interface,
                                   const char* member) {
        sd_bus_message* call = nullptr;
        sd_bus_message_new_method_call(_bus, &call, destination, path, interface, member);
        return platform::SdBusMessage(call);
    }
    bool send(const platform::SdBusMessage& call, sd_bus_message_handler_t answered) {
        sd_bus_slot* slot = nullptr;
        if (sd_bus_call_async(_bus, &slot, call.get(), answered, this, kPatienceMicroseconds) < 0)
            return false;
        _call.reset(slot);
        return true;
    }

    // The answer may well destroy this object.
    void end(std::optional<FoundKeyring> found) {
        std::exchange(_answer, nullptr)(std::move(found));
    }

    sd_bus* _bus;
    Answer _answer;
    std::string _provider;
    std::string _path;
    platform::SdBusSlot _call;
    EventSource _later;
};

}  // namespace

SecretServiceKeyring::SecretServiceKeyring(sd_event* event, sd_bus* sessionBus,
                                           std::string runtimeFolder)
    : _event(event),
      _bus(sessionBus),
      _controlSocket(std::move(runtimeFolder) + "/keyring/control") {}

std::unique_ptr<LoginKeyring::Work> SecretServiceKeyring::find(Answer answer) {
    return std::make_unique<Search>(_event, _bus, std::move(answer));
}

std::unique_ptr<LoginKeyring::Work> SecretServiceKeyring::tryPassword(
    const Secret& password, std::function<void(KeyringVerdict)> answer) {
    return std::make_unique<KeyringControl>(_event, _controlSocket, password, std::move(answer));
}

std::string runtimeFolder() {
    const char* folder = std::getenv("XDG_RUNTIME_DIR");
    return folder && *folder == '/' ? folder : platform::text("/run/user/{}", ::getuid());
}

}  // namespace vlm::service
