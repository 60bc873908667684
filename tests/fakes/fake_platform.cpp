#include "fake_platform.h"

#include <cassert>

#include "platform/platform.h"

namespace vlm::fakes {

namespace {
FakePlatform* installed = nullptr;
}

FakePlatform::FakePlatform() {
    assert(!installed);
    installed = this;
}

FakePlatform::~FakePlatform() { installed = nullptr; }

}  // namespace vlm::fakes

namespace vlm::platform {

Accounts& Platform::accounts() { return *fakes::installed->accounts; }
Application& Platform::application() { return *fakes::installed->application; }
Authorization& Platform::authorization() { return *fakes::installed->authorization; }
ConsoleSessions& Platform::consoleSessions() { return *fakes::installed->consoleSessions; }
Keychain& Platform::keychain() { return *fakes::installed->keychain; }
Localization& Platform::localization() { return *fakes::installed->localization; }
NamedServiceIpc& Platform::namedServiceIpc() { return *fakes::installed->namedServiceIpc; }
Notifications& Platform::notifications() { return *fakes::installed->notifications; }
Preferences& Platform::preferences() { return *fakes::installed->preferences; }
ProcessInfo& Platform::processInfo() { return *fakes::installed->processInfo; }
Sandbox& Platform::sandbox() { return *fakes::installed->sandbox; }
SystemLog& Platform::systemLog() { return *fakes::installed->systemLog; }
TokenFramework& Platform::tokenFramework() { return *fakes::installed->tokenFramework; }
Windowing& Platform::windowing() { return *fakes::installed->windowing; }
WorkQueues& Platform::workQueues() { return *fakes::installed->workQueues; }

Platform& current() {
    static Platform platform;
    assert(fakes::installed);
    return platform;
}

}  // namespace vlm::platform
