#include "platform_test.h"
#include "settings/known_settings.h"
#include "util/bind_utils.h"

namespace vlm {
namespace {

using platform::LogLevel;
using platform::PreferencesUser;
using platform::PropertyList;

using Texts = std::vector<std::string>;

class PairingPreference : public fakes::PlatformTest {
protected:
    std::optional<PropertyList> stored(PreferencesUser user) {
        return preferences().value("UserPairing", domain, user);
    }
    void store(PreferencesUser user, PropertyList value) {
        preferences().put("UserPairing", domain, user, std::move(value));
    }

    // The lines of the tool; those of the settings are theirs.
    Texts logged(LogLevel level) {
        Texts texts;
        for (const auto& line : log().lines())
            if (line.category == "vlmbind" && line.level == level) texts.push_back(line.text);
        return texts;
    }

    const std::string domain{kSmartcardDomain};
};

class BindEnabled : public PairingPreference {};

TEST_F(BindEnabled, IsSetForTheMachineAsABoolean) {
    EXPECT_TRUE(BindUtils::setBindEnabled(false));
    EXPECT_EQ(stored(PreferencesUser::Any), PropertyList(false));

    EXPECT_TRUE(BindUtils::setBindEnabled(true));
    EXPECT_EQ(stored(PreferencesUser::Any), PropertyList(true));
}

TEST_F(BindEnabled, NeverTouchesTheUsersRecord) {
    store(PreferencesUser::Current, "kept");

    BindUtils::setBindEnabled(false);

    EXPECT_EQ(stored(PreferencesUser::Current), PropertyList("kept"));
    EXPECT_EQ(preferences().synchronised, (std::vector{std::pair{domain, PreferencesUser::Any}}));
}

TEST_F(BindEnabled, IsLoggedWhenItIsSet) {
    BindUtils::setBindEnabled(true);
    BindUtils::setBindEnabled(false);

    EXPECT_EQ(logged(LogLevel::Default), (Texts{"set UserPairing enabled: 1, result: 1",
                                                "set UserPairing enabled: 0, result: 1"}));
}

TEST_F(BindEnabled, CannotBeSetWithoutTheRightToWriteTheMachinesRecord) {
    preferences().refuseWrites();

    EXPECT_FALSE(BindUtils::setBindEnabled(true));

    EXPECT_EQ(logged(LogLevel::Default), Texts{"set UserPairing enabled: 1, result: 0"});
}

TEST_F(BindEnabled, IsTheSmartcardSetting) {
    EXPECT_TRUE(BindUtils::isBindEnabled()) << "by default";

    store(PreferencesUser::Any, false);
    EXPECT_FALSE(BindUtils::isBindEnabled()) << "set for the machine";

    preferences().force("UserPairing", domain, 5);
    EXPECT_TRUE(BindUtils::isBindEnabled()) << "forced by management";

    preferences().force("UserPairing", domain, "0");
    EXPECT_TRUE(BindUtils::isBindEnabled()) << "the default in place of a text";
}

TEST_F(BindEnabled, IsNotTheUsersDecision) {
    store(PreferencesUser::Current, false);

    EXPECT_TRUE(BindUtils::isBindEnabled());
}

TEST_F(BindEnabled, IsLoggedAsABooleanWhenItIsRead) {
    store(PreferencesUser::Any, 5);
    BindUtils::isBindEnabled();
    store(PreferencesUser::Any, 0);
    BindUtils::isBindEnabled();

    EXPECT_EQ(logged(LogLevel::Debug), (Texts{"enabled: 1", "enabled: 0"}));
    EXPECT_TRUE(preferences().synchronised.empty());
}

class BindAllowed : public PairingPreference {};

TEST_F(BindAllowed, IsTrueForAUserWhoNeverDecided) {
    EXPECT_TRUE(BindUtils::isBindAllowed());

    EXPECT_EQ(logged(LogLevel::Debug), Texts{"allowed: 1"});
}

struct Row {
    PropertyList stored;
    bool allowed;
    const char* why;
};

TEST_F(BindAllowed, IsFalseForABooleanFalseOnly) {
    const Row rows[] = {
        {false, false, "the boolean false"},
        {true, true, "the boolean true"},
        {0, true, "a number is no boolean"},
        {1, true, "nor is this one"},
        {0.0, true, "nor a real"},
        {"0", true, "a text"},
        {"false", true, "a text that says false"},
        {platform::Bytes{0}, true, "bytes"},
        {PropertyList::Array{false}, true, "an array"},
        {PropertyList::Dictionary{}, true, "a dictionary"},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(row.why);
        store(PreferencesUser::Current, row.stored);

        EXPECT_EQ(BindUtils::isBindAllowed(), row.allowed);
        EXPECT_EQ(logged(LogLevel::Debug).back(), row.allowed ? "allowed: 1" : "allowed: 0");
    }
}

TEST_F(BindAllowed, IsNeitherTheMachinesNorManagementsDecision) {
    store(PreferencesUser::Any, false);
    preferences().force("UserPairing", domain, false);

    EXPECT_TRUE(BindUtils::isBindAllowed());
}

TEST_F(BindAllowed, IsReadWithoutSynchronising) {
    BindUtils::isBindAllowed();

    EXPECT_TRUE(preferences().synchronised.empty());
}

TEST_F(BindAllowed, IsSetForTheUserAsABoolean) {
    EXPECT_TRUE(BindUtils::setBindAllowed(false));
    EXPECT_EQ(stored(PreferencesUser::Current), PropertyList(false));
    EXPECT_FALSE(BindUtils::isBindAllowed());

    EXPECT_TRUE(BindUtils::setBindAllowed(true));
    EXPECT_EQ(stored(PreferencesUser::Current), PropertyList(true));
    EXPECT_TRUE(BindUtils::isBindAllowed());
}

TEST_F(BindAllowed, NeverTouchesTheMachinesRecord) {
    store(PreferencesUser::Any, "kept");

    BindUtils::setBindAllowed(false);

    EXPECT_EQ(stored(PreferencesUser::Any), PropertyList("kept"));
    EXPECT_EQ(preferences().synchronised,
              (std::vector{std::pair{domain, PreferencesUser::Current}}));
}

TEST_F(BindAllowed, IsLoggedWhenItIsSet) {
    BindUtils::setBindAllowed(true);
    BindUtils::setBindAllowed(false);

    EXPECT_EQ(logged(LogLevel::Default), (Texts{"set UserPairing allowed: 1, result: 1",
                                                "set UserPairing allowed: 0, result: 1"}));
}

// A store whose writes are lost, and which says of itself what a test wants.
class LossyStore final : public platform::Preferences {
public:
    explicit LossyStore(bool synchronises) : _synchronises(synchronises) {}

    using Key = std::string_view;
    std::optional<PropertyList> value(Key, Key, PreferencesUser) override { return std::nullopt; }
    bool isForced(Key, Key) override { return false; }
    std::optional<PropertyList> applicationValue(Key, Key) override { return std::nullopt; }
    void setValue(Key, const std::optional<PropertyList>&, Key, PreferencesUser) override {}
    bool synchronise(Key, PreferencesUser) override { return _synchronises; }

private:
    bool _synchronises;
};

TEST_F(PairingPreference, TheResultOfSettingIsThatOfTheSynchronisationAlone) {
    for (const bool synchronises : {false, true}) {
        LossyStore store(synchronises);
        fakePlatform().preferences = &store;

        EXPECT_EQ(BindUtils::setBindAllowed(false), synchronises);
        EXPECT_EQ(BindUtils::setBindEnabled(false), synchronises);
    }
}

}  // namespace
}  // namespace vlm
