// What platform/preferences.h promises. Verbs: force(key, domain, value); put(key, domain, user,
// value), as another process does it; written(key, domain, user), as another process sees it;
// refuseWrites().

#pragma once

#include <string>

#include "platform/preferences.h"
#include "tests/contracts/contract_test.h"

namespace vlm::contracts {

using User = platform::PreferencesUser;
using List = platform::PropertyList;

template <typename Backend>
class PreferencesContract : public ContractTest<Backend> {
protected:
    static constexpr const char* kDomain = "org.example.one";
    static constexpr const char* kOther = "org.example.two";

    platform::Preferences& preferences() { return this->backend().get(); }
    std::optional<List> value(const char* key, User user, const char* domain = kDomain) {
        return preferences().value(key, domain, user);
    }
    std::optional<List> written(const char* key, User user, const char* domain = kDomain) {
        return this->backend().written(key, domain, user);
    }
};

TYPED_TEST_SUITE_P(PreferencesContract);

TYPED_TEST_P(PreferencesContract, HasNoValueThatNobodySet) {
    EXPECT_EQ(this->value("key", User::Any), std::nullopt);
    EXPECT_EQ(this->value("key", User::Current), std::nullopt);
    EXPECT_EQ(this->preferences().applicationValue("key", this->kDomain), std::nullopt);
    EXPECT_FALSE(this->preferences().isForced("key", this->kDomain));
}

TYPED_TEST_P(PreferencesContract, TheScopesAreIndependent) {
    this->backend().force("key", this->kDomain, "forced");

    this->preferences().setValue("key", "any", this->kDomain, User::Any);
    this->preferences().setValue("key", "current", this->kDomain, User::Current);

    EXPECT_EQ(this->value("key", User::Any), "any");
    EXPECT_EQ(this->value("key", User::Current), "current");
    EXPECT_TRUE(this->preferences().synchronise(this->kDomain, User::Any));
    EXPECT_EQ(this->written("key", User::Any), "any");
    EXPECT_EQ(this->written("key", User::Current), std::nullopt);
    EXPECT_TRUE(this->preferences().synchronise(this->kDomain, User::Current));
    EXPECT_EQ(this->written("key", User::Any), "any");
    EXPECT_EQ(this->written("key", User::Current), "current");
    EXPECT_EQ(this->preferences().applicationValue("key", this->kDomain), "forced");
}

TYPED_TEST_P(PreferencesContract, TheDomainsAreIndependent) {
    this->backend().force("forced", this->kDomain, true);

    this->preferences().setValue("key", 1, this->kDomain, User::Current);
    this->preferences().setValue("key", 2, this->kOther, User::Current);

    EXPECT_TRUE(this->preferences().synchronise(this->kDomain, User::Current));
    EXPECT_EQ(this->written("key", User::Current), 1);
    EXPECT_EQ(this->written("key", User::Current, this->kOther), std::nullopt);
    EXPECT_EQ(this->value("key", User::Current, this->kOther), 2);
    EXPECT_FALSE(this->preferences().isForced("forced", this->kOther));
}

TYPED_TEST_P(PreferencesContract, TheForcedValueDecidesThenTheUsersThenTheOneForAny) {
    const auto decided = [&] { return this->preferences().applicationValue("key", this->kDomain); };

    this->backend().put("key", this->kDomain, User::Any, "any");
    EXPECT_EQ(decided(), "any");
    this->backend().put("key", this->kDomain, User::Current, "current");
    EXPECT_EQ(decided(), "current");
    this->backend().force("key", this->kDomain, "forced");
    EXPECT_EQ(decided(), "forced");
}

TYPED_TEST_P(PreferencesContract, OnlyManagementForces) {
    this->backend().put("key", this->kDomain, User::Any, 1);
    this->backend().put("key", this->kDomain, User::Current, 1);
    this->backend().force("forced", this->kDomain, false);

    EXPECT_FALSE(this->preferences().isForced("key", this->kDomain));
    EXPECT_TRUE(this->preferences().isForced("forced", this->kDomain));
    EXPECT_EQ(this->value("forced", User::Any), std::nullopt);
    EXPECT_EQ(this->value("forced", User::Current), std::nullopt);
}

TYPED_TEST_P(PreferencesContract, KeepsEveryTypeAsItIs) {
    const List all = List::Dictionary{{"yes", true},
                                      {"one", 1},
                                      {"minus", std::int64_t{-5}},
                                      {"much", std::uint64_t{0xFFFFFFFFFFFFFFFFU}},
                                      {"half", 0.5},
                                      {"text", "gr\xC3\xBC\xC3\x9F"},
                                      {"empty", ""},
                                      {"bytes", platform::Bytes{0, 255}},
                                      {"date", List::Date{86400}},
                                      {"list", List::Array{1, "two", false}}};

    this->preferences().setValue("all", all, this->kDomain, User::Current);
    EXPECT_TRUE(this->preferences().synchronise(this->kDomain, User::Current));

    EXPECT_EQ(this->written("all", User::Current), all);
    EXPECT_EQ(this->value("all", User::Current), all);
}

TYPED_TEST_P(PreferencesContract, ThisProcessSeesAValueAtOnceAndOthersOnceItIsSynchronised) {
    this->preferences().setValue("key", true, this->kDomain, User::Any);

    EXPECT_EQ(this->value("key", User::Any), true);
    EXPECT_EQ(this->preferences().applicationValue("key", this->kDomain), true);
    EXPECT_EQ(this->written("key", User::Any), std::nullopt);
    EXPECT_TRUE(this->preferences().synchronise(this->kDomain, User::Any));
    EXPECT_EQ(this->written("key", User::Any), true);
}

TYPED_TEST_P(PreferencesContract, RemovesAKeyThatIsSetToNoValue) {
    this->backend().put("key", this->kDomain, User::Current, 1);
    this->backend().put("other", this->kDomain, User::Current, 2);

    this->preferences().setValue("key", std::nullopt, this->kDomain, User::Current);

    EXPECT_EQ(this->value("key", User::Current), std::nullopt);
    EXPECT_EQ(this->written("key", User::Current), 1);
    EXPECT_TRUE(this->preferences().synchronise(this->kDomain, User::Current));
    EXPECT_EQ(this->written("key", User::Current), std::nullopt);
    EXPECT_EQ(this->written("other", User::Current), 2);
}

TYPED_TEST_P(PreferencesContract, TheValueSetLastCounts) {
    this->preferences().setValue("key", 1, this->kDomain, User::Current);
    this->preferences().setValue("key", std::nullopt, this->kDomain, User::Current);
    this->preferences().setValue("key", 3, this->kDomain, User::Current);

    EXPECT_TRUE(this->preferences().synchronise(this->kDomain, User::Current));

    EXPECT_EQ(this->written("key", User::Current), 3);
}

TYPED_TEST_P(PreferencesContract, KeepsWhatOthersHaveWrittenMeanwhile) {
    this->backend().put("theirs", this->kDomain, User::Any, 1);
    this->preferences().setValue("ours", 1, this->kDomain, User::Any);
    this->backend().put("theirs", this->kDomain, User::Any, 2);

    EXPECT_TRUE(this->preferences().synchronise(this->kDomain, User::Any));

    EXPECT_EQ(this->written("theirs", User::Any), 2);
    EXPECT_EQ(this->written("ours", User::Any), 1);
}

TYPED_TEST_P(PreferencesContract, SeesWhatOthersWriteAfterwards) {
    for (int number = 1; number <= 3; ++number) {
        this->backend().put("key", this->kDomain, User::Any, number);

        EXPECT_EQ(this->value("key", User::Any), number);
    }
}

TYPED_TEST_P(PreferencesContract, HasNothingToDoWhenNothingWasSet) {
    this->backend().refuseWrites();

    EXPECT_TRUE(this->preferences().synchronise(this->kDomain, User::Any));
    EXPECT_TRUE(this->preferences().synchronise(this->kDomain, User::Current));
}

TYPED_TEST_P(PreferencesContract, AWriteThatFailsIsAFalseAnswerAndLeavesTheOldValue) {
    for (const auto user : {User::Any, User::Current}) {
        this->backend().put("key", this->kDomain, user, "old");
    }
    this->backend().refuseWrites();

    for (const auto user : {User::Any, User::Current}) {
        this->preferences().setValue("key", "new", this->kDomain, user);
        EXPECT_EQ(this->value("key", user), "new");
        EXPECT_FALSE(this->preferences().synchronise(this->kDomain, user));
        EXPECT_EQ(this->value("key", user), "old") << "what was set is dropped";
        EXPECT_EQ(this->written("key", user), "old");
        EXPECT_TRUE(this->preferences().synchronise(this->kDomain, user));
    }
}

TYPED_TEST_P(PreferencesContract, WhatIsNoDomainHasNoRecord) {
    for (const char* domain :
         {"", ".", "..", "../org.example.one", "org/example", "org..example"}) {
        this->preferences().setValue("key", 1, domain, User::Current);

        EXPECT_EQ(this->value("key", User::Current, domain), std::nullopt) << domain;
        EXPECT_EQ(this->preferences().applicationValue("key", domain), std::nullopt) << domain;
        EXPECT_FALSE(this->preferences().isForced("key", domain)) << domain;
        EXPECT_FALSE(this->preferences().synchronise(domain, User::Current)) << domain;
    }
}

REGISTER_TYPED_TEST_SUITE_P(
    PreferencesContract, HasNoValueThatNobodySet, TheScopesAreIndependent, TheDomainsAreIndependent,
    TheForcedValueDecidesThenTheUsersThenTheOneForAny, OnlyManagementForces, KeepsEveryTypeAsItIs,
    ThisProcessSeesAValueAtOnceAndOthersOnceItIsSynchronised, RemovesAKeyThatIsSetToNoValue,
    TheValueSetLastCounts, KeepsWhatOthersHaveWrittenMeanwhile, SeesWhatOthersWriteAfterwards,
    HasNothingToDoWhenNothingWasSet, AWriteThatFailsIsAFalseAnswerAndLeavesTheOldValue,
    WhatIsNoDomainHasNoRecord);

}  // namespace vlm::contracts
