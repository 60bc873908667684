#include "platform/linux/sd_bus_message.h"

#include <fcntl.h>

#include <algorithm>
#include <cerrno>
#include <string_view>
#include <system_error>
#include <utility>

#include "platform/linux/owned_endpoint.h"
#include "platform/text.h"
#include "platform/utf.h"

namespace vlm::platform {

namespace {

constexpr const char* kDictionary = "a{sv}";

std::string systemReason(int result) { return std::generic_category().message(-result); }

// The bus carries UTF-8 without zeros only, and ends a connection that sends anything else.
bool canTravel(std::string_view text) {
    while (!text.empty()) {
        const TextPiece piece = firstOfUtf8(text);
        if (piece.character.value_or(0) == 0) return false;
        text.remove_prefix(piece.units);
    }
    return true;
}

// Endpoint for a descriptor that somebody else keeps; none when no further one can be opened.
std::optional<Endpoint> duplicated(int descriptor) {
    FileDescriptor own(::fcntl(descriptor, F_DUPFD_CLOEXEC, 3));
    if (!own) return std::nullopt;
    return ownedEndpoint(std::move(own));
}

std::string tooLargeReason() { return text("it is larger than {} bytes", kMostDictionaryBytes); }
std::string tooManyReason() { return text("it has more than {} entries", kMostDictionaryEntries); }
std::string longKeyReason() {
    return text("a key is longer than {} bytes", kMostDictionaryKeyBytes);
}

// Reads one dictionary. Every step answers sd-bus's result: below zero for a failure.
class Reader {
public:
    explicit Reader(sd_bus_message* from) : _from(from) {}

    int read();

    ReadDictionary result;
    std::string reason;  // set where the result's number does not say it all

private:
    int readEntry();
    int readVariant(const std::string& key, char type);
    int readValue(const std::string& key, char type);
    template <typename Number>
    int readNumber(const std::string& key, char type);
    int readText(const std::string& key);
    int readBytes(const std::string& key);
    int readEndpoint(const std::string& key);
    int takeKey(std::string_view key);
    int count(std::size_t bytes);
    int refuse(std::string why) {
        reason = std::move(why);
        return -EBADMSG;
    }

    sd_bus_message* _from;
    std::vector<std::string> _keys;
    std::size_t _bytes = 0;
};

int Reader::read() {
    if (!sd_bus_message_has_signature(_from, kDictionary))
        return refuse(text("it is of type \"{}\" instead of \"{}\"",
                           sd_bus_message_get_signature(_from, 1), kDictionary));
    int step = sd_bus_message_enter_container(_from, 'a', "{sv}");
    if (step < 0) return step;
    while ((step = sd_bus_message_enter_container(_from, 'e', "sv")) > 0) {
        if (step = readEntry(); step < 0) return step;
        if (step = sd_bus_message_exit_container(_from); step < 0) return step;
    }
    return step < 0 ? step : sd_bus_message_exit_container(_from);
}

int Reader::readEntry() {
    const char* key = nullptr;
    int step = sd_bus_message_read_basic(_from, 's', &key);
    if (step < 0) return step;
    if (step = takeKey(key); step < 0) return step;
    const char* content = nullptr;
    if (step = sd_bus_message_peek_type(_from, nullptr, &content); step < 0) return step;
    const std::string_view type = content;
    if (type == "ay") return readVariant(_keys.back(), 'a');
    constexpr std::string_view kBasicTypes = "txsh";
    if (type.size() == 1 && kBasicTypes.find(type.front()) != kBasicTypes.npos)
        return readVariant(_keys.back(), type.front());
    result.foreignKeys.push_back(_keys.back());
    return sd_bus_message_skip(_from, "v");
}

int Reader::takeKey(std::string_view key) {
    if (_keys.size() == kMostDictionaryEntries) return refuse(tooManyReason());
    if (key.size() > kMostDictionaryKeyBytes) return refuse(longKeyReason());
    if (std::ranges::find(_keys, key) != _keys.end()) result.repeatedKeys.emplace_back(key);
    _keys.emplace_back(key);
    return count(key.size());
}

int Reader::readVariant(const std::string& key, char type) {
    const char basic[] = {type, '\0'};
    int step = sd_bus_message_enter_container(_from, 'v', type == 'a' ? "ay" : basic);
    if (step < 0) return step;
    if (step = readValue(key, type); step < 0) return step;
    return sd_bus_message_exit_container(_from);
}

int Reader::readValue(const std::string& key, char type) {
    switch (type) {
        case 't':
            return readNumber<std::uint64_t>(key, type);
        case 'x':
            return readNumber<std::int64_t>(key, type);
        case 's':
            return readText(key);
        case 'h':
            return readEndpoint(key);
        default:
            return readBytes(key);
    }
}

template <typename Number>
int Reader::readNumber(const std::string& key, char type) {
    Number number = 0;
    const int step = sd_bus_message_read_basic(_from, type, &number);
    if (step < 0) return step;
    result.message.set(key, number);
    return count(sizeof number);
}

int Reader::readText(const std::string& key) {
    const char* characters = nullptr;
    int step = sd_bus_message_read_basic(_from, 's', &characters);
    if (step < 0) return step;
    const std::string_view text = characters;
    if (step = count(text.size()); step < 0) return step;
    result.message.set(key, Message::Value(std::in_place_type<std::string>, text));
    return 0;
}

int Reader::readBytes(const std::string& key) {
    const void* data = nullptr;
    std::size_t size = 0;
    int step = sd_bus_message_read_array(_from, 'y', &data, &size);
    if (step < 0) return step;
    if (step = count(size); step < 0) return step;
    const auto* bytes = static_cast<const std::uint8_t*>(data);
    result.message.set(key, Message::Value(std::in_place_type<Bytes>, bytes, bytes + size));
    return 0;
}

int Reader::readEndpoint(const std::string& key) {
    int descriptor = -1;
    const int step = sd_bus_message_read_basic(_from, 'h', &descriptor);
    if (step < 0) return step;
    auto endpoint = duplicated(descriptor);
    if (!endpoint) return -errno;
    result.message.set(key, *std::move(endpoint));
    return 0;
}

int Reader::count(std::size_t bytes) {
    _bytes += bytes;
    if (_bytes <= kMostDictionaryBytes) return 0;
    return refuse(tooLargeReason());
}

// Appends one value, without the variant around it.
class ValueWriter {
public:
    ValueWriter(sd_bus_message* to) : _to(to) {}

