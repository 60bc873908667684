// What the service is asked, and what is told of its answer. The database itself is read in
// tests/integration/vlmctl.

#include "control_fixture.h"

namespace vlm::control {
namespace {

using testing::HasSubstr;

class PairingsCommand : public ControlTest {
protected:
    std::string askedAccount() {
        if (ipc().exchanges.empty()) return "nobody was asked";
        const auto* account = ipc().exchanges.back().request.text("str1");
        return account ? *account : "no account";
    }
};

TEST_F(PairingsCommand, AsksForTheOwnAccount) {
    answerPairings({{0xA1}, {0xA2}});

    const auto run = vlmctl({"pairings"});

    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.output,
              "ACCOUNT  PUBLIC KEY HASH  PAIRED AT\n"
              "alice    A1               -\n"
              "alice    A2               -\n");
    EXPECT_EQ(askedAccount(), "alice");
}

TEST_F(PairingsCommand, AsksForTheNamedAccountAlsoAsRootAndAlsoForOneThatIsGone) {
    answerPairings({});
    runAsRoot();

    EXPECT_EQ(vlmctl({"pairings", "--user", "gone"}).output, "No pairings.\n");
    EXPECT_EQ(askedAccount(), "gone");
}

TEST_F(PairingsCommand, SaysThatTheServiceIsNotThere) {
    ipc().serve(nullptr);

    const auto run = vlmctl({"pairings"});

    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.output, "");
    EXPECT_THAT(run.complaints, HasSubstr("no answer about the pairings of alice"));
}

TEST_F(PairingsCommand, PassesOverWhatIsNoHash) {
    service.script(static_cast<fakes::FakeHintsService::Operation>(4),
                   fakes::FakeHintsService::propertyList(
                       PropertyList::Dictionary{{"0", "text"}, {"1", Bytes{0xA1}}}));

    EXPECT_EQ(vlmctl({"pairings", "--no-legend"}).output, "alice  A1  -\n");
}

TEST_F(PairingsCommand, WritesJson) {
    answerPairings({{0xA1}});

    EXPECT_EQ(vlmctl({"pairings", "--json"}).output, R"({
  "pairings": [
    {
      "account": "alice",
      "hash": "A1",
      "pairedAt": null
    }
  ]
}
)");
}

}  // namespace
}  // namespace vlm::control
