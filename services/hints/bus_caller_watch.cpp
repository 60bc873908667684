#include "services/hints/bus_caller_watch.h"

#include <utility>

namespace vlm::service {

namespace {

struct TrackUnref {
    void operator()(sd_bus_track* track) const { sd_bus_track_unref(track); }
};

class TrackedCaller final : public CallerWatch::Watch {
public:
    explicit TrackedCaller(std::function<void()> left) : _left(std::move(left)) {}

    bool start(sd_bus* bus, const std::string& connection) {
        sd_bus_track* made = nullptr;
        if (sd_bus_track_new(bus, &made, onGone, this) < 0) return false;
        _track.reset(made);
        return sd_bus_track_add_name(made, connection.c_str()) >= 0;
    }

private:
    static int onGone(sd_bus_track*, void* self) {
        // The call may well destroy this object.
        std::exchange(static_cast<TrackedCaller*>(self)->_left, nullptr)();
        return 0;
    }

    std::function<void()> _left;
    std::unique_ptr<sd_bus_track, TrackUnref> _track;
};

}  // namespace

std::unique_ptr<CallerWatch::Watch> BusCallerWatch::watch(const std::string& connection,
                                                          std::function<void()> left) {
    auto tracked = std::make_unique<TrackedCaller>(std::move(left));
    if (!tracked->start(_bus, connection)) return nullptr;
    return tracked;
}

}  // namespace vlm::service
