// PcscdSocket: tells when the socket that pcscd is reached by may have come, so that nobody has to
// try again and again.
//
// Threads: one. Blocking: no.
// Errors:  where the system has no room for it, isWatched() is false, and nothing is told.
// In tests: tests/integration/service/pcscd_socket_test.cpp

#pragma once

#include <filesystem>

#include "platform/linux/file_descriptor.h"

namespace vlm::service {

class PcscdSocket {
public:
    // Where PC/SC looks for it.
    static std::filesystem::path usualPlace();

    explicit PcscdSocket(std::filesystem::path place = usualPlace()) : _place(std::move(place)) {}

    // From now on the descriptor becomes readable when something comes to the folder of the socket,
    // or, as long as that is not there, to the one that it will come to.
    void watch();
    bool isWatched() const { return static_cast<bool>(_changes); }
    int descriptor() const { return _changes.get(); }

private:
    const std::filesystem::path _place;
    platform::FileDescriptor _changes;
};

}  // namespace vlm::service
