// The platform of unit tests. While a FakePlatform exists, platform::current() answers its fakes;
// a test may put a service of its own in a fake's place. One at a time.

#pragma once

#include "fake_accounts.h"
#include "fake_application.h"
#include "fake_authorization.h"
#include "fake_console_sessions.h"
#include "fake_keychain.h"
#include "fake_localization.h"
#include "fake_named_service_ipc.h"
#include "fake_notifications.h"
#include "fake_preferences.h"
#include "fake_process_info.h"
#include "fake_sandbox.h"
#include "fake_token_framework.h"
#include "fake_windowing.h"
#include "fake_work_queues.h"
#include "recording_system_log.h"

namespace vlm::fakes {

class FakePlatform {
public:
    FakePlatform();
    ~FakePlatform();
    FakePlatform(const FakePlatform&) = delete;
    FakePlatform& operator=(const FakePlatform&) = delete;

    // The fakes, for a test to set up and to look at.
    FakeAccounts fakeAccounts;
    FakeApplication fakeApplication;
    FakeAuthorization fakeAuthorization;
    FakeConsoleSessions fakeConsoleSessions;
    FakeKeychain fakeKeychain;
    FakeLocalization fakeLocalization;
    FakeNamedServiceIpc fakeNamedServiceIpc;
    FakeNotifications fakeNotifications;
    FakePreferences fakePreferences;
    FakeProcessInfo fakeProcessInfo;
    FakeSandbox fakeSandbox;
    FakeTokenFramework fakeTokenFramework;
    FakeWindowing fakeWindowing;
    FakeWorkQueues fakeWorkQueues;
    RecordingSystemLog recordingSystemLog;

    // What the code under test gets.
    platform::Accounts* accounts = &fakeAccounts;
    platform::Application* application = &fakeApplication;
    platform::Authorization* authorization = &fakeAuthorization;
    platform::ConsoleSessions* consoleSessions = &fakeConsoleSessions;
    platform::Keychain* keychain = &fakeKeychain;
    platform::Localization* localization = &fakeLocalization;
    platform::NamedServiceIpc* namedServiceIpc = &fakeNamedServiceIpc;
    platform::Notifications* notifications = &fakeNotifications;
    platform::Preferences* preferences = &fakePreferences;
    platform::ProcessInfo* processInfo = &fakeProcessInfo;
    platform::Sandbox* sandbox = &fakeSandbox;
    platform::SystemLog* systemLog = &recordingSystemLog;
    platform::TokenFramework* tokenFramework = &fakeTokenFramework;
    platform::Windowing* windowing = &fakeWindowing;
    platform::WorkQueues* workQueues = &fakeWorkQueues;
};

}  // namespace vlm::fakes
