#include "tests/integration/linux/private_bus.h"

#include <stdexcept>

namespace vlm::test {

namespace {

constexpr const char* kDocumentType =
    "<!DOCTYPE busconfig PUBLIC \"-//freedesktop//DTD D-Bus Bus Configuration 1.0//EN\" "
    "\"http://www.freedesktop.org/standards/dbus/1.0/busconfig.dtd\">\n";

// The rules under which a system bus starts: anyone may connect, answers come through, nothing
// else does.
constexpr const char* kSystemBusPolicy =
    "<policy context='default'>\n"
    "  <allow user='*'/>\n"
    "  <deny own='*'/>\n"
    "  <deny send_type='method_call'/>\n"
    "  <allow send_type='signal'/>\n"
    "  <allow send_requested_reply='true' send_type='method_return'/>\n"
    "  <allow send_requested_reply='true' send_type='error'/>\n"
    "  <allow receive_type='method_call'/>\n"
    "  <allow receive_type='method_return'/>\n"
    "  <allow receive_type='error'/>\n"
    "  <allow receive_type='signal'/>\n"
    "  <allow send_destination='org.freedesktop.DBus'/>\n"
    "</policy>\n";

constexpr const char* kPermissivePolicy =
    "<policy context='default'>\n"
    "  <allow user='*'/>\n"
    "  <allow own='*'/>\n"
    "  <allow send_destination='*' eavesdrop='false'/>\n"
    "  <allow receive_sender='*' eavesdrop='false'/>\n"
    "</policy>\n";

std::string configuration(const PrivateBus::Options& options, const std::filesystem::path& folder) {
    std::string text = kDocumentType;
    text += "<busconfig>\n<type>" + options.type + "</type>\n";
    text += "<listen>unix:path=" + (folder / "bus").string() + "</listen>\n";
    text += "<auth>EXTERNAL</auth>\n";
    for (const auto& services : options.serviceFolders)
        text += "<servicedir>" + services.string() + "</servicedir>\n";
    text += options.permissive ? kPermissivePolicy : kSystemBusPolicy;
    for (const auto& file : options.includes) text += "<include>" + file.string() + "</include>\n";
    return text + "</busconfig>\n";
}

}  // namespace

PrivateBus::PrivateBus(const Options& options) {
    _folder.write("bus.conf", configuration(options, _folder.path()));
    start();
}

void PrivateBus::restart() {
    stop();
    std::filesystem::remove(_folder.path() / "bus");
    start();
}

void PrivateBus::start() {
    const auto file = _folder.path() / "bus.conf";
    _daemon = std::make_unique<Child>(
        std::vector<std::string>{"dbus-daemon", "--nofork", "--nopidfile", "--nosyslog",
                                 "--print-address", "--config-file=" + file.string()});
    if (!_daemon->waitForOutput("\n"))
        throw std::runtime_error("dbus-daemon did not start: " + _daemon->errors());
    _address = _daemon->output().substr(0, _daemon->output().find('\n'));
}

PrivateBus::Options PrivateBus::underPolicy(const std::filesystem::path& policyFile) {
    Options options;
    options.permissive = false;
    options.includes = {policyFile};
    return options;
}

std::string PrivateBus::ownerOf(const std::string& name) const {
    const auto ended = run({"dbus-send", "--bus=" + _address, "--print-reply=literal",
                            "--dest=org.freedesktop.DBus", "/", "org.freedesktop.DBus.GetNameOwner",
                            "string:" + name});
    const auto begin = ended.output.find(':');
    return begin == std::string::npos ? ""
                                      : ended.output.substr(begin, ended.output.find('\n') - begin);
}

}  // namespace vlm::test
