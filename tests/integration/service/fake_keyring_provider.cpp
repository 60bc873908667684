#include "fake_keyring_provider.h"

#include <sys/socket.h>
#include <sys/un.h>

#include <array>
#include <cstring>
#include <system_error>
#include <utility>

namespace vlm::service {

namespace {

void check(int result, const char* what) {
    if (result < 0) throw std::system_error(-result, std::generic_category(), what);
}

std::string numberAsBytes(std::size_t number) {
    std::string bytes;
    for (const unsigned shift : {24U, 16U, 8U, 0U})
        bytes += static_cast<char>(static_cast<std::uint32_t>(number) >> shift);
    return bytes;
}

}  // namespace

const sd_bus_vtable FakeKeyringProvider::kService[] = {
    SD_BUS_VTABLE_START(0),
    SD_BUS_METHOD("ReadAlias", "s", "o", onReadAlias, SD_BUS_VTABLE_UNPRIVILEGED),
    SD_BUS_VTABLE_END,
};
const sd_bus_vtable FakeKeyringProvider::kCollection[] = {
    SD_BUS_VTABLE_START(0),
    SD_BUS_PROPERTY("Locked", "b", onLocked, 0, 0),
    SD_BUS_VTABLE_END,
};

FakeKeyringProvider::FakeKeyringProvider(platform::SdBus bus, Nature nature)
    : _bus(std::move(bus)), _nature(std::move(nature)) {
    sd_bus_slot* slot = nullptr;
    check(sd_bus_add_object_vtable(_bus.get(), &slot, "/org/freedesktop/secrets",
                                   "org.freedesktop.Secret.Service", kService, this),
          "service");
    _service.reset(slot);
    if (!_nature.collection.empty()) {
        check(sd_bus_add_object_vtable(_bus.get(), &slot, _nature.collection.c_str(),
                                       "org.freedesktop.Secret.Collection", kCollection, this),
              "collection");
        _collection.reset(slot);
    }
    check(sd_bus_request_name(_bus.get(), "org.freedesktop.secrets", 0), "name");
    if (_nature.isGnomeKeyring)
        check(sd_bus_request_name(_bus.get(), "org.gnome.keyring", 0), "second name");
}

int FakeKeyringProvider::onReadAlias(sd_bus_message* call, void* self, sd_bus_error*) {
    const auto& provider = *static_cast<FakeKeyringProvider*>(self);
    const char* alias = nullptr;
    if (sd_bus_message_read(call, "s", &alias) < 0 || !provider._nature.answers) return 1;
    const bool isLogin = std::string(alias) == "login";
    return sd_bus_reply_method_return(call, "o",
                                      isLogin ? provider._nature.alias.c_str() : "/wrong");
}

int FakeKeyringProvider::onLocked(sd_bus*, const char*, const char*, const char*,
                                  sd_bus_message* reply, void*, sd_bus_error*) {
    return sd_bus_message_append(reply, "b", 1);
}

void FakeKeyringProvider::listen(sd_event* event, const std::filesystem::path& runtimeFolder,
                                 Answer answer) {
    _answer = std::move(answer);
    const auto path = runtimeFolder / "keyring/control";
    std::filesystem::create_directories(path.parent_path());
    sockaddr_un address = {};
    address.sun_family = AF_UNIX;
    std::strncpy(address.sun_path, path.c_str(), sizeof address.sun_path - 1);
    _listener = platform::FileDescriptor(::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0));
    if (::bind(_listener.get(), reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0 ||
        ::listen(_listener.get(), 4) != 0)
        throw std::system_error(errno, std::generic_category(), path);
    _coming = callWhenReadable(event, _listener.get(), [this, event] { accept(event); });
}

void FakeKeyringProvider::accept(sd_event* event) {
    _received.clear();
    _client = platform::FileDescriptor(
        ::accept4(_listener.get(), nullptr, nullptr, SOCK_CLOEXEC | SOCK_NONBLOCK));
    _readable = callWhenReadable(event, _client.get(), [this] { receive(); });
}

// A request is there at once: it is sent with one call.
void FakeKeyringProvider::receive() {
    std::array<char, 2048> place = {};
    const auto count = ::recv(_client.get(), place.data(), place.size(), 0);
    if (count <= 0) {
        _readable.reset();
        return;
    }
    requests.emplace_back(place.data() + 1, static_cast<std::size_t>(count) - 1);
    const auto reply = _answer(requests.back());
    if (!reply.empty()) ::send(_client.get(), reply.data(), reply.size(), MSG_NOSIGNAL);
}

std::string FakeKeyringProvider::result(std::uint32_t number) {
    return numberAsBytes(8) + numberAsBytes(number);
}

FakeKeyringProvider::Answer FakeKeyringProvider::openedBy(const std::string& password) {
    const auto right = numberAsBytes(12 + password.size()) + numberAsBytes(1) +
                       numberAsBytes(password.size()) + password;
    return [right](const std::string& request) { return result(request == right ? 0 : 1); };
}

}  // namespace vlm::service
