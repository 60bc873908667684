// FakeKeyringProvider: a Secret Service on the test's bus, and a control socket, with a login
// keyring that one password opens. Both are answered in the test's own event loop.

#pragma once

#include <systemd/sd-bus.h>
#include <systemd/sd-event.h>

#include <filesystem>
#include <functional>
#include <string>
#include <vector>

#include "platform/linux/file_descriptor.h"
#include "platform/linux/sd_bus_handles.h"
#include "services/hints/tokens/event_source.h"

namespace vlm::service {

class FakeKeyringProvider {
public:
    struct Nature {
        std::string alias = "/org/freedesktop/secrets/collection/login";       // "/" for none
        std::string collection = "/org/freedesktop/secrets/collection/login";  // empty for none
        bool isGnomeKeyring = true;
        bool answers = true;
    };

    // The connection becomes the provider's.
    FakeKeyringProvider(platform::SdBus bus, Nature nature);
    FakeKeyringProvider(const FakeKeyringProvider&) = delete;
    FakeKeyringProvider& operator=(const FakeKeyringProvider&) = delete;

    // Listens at the control socket below the folder from now on. What it answers is the test's:
    // the bytes for a whole request; none to say nothing.
    using Answer = std::function<std::string(const std::string& request)>;
    void listen(sd_event* event, const std::filesystem::path& runtimeFolder, Answer answer);

    std::vector<std::string> requests;  // that came by the socket, without the first byte

    static std::string result(std::uint32_t number);
    // The answer of a keyring with this password.
    static Answer openedBy(const std::string& password);

private:
    static int onReadAlias(sd_bus_message* call, void* self, sd_bus_error* error);
    static int onLocked(sd_bus* bus, const char* path, const char* interface, const char* property,
                        sd_bus_message* reply, void* self, sd_bus_error* error);
    static const sd_bus_vtable kService[];
    static const sd_bus_vtable kCollection[];

    void accept(sd_event* event);
    void receive();

    platform::SdBus _bus;
    const Nature _nature;
    platform::SdBusSlot _service;
    platform::SdBusSlot _collection;
    Answer _answer;
    platform::FileDescriptor _listener;
    platform::FileDescriptor _client;
    std::string _received;
    EventSource _coming;
    EventSource _readable;
};

}  // namespace vlm::service
