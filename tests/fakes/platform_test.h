// PlatformTest: the base of unit tests; each test gets a fresh fake platform.

#pragma once

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "fake_platform.h"

namespace vlm::fakes {

class PlatformTest : public ::testing::Test {
protected:
    FakePlatform& fakePlatform() { return _platform; }
    FakeAccounts& accounts() { return _platform.fakeAccounts; }
    FakeConsoleSessions& sessions() { return _platform.fakeConsoleSessions; }
    FakeKeychain& keychain() { return _platform.fakeKeychain; }
    FakeLocalization& localization() { return _platform.fakeLocalization; }
    FakeNamedServiceIpc& ipc() { return _platform.fakeNamedServiceIpc; }
    FakeNotifications& notifications() { return _platform.fakeNotifications; }
    FakePreferences& preferences() { return _platform.fakePreferences; }
    FakeProcessInfo& process() { return _platform.fakeProcessInfo; }
    FakeSandbox& sandbox() { return _platform.fakeSandbox; }
    FakeWindowing& windowing() { return _platform.fakeWindowing; }
    RecordingSystemLog& log() { return _platform.recordingSystemLog; }

private:
    FakePlatform _platform;
};

}  // namespace vlm::fakes
