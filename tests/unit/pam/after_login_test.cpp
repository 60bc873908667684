#include "services/pam/after_login.h"

#include <gmock/gmock.h>
#include <security/pam_modules.h>

#include "fake_transaction.h"
#include "pam_replies.h"

namespace vlm::pam {
namespace {

using platform::PropertyList;
using testing::IsEmpty;

Reply pairings(std::vector<platform::Bytes> hashes) {
    PropertyList::Dictionary list;
    for (auto& hash : hashes) list.append(std::to_string(list.size()), std::move(hash));
    platform::Message reply;
    reply.set("res", *platform::writeBinaryPropertyList(list));
    return reply;
}

class AfterLoginTest : public testing::Test {
protected:
    void logIn() {
        transaction.name("alice");
        transaction.remember({"alice", "pkcs11:token=a", platform::Bytes(32, 1)});
    }
    AfterLogin after() { return {transaction, service.exchange(), std::chrono::seconds(5)}; }

    fakes::FakeTransaction transaction;
    ScriptedService service;
};

TEST_F(AfterLoginTest, SaysNothingOfAnAccountThatNoCardHasLetIn) {
    transaction.name("alice");

    EXPECT_EQ(after().checkAccount(), PAM_IGNORE);
    EXPECT_THAT(service.requests, IsEmpty());
}

TEST_F(AfterLoginTest, LetsAnAccountBeUsedAsLongAsItIsPaired) {
    struct {
        const char* why;
        Reply reply;
        int result;
    } const rows[] = {
        {"paired", pairings({platform::Bytes(32, 2), platform::Bytes(32, 1)}), PAM_SUCCESS},
        {"paired with another card", pairings({platform::Bytes(32, 2)}), PAM_PERM_DENIED},
        {"not paired", pairings({}), PAM_PERM_DENIED},
        {"refused", refusal(-2013), PAM_PERM_DENIED},
        {"no service", silence(), PAM_PERM_DENIED},
        {"nonsense", numbered(0), PAM_PERM_DENIED},
    };
    logIn();
    for (const auto& row : rows) {
        SCOPED_TRACE(row.why);
        service = ScriptedService();
        service.answer(4, row.reply);

        EXPECT_EQ(after().checkAccount(), row.result);
        EXPECT_EQ(*service.requests[0].text("str1"), "alice");
    }
}

TEST_F(AfterLoginTest, LetsNobodyElseUseTheAccount) {
    logIn();
    transaction.setUser("root");

    EXPECT_EQ(after().checkAccount(), PAM_PERM_DENIED);
    EXPECT_THAT(service.requests, IsEmpty());
}

TEST_F(AfterLoginTest, TellsWhichSessionTheCardHasOpened) {
    logIn();
    transaction.openSession("c7");
    service.answer(14, numbered(0));

    EXPECT_EQ(after().openSession(), PAM_SUCCESS);

    EXPECT_EQ(*service.requests[0].text("str1"), "c7");
    EXPECT_EQ(*service.requests[0].text("str2"), "alice");
    EXPECT_EQ(*service.requests[0].text("str3"), "pkcs11:token=a");
    EXPECT_EQ(after().openSession(), PAM_SESSION_ERR) << "the service is silent now";
}

TEST_F(AfterLoginTest, TellsOfNoOtherSession) {
    transaction.name("alice");
    transaction.openSession("c7");
    EXPECT_EQ(after().openSession(), PAM_SUCCESS);

    logIn();
    transaction.openSession("");
    EXPECT_EQ(after().openSession(), PAM_SUCCESS);

    EXPECT_THAT(service.requests, IsEmpty());
}

TEST_F(AfterLoginTest, PassesANewPasswordOnInAPipe) {
    transaction.name("alice");
    transaction.changePassword("former", "new");
    service.answer(13, numbered(0));

    EXPECT_EQ(after().changePassword(), PAM_SUCCESS);

    EXPECT_EQ(*service.requests[0].text("str1"), "alice");
    EXPECT_EQ(service::secretIn(*service.requests[0].endpoint("dat1"))->text(), "new");
}

TEST_F(AfterLoginTest, KeepsTheKeyOfAKeyringThatKeepsItsPassword) {
    transaction.name("alice");
    transaction.changePassword("", "new");

    EXPECT_EQ(after().changePassword(), PAM_SUCCESS);
    EXPECT_THAT(service.requests, IsEmpty());
}

TEST_F(AfterLoginTest, SaysWhenTheCardDoesNotLearnThePassword) {
    transaction.name("alice");
    transaction.changePassword("former", "new");

    EXPECT_EQ(after().changePassword(), PAM_AUTHTOK_ERR);
    EXPECT_EQ(transaction.told.size(), 1u);

    transaction.changePassword("former", "");
    EXPECT_EQ(after().changePassword(), PAM_AUTHTOK_ERR) << "nobody knows the new one";
}

}  // namespace
}  // namespace vlm::pam
