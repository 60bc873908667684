#include "platform/linux/exchange_failure.h"

#include <gmock/gmock.h>

#include "platform/token_framework.h"

namespace vlm::test {

namespace {

using platform::ConnectionEvent;
using platform::ExchangeFailure;
using platform::ExchangeFailures;
using platform::ServiceScope;

const ExchangeFailures& failures() {
    static const ExchangeFailures failures("org.example.hints", ServiceScope::Machine);
    return failures;
}

TEST(ExchangeFailureTest, TellsTheBussesOwnErrorsApart) {
    struct Row {
        const char* why;
        const char* name;
        const char* problem;
        std::optional<ConnectionEvent> event;
    };
    const Row rows[] = {
        {"nothing to activate", "ServiceUnknown", "is not there", ConnectionEvent::Invalid},
        {"nobody owns it", "NameHasNoOwner", "is not there", ConnectionEvent::Invalid},
        {"it ended at once", "Spawn.ChildExited", "could not be started", ConnectionEvent::Invalid},
        {"it is no program", "Spawn.ExecFailed", "could not be started", ConnectionEvent::Invalid},
        {"it never took its name", "TimedOut", "did not start in time", ConnectionEvent::Invalid},
        {"it died", "NoReply", "ended before it answered", ConnectionEvent::Interrupted},
        {"the bus died", "Disconnected", "ended before it answered", ConnectionEvent::Interrupted},
        {"the policy", "AccessDenied", "may not be called by this user", std::nullopt},
        {"too many calls", "LimitsExceeded", "is overloaded", std::nullopt},
        {"something else has the name", "UnknownMethod", "refused the request", std::nullopt},
        {"the family needs a member", "Spawn", "refused the request", std::nullopt},
    };
    for (const auto& row : rows) {
        const auto failure =
            failures().errorReply(std::string("org.freedesktop.DBus.Error.") + row.name, "because");

        EXPECT_THAT(failure.sentence,
                    ::testing::StartsWith(std::string("The service org.example.hints on the "
                                                      "system bus ") +
                                          row.problem + ": because"))
            << row.why;
        EXPECT_EQ(failure.event, row.event) << row.why;
    }
}

TEST(ExchangeFailureTest, DoesNotTakeAServicesErrorForOneOfTheBus) {
    const auto failure = failures().errorReply("org.example.ServiceUnknown", "no.");

    EXPECT_EQ(failure.sentence,
              "The service org.example.hints on the system bus refused the request: no. "
              "(org.example.ServiceUnknown).");
    EXPECT_EQ(failure.event, std::nullopt);
}

TEST(ExchangeFailureTest, SaysWhatToDoWithoutABus) {
    const ExchangeFailures onSession("org.example.hints", ServiceScope::User);

    EXPECT_EQ(failures().noBus("it is off").sentence,
              "The service org.example.hints on the system bus cannot be reached, since there is "
              "no such bus: it is off. Start the system's message bus.");
    EXPECT_EQ(onSession.noBus("it is off").sentence,
              "The service org.example.hints on the session bus cannot be reached, since there is "
              "no such bus: it is off. Log in to a desktop, or run the command under "
              "dbus-run-session.");
}

TEST(ExchangeFailureTest, BoundsAndEscapesWhatTheOtherEndSays) {
    const auto failure =
        failures().errorReply("org.example.Failed", "\n\x1b[2J" + std::string(100'000, 'x'));

    EXPECT_LT(failure.sentence.size(), 1000U);
    EXPECT_EQ(failure.sentence.find('\n'), std::string::npos);
    EXPECT_EQ(failure.sentence.find('\x1b'), std::string::npos);
}

TEST(ExchangeFailureTest, BecomesAReplyWithNothingButTheError) {
    const auto reply = failures().unreadableReply("nonsense").reply();

    std::optional<platform::Error> error;
    EXPECT_FALSE(platform::decodeReplyError(reply, &error));
    EXPECT_EQ(reply.entries().size(), 1U);
    ASSERT_TRUE(error);
    EXPECT_EQ(error->domain, platform::VLErrorDomain);
    EXPECT_EQ(error->description(),
              "The service org.example.hints on the system bus gave an answer that cannot be read: "
              "nonsense. Check that it is of the same version as this program.");
}

}  // namespace

}  // namespace vlm::test
