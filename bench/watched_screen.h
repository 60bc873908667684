// WatchedScreen: a screen in memory on which nobody manages windows, so that each stands in the
// middle, and whether anything is painted there.
//
// Threads: one. Errors: ends the process when there is no screen.

#pragma once

#include <memory>
#include <string>
#include <vector>

#include "tests/integration/linux/child.h"

struct xcb_connection_t;

namespace vlm::bench {

class WatchedScreen {
public:
    WatchedScreen();

    // For DISPLAY.
    const std::string& name() const { return _name; }

    bool isPainted() { return middle() != _empty; }

private:
    struct Disconnect {
        void operator()(xcb_connection_t* connection) const;
    };
    using Picture = std::vector<unsigned char>;

    Picture middle();

    test::Child _server;
    std::string _name;
    std::unique_ptr<xcb_connection_t, Disconnect> _connection;
    Picture _empty;
};

}  // namespace vlm::bench
