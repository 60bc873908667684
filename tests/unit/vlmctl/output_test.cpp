#include "services/vlmctl/output.h"

#include <streambuf>

#include "control_fixture.h"
#include "services/vlmctl/shown.h"

namespace vlm::control {
namespace {

class OutputTest : public ControlTest {};

// Takes nothing, like a stream that was closed.
class Closed : public std::streambuf {};

TEST_F(OutputTest, OfTheWholeProgramFailsWhenALineIsLost) {
    Closed closed;
    std::ostream lost(&closed);
    std::ostringstream complaints;
    Output output(lost, complaints);

    EXPECT_EQ(runCommandLine({"settings"}, output), 1);

    EXPECT_EQ(complaints.str(), "vlmctl: cannot write to standard output\n");
}

TEST_F(OutputTest, ComplainsAboutWrongUsageOnStandardError) {
    const auto run = vlmctl({"paint"});

    EXPECT_EQ(run.status, 2);
    EXPECT_EQ(run.output, "");
    EXPECT_EQ(run.complaints, "vlmctl: there is no command paint. Try \"vlmctl --help\"\n");
}

TEST_F(OutputTest, HelpsOnStandardOutput) {
    const auto run = vlmctl({"--help"});

    EXPECT_EQ(run.status, 0);
    EXPECT_THAT(run.output, testing::StartsWith("Usage: vlmctl "));
    EXPECT_THAT(run.output, testing::EndsWith("cannot be read.\n"));
    EXPECT_EQ(run.complaints, "");
}

TEST_F(OutputTest, QuotesNothingThatActsOnATerminal) {
    const auto run = vlmctl({"get", "\x1b[2J"});

    EXPECT_EQ(run.complaints.find('\x1b'), std::string::npos);
}

TEST_F(OutputTest, ShowsTimesAsPeopleAndProgramsReadThem) {
    EXPECT_EQ(pointInTime(0), "1970-01-01T00:00:00Z");
    EXPECT_EQ(pointInTime(1714564800), "2024-05-01T12:00:00Z");
    EXPECT_EQ(pointInTime(9223372036854775807), "9223372036854775807");
}

}  // namespace
}  // namespace vlm::control
