#include "services/pam/conversation.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <cstring>

namespace vlm::pam {
namespace {

// An application that does what the test says.
struct Application {
    int result = PAM_SUCCESS;
    bool givesResponse = true;
    const char* text = "123456";
    int style = 0;
    std::string prompt;

    static int converse(int count, const pam_message** messages, pam_response** responses,
                        void* self) {
        auto& application = *static_cast<Application*>(self);
        EXPECT_EQ(count, 1);
        application.style = messages[0]->msg_style;
        application.prompt = messages[0]->msg;
        *responses = nullptr;
        if (application.givesResponse) {
            *responses = static_cast<pam_response*>(std::calloc(1, sizeof(pam_response)));
            if (application.text) (*responses)->resp = strdup(application.text);
        }
        return application.result;
    }
    pam_conv conv() { return {converse, this}; }
};

TEST(ConversationTest, AsksWithoutEcho) {
    Application application;
    const auto conv = application.conv();

    const auto answer = Conversation(&conv).askSecretly("PIN: ");

    EXPECT_EQ(answer.result, PAM_SUCCESS);
    EXPECT_EQ(answer.text->text(), "123456");
    EXPECT_EQ(application.style, PAM_PROMPT_ECHO_OFF);
    EXPECT_EQ(application.prompt, "PIN: ");
}

TEST(ConversationTest, TellsAnEmptyAnswerFromNone) {
    Application application;
    const auto conv = application.conv();
    application.text = "";
    EXPECT_EQ(Conversation(&conv).askSecretly("PIN: ").result, PAM_SUCCESS);

    application.text = nullptr;
    EXPECT_EQ(Conversation(&conv).askSecretly("PIN: ").result, PAM_AUTH_ERR);
}

TEST(ConversationTest, BelievesNoAnswerOfAnApplicationThatFailed) {
    Application application;
    const auto conv = application.conv();
    struct {
        int result;
        bool givesResponse;
        int expected;
    } const rows[] = {{PAM_CONV_ERR, true, PAM_CONV_ERR},
                      {PAM_CONV_ERR, false, PAM_CONV_ERR},
                      {PAM_SUCCESS, false, PAM_CONV_ERR},
                      {PAM_ABORT, true, PAM_CONV_ERR},
                      {PAM_CONV_AGAIN, true, PAM_INCOMPLETE},
                      {-1, true, PAM_CONV_ERR},
                      {12345, true, PAM_CONV_ERR}};
    for (const auto& row : rows) {
        application.result = row.result;
        application.givesResponse = row.givesResponse;

        const auto answer = Conversation(&conv).askSecretly("PIN: ");

        EXPECT_EQ(answer.result, row.expected) << row.result;
        EXPECT_FALSE(answer.text);
    }
}

TEST(ConversationTest, FailsWithoutAnApplication) {
    const pam_conv none{nullptr, nullptr};
    EXPECT_EQ(Conversation(nullptr).askSecretly("PIN: ").result, PAM_CONV_ERR);
    EXPECT_EQ(Conversation(&none).askSecretly("PIN: ").result, PAM_CONV_ERR);
    Conversation(nullptr).tell(PAM_TEXT_INFO, "nobody listens");
}

TEST(ConversationTest, TellsInTheStyleThatItIsGiven) {
    Application application;
    const auto conv = application.conv();

    Conversation(&conv).tell(PAM_ERROR_MSG, "No.");

    EXPECT_EQ(application.style, PAM_ERROR_MSG);
    EXPECT_EQ(application.prompt, "No.");
}

}  // namespace
}  // namespace vlm::pam