    static const char* type(const Message::Value& value) {
        constexpr const char* kTypes[] = {"t", "x", "s", "ay", "h"};
        return kTypes[value.index()];
    }

    int operator()(std::uint64_t number) { return sd_bus_message_append_basic(_to, 't', &number); }
    int operator()(std::int64_t number) { return sd_bus_message_append_basic(_to, 'x', &number); }
    int operator()(const std::string& text) {
        if (!canTravel(text)) return refuse("is not UTF-8 text without zeros");
        return sd_bus_message_append_basic(_to, 's', text.c_str());
    }
    int operator()(const Bytes& bytes) {
        return sd_bus_message_append_array(_to, 'y', bytes.data(), bytes.size());
    }
    int operator()(const Endpoint& endpoint) {
        if (!endpoint.descriptor) return refuse("is an endpoint without a descriptor");
        return sd_bus_message_append_basic(_to, 'h', endpoint.descriptor.get());
    }

    std::string reason;

private:
    int refuse(std::string why) {
        reason = std::move(why);
        return -EINVAL;
    }

    sd_bus_message* _to;
};

// What exceeds the bounds that the reader at the other end keeps, if anything. A bus throws out who
// sends more than it takes, so this is found out before.
std::optional<std::string> excess(const Message& dictionary) {
    std::size_t bytes = 0;
    for (const auto& [key, value] : dictionary.entries()) {
        if (key.size() > kMostDictionaryKeyBytes) return longKeyReason();
        bytes += key.size() + sizeof(std::uint64_t);
        if (const auto* characters = std::get_if<std::string>(&value)) bytes += characters->size();
        if (const auto* data = std::get_if<Bytes>(&value)) bytes += data->size();
    }
    if (dictionary.entries().size() > kMostDictionaryEntries) return tooManyReason();
    return bytes > kMostDictionaryBytes ? std::optional(tooLargeReason()) : std::nullopt;
}

int appendEntry(sd_bus_message* to, const Message::Entry& entry, std::string& reason) {
    const auto& [key, value] = entry;
    if (!canTravel(key)) {
        reason = "a key is not UTF-8 text without zeros";
        return -EINVAL;
    }
    ValueWriter write(to);
    int step = sd_bus_message_open_container(to, 'e', "sv");
    if (step >= 0) step = sd_bus_message_append_basic(to, 's', key.c_str());
    if (step >= 0) step = sd_bus_message_open_container(to, 'v', ValueWriter::type(value));
    if (step >= 0) step = std::visit(write, value);
    if (step >= 0) step = sd_bus_message_close_container(to);
    if (step >= 0) step = sd_bus_message_close_container(to);
    if (step < 0)
        reason =
            text("the value of \"{}\" {}", key,
                 write.reason.empty() ? "cannot be sent: " + systemReason(step) : write.reason);
    return step;
}

}  // namespace

std::optional<ReadDictionary> readDictionary(sd_bus_message* from, std::string& reason) {
    sd_bus_message_sensitive(from);
    Reader reader(from);
    if (const int result = reader.read(); result < 0) {
        reason = reader.reason.empty() ? systemReason(result) : reader.reason;
        return std::nullopt;
    }
    return std::move(reader.result);
}

bool appendDictionary(sd_bus_message* to, const Message& dictionary, std::string& reason) {
    sd_bus_message_sensitive(to);
    if (auto tooMuch = excess(dictionary)) {
        reason = *std::move(tooMuch);
        return false;
    }
    int step = sd_bus_message_open_container(to, 'a', "{sv}");
    for (const auto& entry : dictionary.entries()) {
        if (step < 0) break;
        step = appendEntry(to, entry, reason);
    }
    if (step >= 0) step = sd_bus_message_close_container(to);
    if (step < 0 && reason.empty()) reason = systemReason(step);
    return step >= 0;
}

}  // namespace vlm::platform
