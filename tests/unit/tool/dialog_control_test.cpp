#include "tool/dialog_control.h"

#include "tool_fixture.h"

namespace vlm {
namespace {

class DialogControl : public ToolTest {};

TEST_F(DialogControl, AgentModeSaysThatItIsNotAvailable) {
    std::ostringstream output;
    std::ostringstream complaints;
    Console console(output, complaints);

    EXPECT_EQ(runAgent(console), 255);

    EXPECT_EQ(output.str(), "");
    EXPECT_EQ(complaints.str(), "vlmbind: Agent mode is not available in this version.\n");
    EXPECT_TRUE(complained("Agent mode is not available in this version."));
}

TEST_F(DialogControl, ThePreferenceCanBeNeitherShownNorSetAndNothingIsSaidAboutIt) {
    for (const char* argument : {"status", "enable", "disable"}) {
        const auto run = vlmbind({"-v", "-s", argument});

        EXPECT_EQ(run.status, 255);
        EXPECT_EQ(run.output, "");
        EXPECT_EQ(run.complaints,
                  "vlmbind: The pairing preference is not available in this version.\n");
    }
    EXPECT_EQ(log().texts(platform::LogLevel::Error),
              Texts(3, "The pairing preference is not available in this version."));
}

TEST_F(DialogControl, AskingForTheDialogIsNoCommandAndStillEndsWithTheFailureStatus) {
    const auto run = vlmbind({"-f"});

    EXPECT_EQ(run.status, 255);
    EXPECT_EQ(run.output, "");
    EXPECT_EQ(run.complaints, "vlmbind: Notifications are not available in this version.\n");
    EXPECT_TRUE(complained("Notifications are not available in this version."));
    EXPECT_TRUE(debugged("unknown command line argument, exiting"));
}

TEST_F(DialogControl, ParsingGoesOnAfterAskingForTheDialog) {
    insertBlue();

    const auto run = vlmbind({"-f", "-i"});

    EXPECT_EQ(run.status, 0);
    EXPECT_NE(run.output, "");
}

}  // namespace
}  // namespace vlm
