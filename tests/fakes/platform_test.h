// PlatformTest: the base of unit tests; each test gets a fresh fake platform.

#pragma once

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "fake_platform.h"

namespace vlm::fakes {

class PlatformTest : public ::testing::Test {
protected:
    ~PlatformTest() override {
        EXPECT_EQ(workQueues().leftBehind(), "") << "work that is due was left behind";
    }

    FakePlatform& fakePlatform() { return _platform; }
    FakeAccounts& accounts() { return _platform.fakeAccounts; }
    FakeApplication& application() { return _platform.fakeApplication; }
    FakeAuthorization& authorization() { return _platform.fakeAuthorization; }
    FakeConsoleSessions& sessions() { return _platform.fakeConsoleSessions; }
    FakeKeychain& keychain() { return _platform.fakeKeychain; }
    FakeLocalization& localization() { return _platform.fakeLocalization; }
    FakeNamedServiceIpc& ipc() { return _platform.fakeNamedServiceIpc; }
    FakeNotifications& notifications() { return _platform.fakeNotifications; }
    FakePreferences& preferences() { return _platform.fakePreferences; }
    FakeProcessInfo& process() { return _platform.fakeProcessInfo; }
    FakeSandbox& sandbox() { return _platform.fakeSandbox; }
    FakeTokenFramework& tokenFramework() { return _platform.fakeTokenFramework; }
    FakeWindowing& windowing() { return _platform.fakeWindowing; }
    FakeWorkQueues& workQueues() { return _platform.fakeWorkQueues; }
    RecordingSystemLog& log() { return _platform.recordingSystemLog; }

private:
    FakePlatform _platform;
};

}  // namespace vlm::fakes
