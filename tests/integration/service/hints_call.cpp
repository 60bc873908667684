// hints_call BUS NAME KEY=VALUE...: one exchange with a hints service, for tests.
//
// BUS is "system" or "session". A key's type is the one that the service expects, and "dat1" is
// hexadecimal. Prints "res NUMBER" or "list TEXT", then "error TEXT" when there is one.
//
// It gives up its terminal first, unless its first argument is --terminal.

#include <fcntl.h>
#include <sys/ioctl.h>
#include <unistd.h>

#include <cstdio>
#include <string>
#include <string_view>
#include <vector>

#include "platform/named_service_ipc.h"
#include "platform/platform.h"
#include "platform/property_list.h"
#include "platform/token_framework.h"

namespace {

using namespace vlm;

void giveUpTerminal() {
    const int terminal = open("/dev/tty", O_RDWR | O_CLOEXEC);
    if (terminal < 0) return;
    ioctl(terminal, TIOCNOTTY);
    close(terminal);
}

platform::Bytes fromHexadecimal(const std::string& digits) {
    platform::Bytes bytes;
    for (std::size_t at = 0; at + 1 < digits.size(); at += 2)
        bytes.push_back(static_cast<std::uint8_t>(std::stoi(digits.substr(at, 2), nullptr, 16)));
    return bytes;
}

platform::Message::Value valueOf(std::string_view key, const std::string& value) {
    if (key == "op") return std::uint64_t{std::stoull(value)};
    if (key == "uid" || key == "num1") return std::int64_t{std::stoll(value)};
    if (key == "dat1") return fromHexadecimal(value);
    return value;
}

// The list, with the record in it opened.
std::string describe(const platform::Bytes& bytes) {
    const auto list = platform::readPropertyList(bytes);
    if (!list) return "(no list)";
    const auto* dictionary = list->dictionary();
    const auto* context = dictionary ? dictionary->find("ctx") : nullptr;
    if (!context || !context->bytes()) return list->describe();
    const auto record = platform::readPropertyList(*context->bytes());
    return record ? record->describe() : "(no record)";
}

void print(const platform::Message& reply) {
    if (const auto number = reply.integer("res")) std::printf("res %ld\n", *number);
    if (const auto* bytes = reply.bytes("res")) std::printf("list %s\n", describe(*bytes).c_str());
    std::optional<platform::Error> error;
    if (!platform::decodeReplyError(reply, &error) && error)
        std::printf("error %s\n", error->description().c_str());
}

}  // namespace

int main(int argc, char* argv[]) {
    std::vector<std::string> arguments(argv + 1, argv + argc);
    if (!arguments.empty() && arguments[0] == "--terminal")
        arguments.erase(arguments.begin());
    else
        giveUpTerminal();
    if (arguments.size() < 3) return 64;

    platform::Message request;
    for (std::size_t at = 2; at < arguments.size(); ++at) {
        const auto sign = arguments[at].find('=');
        if (sign == std::string::npos) return 64;
        const auto key = arguments[at].substr(0, sign);
        request.set(key, valueOf(key, arguments[at].substr(sign + 1)));
    }
    const auto scope =
        arguments[0] == "system" ? platform::ServiceScope::Machine : platform::ServiceScope::User;
    const auto connection = platform::current().namedServiceIpc().connect(arguments[1], scope);
    connection->resume();
    print(connection->sendAndWait(request));
}
