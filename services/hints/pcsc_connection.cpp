#include "services/hints/pcsc_connection.h"

#include <algorithm>
#include <string_view>

namespace vlm::service {

namespace {

// Stands for the list of readers itself.
constexpr const char* kReaderList = "\\\\?PnP?\\Notification";

// A wait that is INFINITE wakes once a minute inside of PC/SC. It reckons in microseconds, for
// which a 32-bit number has to be enough.
constexpr std::chrono::milliseconds kWithoutAnEnd = std::chrono::minutes(30);

SCARD_READERSTATE stateOf(const char* reader, ReaderStates::State seen) {
    SCARD_READERSTATE state = {};
    state.szReader = reader;
    state.dwCurrentState = seen;
    return state;
}

// Names that each end with a zero; an empty one ends the list.
std::vector<std::string> split(std::string_view names) {
    std::vector<std::string> all;
    while (!names.empty() && names.front() != '\0') {
        all.emplace_back(names.substr(0, names.find('\0')));
        names.remove_prefix(std::min(names.size(), all.back().size() + 1));
    }
    return all;
}

}  // namespace

std::optional<std::vector<std::string>> PcscConnection::readers() const {
    DWORD size = 0;
    LONG result = SCardListReaders(_context, nullptr, nullptr, &size);
    std::string names(size, '\0');
    if (result == SCARD_S_SUCCESS)
        result = SCardListReaders(_context, nullptr, names.data(), &size);
    if (result == SCARD_E_NO_READERS_AVAILABLE) return std::vector<std::string>();
    // One came in between: it is told by the next wait.
    if (result == SCARD_E_INSUFFICIENT_BUFFER) return readers();
    if (result != SCARD_S_SUCCESS) return std::nullopt;
    names.resize(std::min<std::size_t>(size, names.size()));
    return split(names);
}

bool PcscConnection::waitForChange(ReaderStates& states,
                                   std::optional<std::chrono::milliseconds> most) const {
    std::vector<SCARD_READERSTATE> watched;
    for (const auto& [reader, seen] : states.seen())
        watched.push_back(stateOf(reader.c_str(), seen));
    watched.push_back(stateOf(kReaderList, SCARD_STATE_UNAWARE));
    const auto time = static_cast<DWORD>(most.value_or(kWithoutAnEnd).count());
    const LONG result = SCardGetStatusChange(_context, time, watched.data(), watched.size());
    if (result == SCARD_E_TIMEOUT || result == SCARD_E_UNKNOWN_READER) return true;
    if (result != SCARD_S_SUCCESS) return false;
    watched.pop_back();
    // The names are those of the states.
    for (const auto& each : watched) states.see(std::string(each.szReader), each.dwEventState);
    return true;
}

}  // namespace vlm::service
