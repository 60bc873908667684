#include "hints_test.h"

#include <utility>
#include <variant>

#include "platform/text.h"

namespace vlm::hints {

namespace {

std::string name(LogLevel level) {
    switch (level) {
        case LogLevel::Error:
            return "error";
        case LogLevel::Default:
            return "default";
        case LogLevel::Info:
            return "info";
        case LogLevel::Debug:
            return "debug";
    }
    return "unknown";
}

struct Form {
    std::string operator()(std::uint64_t value) const { return std::to_string(value) + "u"; }
    std::string operator()(std::int64_t value) const { return std::to_string(value); }
    std::string operator()(const std::string& value) const { return "\"" + value + "\""; }
    std::string operator()(const Bytes& value) const { return platform::toText(value); }
    std::string operator()(const Endpoint&) const { return "endpoint"; }
};

}  // namespace

String unsendable() { return String::fromUtf16(u"\u4E2D\u6587"); }

Message replyWith(std::int64_t result) {
    Message reply;
    reply.set("res", result);
    return reply;
}

Message replyWith(std::uint64_t result) {
    Message reply;
    reply.set("res", result);
    return reply;
}

Message replyWith(Bytes result) {
    Message reply;
    reply.set("res", std::move(result));
    return reply;
}

Message failed(Message reply) {
    platform::encodeReplyError(refusal(), &reply);
    return reply;
}

Error refusal() { return {std::string(platform::VLErrorDomain), -2001, "not you"}; }

std::string shown(bool answer) { return answer ? "true" : "false"; }

std::string shown(Status status) { return std::to_string(status); }

std::string shown(const std::optional<PropertyList>& list) {
    return list ? list->describe() : "none";
}

std::string shown(const std::optional<PropertyList::Array>& array) {
    return array ? PropertyList(*array).describe() : "none";
}

std::string shown(const Message& message) {
    std::string line;
    for (const auto& [key, value] : message.entries())
        line += (line.empty() ? "" : " ") + key + "=" + std::visit(Form(), value);
    return line;
}

HintsTest::HintsTest() {
    process().runAs(1000);
    sessions().login(1000, /*onConsole=*/true);
    serve(replyWith(std::int64_t{0}));
}

void HintsTest::serve(const Message& reply) {
    ipc().serve([reply](const Message&) { return reply; });
}

std::string HintsTest::lastRequest() {
    return ipc().exchanges.empty() ? "none" : shown(ipc().exchanges.back().request);
}

std::vector<std::string> HintsTest::logged() {
    std::vector<std::string> lines;
    for (const auto& line : log().lines()) {
        EXPECT_EQ(line.subsystem, "org.vlm.token");
        EXPECT_EQ(line.category, "ZEM");
        lines.push_back(name(line.level) + ": " + line.text);
    }
    return lines;
}

}  // namespace vlm::hints
