#include "tool/console.h"

#include <sstream>
#include <streambuf>

#include "platform_test.h"

namespace vlm {
namespace {

using platform::LogLevel;

class ConsoleTest : public fakes::PlatformTest {
protected:
    std::ostringstream output;
    std::ostringstream complaints;
    Console console{output, complaints};
};

TEST_F(ConsoleTest, PrintsALineAndLogsItWithItsLineFeed) {
    console.print("SmartCard: Blue");

    EXPECT_EQ(output.str(), "SmartCard: Blue\n");
    EXPECT_EQ(log().texts(LogLevel::Default), std::vector<std::string>{"SmartCard: Blue\n"});
}

TEST_F(ConsoleTest, PrintsAnEmptyLineAsALineFeed) {
    console.print("");

    EXPECT_EQ(output.str(), "\n");
    EXPECT_EQ(log().texts(LogLevel::Default), std::vector<std::string>{"\n"});
}

TEST_F(ConsoleTest, TakesBracesInALineForText) {
    console.print("{} {}");

    EXPECT_EQ(output.str(), "{} {}\n");
    EXPECT_TRUE(log().has(LogLevel::Default, "{} {}\n"));
}

// Remembers how many lines the log had when the first character came.
class Witness : public std::stringbuf {
public:
    explicit Witness(const fakes::RecordingSystemLog& log) : _log(log) {}
    std::size_t linesBefore = 99;

protected:
    std::streamsize xsputn(const char* text, std::streamsize size) override {
        if (linesBefore == 99) linesBefore = _log.lines().size();
        return std::stringbuf::xsputn(text, size);
    }

private:
    const fakes::RecordingSystemLog& _log;
};

TEST_F(ConsoleTest, LogsALineBeforeItIsPrinted) {
    Witness witness(log());
    std::ostream stream(&witness);

    Console(stream, complaints).print("hello");

    EXPECT_EQ(witness.linesBefore, 1U);
    EXPECT_EQ(witness.str(), "hello\n");
}

TEST_F(ConsoleTest, ComplainsOnStandardErrorAndInTheLog) {
    console.complain("It does not work.");

    EXPECT_EQ(output.str(), "");
    EXPECT_EQ(complaints.str(), "vlmbind: It does not work.\n");
    EXPECT_EQ(log().texts(LogLevel::Error), std::vector<std::string>{"It does not work."});
}

TEST_F(ConsoleTest, FlushesWhatGotOutWithoutAComplaint) {
    console.print("hello");

    EXPECT_TRUE(console.flush());
    EXPECT_EQ(complaints.str(), "");
}

// Takes nothing, like a stream that was closed.
class Closed : public std::streambuf {};

TEST_F(ConsoleTest, ComplainsWhenALineCouldNotBeWritten) {
    Closed closed;
    std::ostream stream(&closed);
    Console broken(stream, complaints);

    broken.print("hello");

    EXPECT_FALSE(broken.flush());
    EXPECT_EQ(complaints.str(), "vlmbind: Cannot write to standard output.\n");
    EXPECT_TRUE(log().has(LogLevel::Error, "Cannot write to standard output."));
}

}  // namespace
}  // namespace vlm
