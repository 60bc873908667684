// Platform: what this process has of the platform's services, one accessor a service.
//
// Every accessor answers the same object for the whole life of the process, made on first use.
// Programs get the real services (platform/linux), unit tests get fakes (tests/fakes); which one
// is decided by linking. Each accessor is defined beside its implementation, so that a program
// links only what it calls.
//
// Threads: any.

#pragma once

namespace vlm::platform {

class Accounts;
class Application;
class Authorization;
class ConsoleSessions;
class Keychain;
class Localization;
class NamedServiceIpc;
class Notifications;
class Preferences;
class ProcessInfo;
class Sandbox;
class SystemLog;
class TokenFramework;
class Windowing;
class WorkQueues;

class Platform {
public:
    Accounts& accounts();
    Application& application();
    Authorization& authorization();
    ConsoleSessions& consoleSessions();
    Keychain& keychain();
    Localization& localization();
    NamedServiceIpc& namedServiceIpc();
    Notifications& notifications();
    Preferences& preferences();
    ProcessInfo& processInfo();
    Sandbox& sandbox();
    SystemLog& systemLog();
    TokenFramework& tokenFramework();
    Windowing& windowing();
    WorkQueues& workQueues();
};

// The platform of this process.
Platform& current();

}  // namespace vlm::platform
