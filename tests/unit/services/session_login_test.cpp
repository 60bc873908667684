#include "services/hints/session_login.h"

#include <gmock/gmock.h>

#include "hints_service_fixture.h"

namespace vlm::service {
namespace {

using testing::HasSubstr;

class SessionLoginTest : public HintsServiceTest {
protected:
    static IncomingRequest note(const std::string& session) {
        return requestOf(
            14, {{"str1", session}, {"str2", text("alice")}, {"str3", text("pkcs11:token=a")}});
    }
};

TEST_F(SessionLoginTest, IsNotedForRootOnly) {
    openSessions = {"c7"};

    EXPECT_EQ(result(ask(alice(), note("c7"))), status::kNotPermitted);
    EXPECT_EQ(sessionCards.tokenOf("c7"), std::nullopt);

    EXPECT_EQ(result(ask(root(), note("c7"))), 0);
    EXPECT_EQ(sessionCards.tokenOf("c7"), "pkcs11:token=a");
}

TEST_F(SessionLoginTest, IsRefusedForASessionThatIsNotThere) {
    EXPECT_EQ(result(ask(root(), note("c7"))), status::kBadRequest);
    EXPECT_THAT(errorText(lastReply()), HasSubstr("there is no such session"));
}

TEST_F(SessionLoginTest, IsRefusedForANameThatIsNone) {
    openSessions = {"../c7"};

    EXPECT_EQ(result(ask(root(), note("../c7"))), status::kStoreFailed);
}

TEST_F(SessionLoginTest, ForgetsSessionsThatHaveEnded) {
    openSessions = {"c7"};
    ask(root(), note("c7"));
    openSessions = {"c8"};

    ask(root(), note("c8"));

    EXPECT_EQ(sessionCards.tokenOf("c7"), std::nullopt);
    EXPECT_EQ(sessionCards.tokenOf("c8"), "pkcs11:token=a");
}

}  // namespace
}  // namespace vlm::service
