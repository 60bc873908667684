#include "bind/bind_operation.h"

#include "bind_operation_fixture.h"
#include "scripted_tokens.h"

namespace vlm {

namespace {

// Whoever shows dialogs is no part of these tests.
class NoDialog final : public PairingDialog {
    bool showWindow() override { return true; }
    void refreshIdentities() override {}
    void close() override {}
    void showAlert(const platform::Alert&, std::function<void()>) override {}
};

class BindOperationFields : public BindOperationTest {};

TEST_F(BindOperationFields, InitIsForTheUserAtTheConsole) {
    accounts().add("alice", 1000);
    accounts().add("bob", 1001);
    process().runAs(1000, "alice");
    sessions().login(1001, /*onConsole=*/true);

    EXPECT_EQ(BindOperation::init()->userName(), "bob");
}

TEST_F(BindOperationFields, InitWithNobodyAtTheConsoleIsForNobody) {
    accounts().add("alice", 1000);
    process().runAs(1000, "alice");

    EXPECT_EQ(BindOperation::init()->userName(), std::nullopt);
}

TEST_F(BindOperationFields, InitWithUserNameIsForThatUserAndAsksNobody) {
    const auto made = BindOperation::initWithUserName("carol");

    EXPECT_EQ(made->userName(), "carol");
    EXPECT_EQ(ipc().connections, 0);
}

TEST_F(BindOperationFields, InitWithUserNameTakesNoNameToo) {
    EXPECT_EQ(BindOperation::initWithUserName(std::nullopt)->userName(), std::nullopt);
}

TEST_F(BindOperationFields, StartAbsent) {
    EXPECT_EQ(operation->unpairedIdentities(), nullptr);
    EXPECT_EQ(operation->wrapKeysHashMap(), nullptr);
    EXPECT_EQ(operation->reply(), nullptr);
    EXPECT_EQ(operation->dialog(), nullptr);
    EXPECT_EQ(operation->tokenWatcher(), nullptr);
}

TEST_F(BindOperationFields, HoldWhatTheirSettersAreGiven) {
    const Identities identities{{blue, {{blueSigning, "Alice"}}}};
    const WrapKeys keys{{blueWrap, blue}};
    const auto dialog = std::make_shared<NoDialog>();
    const auto watcher = std::make_shared<ScriptedWatcher>(std::set<std::string>());
    auto reported = BindResult::Succeeded;

    operation->setUnpairedIdentities(identities);
    operation->setWrapKeysHashMap(keys);
    operation->setReply([&](BindResult result, const auto&) { reported = result; });
    operation->setDialog(dialog);
    operation->setTokenWatcher(watcher);
    operation->setUserName("dave");
    operation->reply()(BindResult::NotOffered, std::nullopt);

    EXPECT_EQ(offered(), identities);
    EXPECT_EQ(wrapKeys(), keys);
    EXPECT_EQ(reported, BindResult::NotOffered);
    EXPECT_EQ(operation->dialog(), dialog);
    EXPECT_EQ(operation->tokenWatcher(), watcher);
    EXPECT_EQ(operation->userName(), "dave");
}

TEST_F(BindOperationFields, TellAnAbsentMapFromAnEmptyOne) {
    operation->setUnpairedIdentities(Identities{});
    operation->setWrapKeysHashMap(WrapKeys{});
    EXPECT_EQ(offered(), Identities{});
    EXPECT_EQ(wrapKeys(), WrapKeys{});

    operation->setUnpairedIdentities(std::nullopt);
    operation->setWrapKeysHashMap(std::nullopt);
    EXPECT_EQ(offered(), std::nullopt);
    EXPECT_EQ(wrapKeys(), std::nullopt);
}

TEST_F(BindOperationFields, AreReleasedWithTheOperation) {
    const auto dialog = std::make_shared<NoDialog>();
    operation->setDialog(dialog);

    operation.reset();

    EXPECT_EQ(dialog.use_count(), 1);
}

TEST(BindResult, HasTheNumbersThatCallersKnow) {
    EXPECT_EQ(static_cast<int>(BindResult::Succeeded), 0);
    EXPECT_EQ(static_cast<int>(BindResult::Failed), 1);
    EXPECT_EQ(static_cast<int>(BindResult::Canceled), 2);
    EXPECT_EQ(static_cast<int>(BindResult::NotOffered), 3);
}

}  // namespace
}  // namespace vlm
