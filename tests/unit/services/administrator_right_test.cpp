#include "services/hints/administrator_right.h"

#include <gmock/gmock.h>

#include <optional>
#include <string>
#include <vector>

#include "fake_authority.h"
#include "services/hints/status.h"

namespace vlm::service {
namespace {

using testing::HasSubstr;
using Outcome = RightVerdict::Outcome;

class AdministratorRightTest : public testing::Test {
protected:
    void ask(const std::string& change) {
        _asked.push_back(_right.ask({{1000, 20, ":1.20"}, "May it?", {}}, change,
                                    [this](const auto& refusal) { answers.push_back(refusal); }));
    }
    // The status of the last answer; -1 without one.
    platform::Status status() const {
        if (answers.empty()) return -1;
        return answers.back() ? answers.back()->status : 0;
    }

    fakes::FakeAuthority authority;
    std::vector<std::optional<Refusal>> answers;

private:
    AdministratorRight _right{authority};
    std::vector<std::unique_ptr<Authority::Question>> _asked;
};

TEST_F(AdministratorRightTest, IsThereWhenTheAuthorityGrantsIt) {
    ask("pairing a");
    EXPECT_TRUE(answers.empty());

    authority.grant();

    EXPECT_EQ(status(), 0);
}

struct Refused {
    const char* why;
    Outcome outcome;
    platform::Status status;
    const char* text;
};
constexpr Refused kRefused[] = {
    {"the person closed the window", Outcome::Dismissed, status::kCancelled, "dismissed"},
    {"the password was wrong", Outcome::Denied, status::kNotPermitted, "the password was wrong"},
    {"no agent runs", Outcome::NobodyToAsk, status::kRightUnknown, "no program of this desktop"},
    {"polkit died", Outcome::Failed, status::kRightUnknown, "could not be asked: it left. Try"},
};

TEST_F(AdministratorRightTest, TellsWhyItIsNotThere) {
    for (const auto& refused : kRefused) {
        SCOPED_TRACE(refused.why);
        ask("pairing a");

        authority.refuse(refused.outcome, "it left");

        EXPECT_EQ(status(), refused.status);
        ASSERT_TRUE(answers.back());
        EXPECT_THAT(answers.back()->text, HasSubstr(refused.text));
    }
}

TEST_F(AdministratorRightTest, ThatIsKeptServesTheSameChangeAgain) {
    ask("pairing a");
    authority.grantAndKeep("1");
    ask("pairing a");
    authority.grantAndKeep("1");

    EXPECT_EQ(answers.size(), 2u);
    EXPECT_EQ(status(), 0);
}

TEST_F(AdministratorRightTest, ThatIsKeptServesNoOtherChange) {
    ask("pairing a");
    authority.grantAndKeep("1");
    ask("pairing b");
    authority.grantAndKeep("1");

    ASSERT_EQ(status(), status::kNotPermitted);
    EXPECT_THAT(answers.back()->text, HasSubstr("one other change"));
}

TEST_F(AdministratorRightTest, ThatIsKeptServesOneOfTwoChangesThatWaited) {
    ask("pairing a");
    ask("pairing b");

    authority.grantAndKeep("1");
    EXPECT_EQ(status(), 0);
    authority.grantAndKeep("1");
    EXPECT_EQ(status(), status::kNotPermitted);
}

TEST_F(AdministratorRightTest, GivenAnewServesAnotherChange) {
    ask("pairing a");
    authority.grantAndKeep("1");
    ask("pairing b");
    authority.grantAndKeep("2");

    EXPECT_EQ(status(), 0);
}

}  // namespace
}  // namespace vlm::service
