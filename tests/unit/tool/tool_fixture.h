// The world of the tests of the tool: a hints service in memory, and a run of the command line that
// gives back what a person sees.

#pragma once

#include <gtest/gtest.h>

#include <sstream>
#include <string>
#include <vector>

#include "arguments.h"
#include "fake_hints_service.h"
#include "fake_settings.h"
#include "platform_test.h"
#include "tool/command_line.h"
#include "tool/console.h"

namespace vlm {

class ToolTest : public fakes::PlatformTest {
protected:
    using Service = fakes::FakeHintsService;
    using Bytes = platform::Bytes;
    using Texts = std::vector<std::string>;

    struct Run {
        int status = -1;
        std::string output;
        std::string complaints;
        std::string parserComplaints;  // the option parser writes to the process's standard error
    };

    const std::string blue = "pkcs11:token=blue";
    const std::string red = "pkcs11:token=red";
    const Bytes blueSigning{0xB1};
    const Bytes blueMail{0xB2};
    const Bytes redSigning{0xA1};

    void SetUp() override {
        service.plugInto(ipc());
        fakes::settings() = {};
    }

    Run vlmbind(const Texts& options) {
        fakes::Arguments arguments(options);
        std::ostringstream output;
        std::ostringstream complaints;
        Console console(output, complaints);

        testing::internal::CaptureStderr();
        Run run;
        run.status = runCommandLine(arguments.count(), arguments.values(), console);
        run.parserComplaints = testing::internal::GetCapturedStderr();
        run.output = output.str();
        run.complaints = complaints.str();
        return run;
    }

    void runAsRoot() { process().runAs(0, "root"); }
    void insertBlue() {
        service.insert(
            {blue, "Blue Card", {{blueSigning, "Alice"}, {blueMail, "Alice (mail)"}}, Bytes{0xBB}});
    }
    void insertRed() { service.insert({red, "Red Card", {{redSigning, "Bob"}}, Bytes{0xAA}}); }

    bool debugged(const std::string& text) { return log().has(platform::LogLevel::Debug, text); }
    bool noticed(const std::string& text) { return log().has(platform::LogLevel::Default, text); }
    bool complained(const std::string& text) { return log().has(platform::LogLevel::Error, text); }
    Texts debugLines() { return log().texts(platform::LogLevel::Debug); }

    // A printed line is in the log too, line feed included.
    void expectPrinted(const Run& run, const Texts& lines) {
        std::string output;
        for (const auto& line : lines) {
            output += line + "\n";
            EXPECT_TRUE(noticed(line + "\n")) << line;
        }
        EXPECT_EQ(run.output, output);
    }

    Service service;
};

}  // namespace vlm
