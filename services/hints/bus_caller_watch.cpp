#include "services/hints/bus_caller_watch.h"

#include <utility>

#include "platform/linux/sd_bus_handles.h"
#include "platform/text.h"

namespace vlm::service {

namespace {

constexpr const char* kBus = "org.freedesktop.DBus";
constexpr const char* kBusPath = "/org/freedesktop/DBus";

class WatchedCaller final : public CallerWatch::Watch {
public:
    explicit WatchedCaller(std::function<void()> left) : _left(std::move(left)) {}

    bool start(sd_bus* bus, const std::string& connection) {
        const auto rule = platform::text(
            "type='signal',sender='{}',path='{}',interface='{}',member='NameOwnerChanged',"
            "arg0='{}'",
            kBus, kBusPath, kBus, connection);
        sd_bus_slot* slot = nullptr;
        if (sd_bus_add_match_async(bus, &slot, rule.c_str(), onChanged, nullptr, this) < 0)
            return false;
        _changed.reset(slot);
        // Second, since it may leave before the bus knows the rule.
        slot = nullptr;
        const int code = sd_bus_call_method_async(bus, &slot, kBus, kBusPath, kBus, "NameHasOwner",
                                                  onAnswer, this, "s", connection.c_str());
        _question.reset(slot);
        return code >= 0;
    }

private:
    // A unique name has one owner, once.
    static int onChanged(sd_bus_message*, void* self, sd_bus_error*) {
        static_cast<WatchedCaller*>(self)->tell();
        return 0;
    }

    static int onAnswer(sd_bus_message* reply, void* self, sd_bus_error*) {
        int isThere = 0;
        if (sd_bus_message_read(reply, "b", &isThere) < 0 || !isThere)
            static_cast<WatchedCaller*>(self)->tell();
        return 1;
    }

    // The call may well destroy this object.
    void tell() {
        if (_left) std::exchange(_left, nullptr)();
    }

    std::function<void()> _left;
    platform::SdBusSlot _changed;
    platform::SdBusSlot _question;
};

}  // namespace

std::unique_ptr<CallerWatch::Watch> BusCallerWatch::watch(const std::string& connection,
                                                          std::function<void()> left) {
    auto watched = std::make_unique<WatchedCaller>(std::move(left));
    if (!watched->start(_bus, connection)) return nullptr;
    return watched;
}

}  // namespace vlm::service
