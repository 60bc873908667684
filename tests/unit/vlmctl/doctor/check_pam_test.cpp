#include "doctor_fixture.h"
#include "services/vlmctl/doctor/pam_stack.h"

namespace vlm::control::doctor {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::Optional;

class PamStack : public DoctorTest {
protected:
    auto stackOf(const std::string& name) { return authenticationModules(patient.files, name); }
    void configure(const std::string& name, const std::string& lines) {
        folder.write("etc/pam.d/" + name, lines);
    }
};

TEST_F(PamStack, IsReadWithWhatItIncludesInItsPlace) {
    configure("common-auth",
              "auth\t[success=2 default=ignore]\tpam_unix.so nullok # as ever\n"
              "auth requisite pam_deny.so\n");
    configure("login",
              "# the first line\n"
              "auth optional pam_faildelay.so delay=3\n"
              "@include common-auth\n"
              "-auth optional /usr/lib/security/pam_gnome_keyring.so\n"
              "account required pam_nologin.so\n"
              "session include other\n");
    configure("display", "auth substack login\nauth include common-auth\n");

    EXPECT_THAT(stackOf("login"), Optional(ElementsAre("pam_faildelay", "pam_unix", "pam_deny",
                                                       "pam_gnome_keyring")));
    EXPECT_EQ(stackOf("display")->size(), 6U);
}

TEST_F(PamStack, IsNoneOfAServiceThatIsNotThere) {
    EXPECT_EQ(stackOf("login"), std::nullopt);
    EXPECT_EQ(stackOf("../login"), std::nullopt);
}

TEST_F(PamStack, EndsWhereFilesIncludeEachOther) {
    configure("a", "@include b\nauth required pam_a.so\n");
    configure("b", "@include a\n");

    EXPECT_THAT(stackOf("a"), Optional(testing::Contains("pam_a")));
}

TEST_F(PamStack, SurvivesLinesThatMakeNoSense) {
    configure("login", "auth\nauth required\n@include\nauth [a b\nauth include ../../etc/passwd\n");

    EXPECT_THAT(stackOf("login"), Optional(IsEmpty()));
}

class DoctorOfPam : public PamStack {
protected:
    Finding aboutPam(const std::string& check) { return about(checkPam(patient), check); }
    void installModule() { folder.write("usr/lib/x86_64-linux-gnu/security/pam_vlm.so", ""); }
};

constexpr const char* kCard = "auth sufficient pam_vlm.so\n";
constexpr const char* kPassword = "auth required pam_unix.so\n";
constexpr const char* kKeyring = "auth optional pam_gnome_keyring.so\n";

TEST_F(DoctorOfPam, FindsAMissingModule) {
    EXPECT_THAT(aboutPam("pam-module"), IsAProblem("is not installed"));

    installModule();
    EXPECT_THAT(aboutPam("pam-module"), IsWell());
}

TEST_F(DoctorOfPam, FindsAMachineThatAsksForNoCard) {
    installModule();
    configure("login", kPassword);

    EXPECT_THAT(aboutPam("logins"), IsAProblem("no login asks for a card"));
}

TEST_F(DoctorOfPam, JudgesEachLoginByTheOrderOfItsModules) {
    installModule();
    const auto lines = [](std::initializer_list<const char*> all) {
        std::string text;
        for (const auto* each : all) text += each;
        return text;
    };
    configure("common-auth", lines({kCard, kPassword}));
    configure("login", "@include common-auth\n");
    configure("lightdm", lines({"@include common-auth\n", kKeyring}));
    configure("sddm", "@include common-auth\n");
    configure("kde", kPassword);
    configure("xscreensaver", lines({kPassword, kCard}));
    configure("i3lock", lines({kKeyring, kCard, kPassword}));

    EXPECT_THAT(aboutPam("login:login"), IsWell());
    EXPECT_THAT(aboutPam("login:lightdm"), IsWell());
    EXPECT_THAT(aboutPam("login:sddm"), Warns("opens no keyring"));
    EXPECT_THAT(aboutPam("login:kde"), Warns("asks for no card"));
    EXPECT_THAT(aboutPam("login:xscreensaver"), IsAProblem("the password before"));
    EXPECT_THAT(aboutPam("login:i3lock"), IsAProblem("the keyring before"));
}

}  // namespace
}  // namespace vlm::control::doctor
