// The world of the tests of vlmctl: fakes below, a hints service in memory, and a run of the
// command line that gives back what a person sees.

#pragma once

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <sstream>
#include <string>
#include <vector>

#include "fake_hints_service.h"
#include "platform_test.h"
#include "services/vlmctl/commands.h"
#include "settings/known_settings.h"

namespace vlm::control {

class ControlTest : public fakes::PlatformTest {
protected:
    using Bytes = platform::Bytes;
    using PropertyList = platform::PropertyList;
    using User = platform::PreferencesUser;

    struct Run {
        int status = -1;
        std::string output;
        std::string complaints;
    };

    void SetUp() override {
        service.plugInto(ipc());
        accounts().add("alice", 1000);
        accounts().add("bob", 1001);
        accounts().add("root", 0);
    }

    static Run vlmctl(const std::vector<std::string>& words) {
        std::ostringstream lines;
        std::ostringstream complaints;
        Output output(lines, complaints);
        Run run;
        run.status = runCommandLine(words, output);
        run.output = lines.str();
        run.complaints = complaints.str();
        return run;
    }

    void runAsRoot() { process().runAs(0, "root"); }
    void putOnMachine(const std::string& key, PropertyList value) {
        preferences().put(key, std::string(kSmartcardDomain), User::Any, std::move(value));
    }
    void manage(const std::string& key, PropertyList value) {
        preferences().force(key, std::string(kSmartcardDomain), std::move(value));
    }
    std::optional<PropertyList> onMachine(const std::string& key) {
        return preferences().written(key, std::string(kSmartcardDomain), User::Any);
    }

    // The service answers an account's pairings like this.
    void answerPairings(const std::vector<Bytes>& hashes) {
        PropertyList::Dictionary list;
        for (const auto& hash : hashes) list.append(std::to_string(list.size()), hash);
        service.script(kCopyLegacyBindings, fakes::FakeHintsService::propertyList(list));
    }

    fakes::FakeHintsService service;

private:
    static constexpr auto kCopyLegacyBindings = static_cast<fakes::FakeHintsService::Operation>(4);
};

}  // namespace vlm::control
