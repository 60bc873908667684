#include "hints/hints_connection.h"

#include "hints/hints_log.h"
#include "hints_test.h"

namespace vlm::hints {
namespace {

using platform::ConnectionEvent;

class GetUidForAgent : public fakes::PlatformTest {};

TEST_F(GetUidForAgent, IsTheFirstOfTwoUsersOnConsole) {
    sessions().login(1000, /*onConsole=*/false);
    sessions().login(1002, /*onConsole=*/true);
    sessions().login(1001, /*onConsole=*/true);

    EXPECT_EQ(getUidForAgent(), 1002u);
    EXPECT_TRUE(log().has(platform::LogLevel::Debug, "getUidForAgent"));
    EXPECT_TRUE(log().has(platform::LogLevel::Debug, "active session uid: 1002"));
}

TEST_F(GetUidForAgent, IsNobodyWhenRootIsOnConsole) {
    sessions().login(0, /*onConsole=*/true);
    sessions().login(1000, /*onConsole=*/true);

    EXPECT_EQ(getUidForAgent(), platform::kNobody);
    EXPECT_TRUE(log().has(platform::LogLevel::Debug, "active session uid: 0"));
}

TEST_F(GetUidForAgent, IsNobodyWhenEverybodyIsElsewhere) {
    sessions().login(1000, /*onConsole=*/false);

    EXPECT_EQ(getUidForAgent(), platform::kNobody);
    EXPECT_TRUE(log().has(platform::LogLevel::Debug, "active session uid: 0"));
}

TEST_F(GetUidForAgent, IsNobodyWithoutASessionManager) {
    sessions().login(1000, /*onConsole=*/true);
    sessions().stopSessionManager();

    EXPECT_EQ(getUidForAgent(), platform::kNobody);
    EXPECT_TRUE(log().has(platform::LogLevel::Debug, "active session uid: 0"));
}

struct InstanceRow {
    const char* why;
    bool forceDaemon;
    std::optional<UserId> console;
    UserId realUserId;
    UserId effectiveUserId;
    std::string service;
    ServiceScope scope;
    std::string line;
};

const InstanceRow kInstances[] = {
    {"an ordinary user at the console has an instance", false, 1000, 1000, 1000,
     "org.vlm.token.hints.agent", ServiceScope::User, "setupConnection, forceDaemon 0"},
    {"forced", true, 1000, 1000, 1000, "org.vlm.token.hints.daemon", ServiceScope::Machine,
     "setupConnection, forceDaemon 1"},
    {"nobody at the console", false, std::nullopt, 1000, 1000, "org.vlm.token.hints.daemon",
     ServiceScope::Machine, "setupConnection, forceDaemon 1"},
    {"root at the console is nobody", false, 0, 1000, 1000, "org.vlm.token.hints.daemon",
     ServiceScope::Machine, "setupConnection, forceDaemon 1"},
    {"run as root with a user at the console", false, 1000, 0, 0, "org.vlm.token.hints.daemon",
     ServiceScope::Machine, "setupConnection, forceDaemon 1"},
    {"what the process may do counts, not who started it", false, 1000, 1000, 0,
     "org.vlm.token.hints.daemon", ServiceScope::Machine, "setupConnection, forceDaemon 1"},
    {"root's process that gave its rights away", false, 1000, 0, 1000, "org.vlm.token.hints.agent",
     ServiceScope::User, "setupConnection, forceDaemon 0"},
};

class SetupConnection : public fakes::PlatformTest {};

TEST_F(SetupConnection, PicksTheInstance) {
    for (const auto& row : kInstances) {
        SCOPED_TRACE(row.why);
        fakePlatform().fakeConsoleSessions = {};
        if (row.console) sessions().login(*row.console, /*onConsole=*/true);
        process().runSetUserId(row.realUserId, row.effectiveUserId);

        setupConnection({}, row.forceDaemon)->sendAndWait({});

        EXPECT_EQ(ipc().exchanges.back().service, row.service);
        EXPECT_EQ(ipc().exchanges.back().scope, row.scope);
        EXPECT_EQ(log().lines().back().text, row.line);
    }
}

TEST_F(SetupConnection, PicksTheDaemonForRootAlsoWithAUserOnConsole) {
    process().runAs(0);
    sessions().login(1000, /*onConsole=*/true);

    setupConnection({}, /*forceDaemon=*/false)->sendAndWait({});

    EXPECT_EQ(ipc().exchanges.back().service, kDaemonService);
}

TEST_F(SetupConnection, LooksAtTheConsoleAnewEachTime) {
    process().runAs(1000);
    setupConnection({}, /*forceDaemon=*/false)->sendAndWait({});
    sessions().login(1000, /*onConsole=*/true);
    setupConnection({}, /*forceDaemon=*/false)->sendAndWait({});

    EXPECT_EQ(ipc().exchanges[0].service, kDaemonService);
    EXPECT_EQ(ipc().exchanges[1].service, kAgentService);
}

TEST_F(SetupConnection, AsksNobodyWhoIsAtTheConsoleWhenTheDaemonIsForced) {
    sessions().login(1000, /*onConsole=*/true);

    setupConnection({}, /*forceDaemon=*/true);

    EXPECT_FALSE(log().has(platform::LogLevel::Debug, "getUidForAgent"));
}

TEST_F(SetupConnection, GivesTheCallersHandlerTheConnectionsEvents) {
    std::vector<ConnectionEvent> events;

    setupConnection([&](ConnectionEvent event) { events.push_back(event); }, true)->sendAndWait({});

    EXPECT_EQ(events, std::vector{ConnectionEvent::Invalid});
}

struct TextRow {
    const char* why;
    String string;
    std::optional<std::string> sent;
};

const TextRow kTexts[] = {
    {"UTF-8 is there already", String("alice"), "alice"},
    {"UTF-8 needs no room, whatever its characters", String("\u4E2D\u6587"), "\u4E2D\u6587"},
    {"empty UTF-8", String(""), ""},
    {"UTF-8 is sent as it is, the service decides", String("\xFF"), "\xFF"},
    {"one byte a character", String::fromUtf16(u"alice"), "alice"},
    {"longer than a short string", String::fromUtf16(u"a name of more than sixteen characters"),
     "a name of more than sixteen characters"},
    {"two bytes a character", String::fromUtf16(u"\u00E9\u00E9"), "\u00E9\u00E9"},
    {"one character leaves room", String::fromUtf16(u"\u4E2Da"), "\u4E2Da"},
    {"a pair of units takes four bytes of six", String::fromUtf16(u"\U0001F600"), "\U0001F600"},
    {"a zero inside does not end the text", String::fromUtf16({u'a', u'\0', u'b'}),
     std::string("a\0b", 3)},
    {"every character needs three bytes, so none is left for the terminator",
     String::fromUtf16(u"\u4E2D\u6587"), std::nullopt},
    {"a single character of three bytes", String::fromUtf16(u"\u20AC"), std::nullopt},
    {"empty UTF-16 has no room at all", String::fromUtf16(u""), std::nullopt},
    {"half a pair is no character", String::fromUtf16({u'a', 0xD83D, u'b'}), std::nullopt},
};

TEST(SetStringToMsgObject, PutsWhatItCanConvert) {
    for (const auto& row : kTexts) {
        SCOPED_TRACE(row.why);
        Message message;

        const bool done = setStringToMsgObject(&message, "str1", row.string);

        EXPECT_EQ(done, row.sent.has_value());
        const auto* text = message.text("str1");
        EXPECT_EQ(text ? std::optional(*text) : std::nullopt, row.sent);
    }
}

TEST(SetStringToMsgObject, HasNoRoomLeftWhenEveryCharacterTakesThreeBytes) {
    const std::u16string threeBytesEach = u"\u4E2D\u6587";
    Message message;

    EXPECT_FALSE(setStringToMsgObject(&message, "str1", String::fromUtf16(threeBytesEach)));
    EXPECT_TRUE(setStringToMsgObject(&message, "str1", String::fromUtf16(threeBytesEach + u'a')));
}

TEST(SetStringToMsgObject, LeavesTheMessageAloneWhenItFails) {
    Message message;
    message.set("str1", "before");

    EXPECT_FALSE(setStringToMsgObject(&message, "str1", unsendable()));

    EXPECT_EQ(shown(message), "str1=\"before\"");
}

TEST_F(HintsTest, LogsNothingWhenTextCannotBeConverted) {
    Message message;

    setStringToMsgObject(&message, "str1", unsendable());

    EXPECT_TRUE(logged().empty());
}

}  // namespace
}  // namespace vlm::hints
