#include "bench/watched_screen.h"

#include <xcb/xcb.h>

#include <cstdint>
#include <cstdio>
#include <cstdlib>

namespace vlm::bench {

namespace {

// More than a letter of text, which may be as dark as the empty screen.
constexpr std::uint16_t kPoints = 32;

struct Free {
    void operator()(void* memory) const { std::free(memory); }
};

}  // namespace

void WatchedScreen::Disconnect::operator()(xcb_connection_t* connection) const {
    xcb_disconnect(connection);
}

WatchedScreen::WatchedScreen()
    : _server(
          {"Xvfb", "-displayfd", "1", "-br", "-nolisten", "tcp", "-screen", "0", "1280x800x24"}) {
    if (!_server.waitForOutput("\n")) {
        std::printf("there is no screen: %s\n", _server.errors().c_str());
        std::exit(2);
    }
    _name = ':' + _server.output().substr(0, _server.output().find('\n'));
    _connection.reset(xcb_connect(_name.c_str(), nullptr));
    _empty = middle();
}

WatchedScreen::Picture WatchedScreen::middle() {
    auto* connection = _connection.get();
    const auto* screen = xcb_setup_roots_iterator(xcb_get_setup(connection)).data;
    const auto from = [](std::uint16_t whole) {
        return static_cast<std::int16_t>((whole - kPoints) / 2);
    };
    const auto asked = xcb_get_image(connection, XCB_IMAGE_FORMAT_Z_PIXMAP, screen->root,
                                     from(screen->width_in_pixels), from(screen->height_in_pixels),
                                     kPoints, kPoints, ~std::uint32_t{0});
    const std::unique_ptr<xcb_get_image_reply_t, Free> image(
        xcb_get_image_reply(connection, asked, nullptr));
    if (!image) {
        std::printf("the screen cannot be looked at\n");
        std::exit(2);
    }
    const auto* points = xcb_get_image_data(image.get());
    return {points, points + xcb_get_image_data_length(image.get())};
}

}  // namespace vlm::bench
