#include "services/hints/tokens/module_registry.h"

#include <gmock/gmock.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>

#include "platform_test.h"

namespace vlm::service {
namespace {

namespace fs = std::filesystem;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

class ModuleRegistryTest : public fakes::PlatformTest {
protected:
    ModuleRegistryTest() {
        std::string pattern = fs::temp_directory_path() / "vlm-modules-XXXXXX";
        _folder = mkdtemp(pattern.data());
        for (const char* name : {"package", "admin", "lib"}) fs::create_directory(_folder / name);
        for (const char* name : {"a.so", "b.so", "c.so"}) std::ofstream(_folder / "lib" / name);
    }
    ~ModuleRegistryTest() override { fs::remove_all(_folder); }

    void package(const std::string& name, const std::string& content) {
        std::ofstream(_folder / "package" / name, std::ios::binary) << content;
    }
    void admin(const std::string& name, const std::string& content) {
        std::ofstream(_folder / "admin" / name) << content;
    }
    fs::path library(const std::string& name) { return fs::canonical(_folder / "lib" / name); }

    // The names of the modules, in order.
    std::vector<std::string> names(ModuleKind kind = ModuleKind::Card) {
        std::vector<std::string> names;
        for (const auto& module : configured(kind)) names.push_back(module.name);
        return names;
    }
    std::vector<ConfiguredModule> configured(ModuleKind kind = ModuleKind::Card) {
        return configuredModules({_folder / "package", _folder / "admin", _folder / "lib"}, kind);
    }
    std::vector<std::string> warnings() { return log().texts(platform::LogLevel::Error); }

private:
    fs::path _folder;
};

TEST_F(ModuleRegistryTest, IsEmptyWithoutFilesOrFolders) {
    EXPECT_THAT(names(), IsEmpty());
    EXPECT_THAT(configuredModules({"/nonexistent/a", "/nonexistent/b", "/nonexistent/c"}),
                IsEmpty());
    EXPECT_THAT(warnings(), IsEmpty());
}

TEST_F(ModuleRegistryTest, FindsModulesByNameAndByPath) {
    package("one.module", "module: a.so\n");
    package("two.module", "module: " + library("b.so").string() + "\n");

    EXPECT_THAT(configured(), ElementsAre(ConfiguredModule{"one", library("a.so")},
                                          ConfiguredModule{"two", library("b.so")}));
}

TEST_F(ModuleRegistryTest, OrdersByPriorityThenByName) {
    package("b.module", "module: b.so");
    package("a.module", "module: a.so");
    package("z.module", "module: c.so\npriority: 5");

    EXPECT_THAT(names(), ElementsAre("z", "a", "b"));
}

TEST_F(ModuleRegistryTest, LetsTheAdministratorOverrideSettingBySetting) {
    package("one.module", "module: a.so\npriority: 1");
    package("two.module", "module: b.so");
    package("off.module", "module: c.so");
    admin("one.module", "priority: -1");
    admin("off.module", "module:");

    EXPECT_THAT(configured(), ElementsAre(ConfiguredModule{"two", library("b.so")},
                                          ConfiguredModule{"one", library("a.so")}));
}

TEST_F(ModuleRegistryTest, TakesOneModuleOnceThroughAllItsLinks) {
    fs::create_symlink(library("a.so"), library("a.so").parent_path() / "link.so");
    package("one.module", "module: a.so");
    package("two.module", "module: link.so");
    package("three.module", "module: ./a.so");

    EXPECT_THAT(names(), ElementsAre("one"));
}

struct Case {
    const char* why;
    const char* content;
    bool taken;
};

TEST_F(ModuleRegistryTest, TakesWhatIsMeantForThisProgramAndHoldsCards) {
    const std::vector<Case> cases = {
        {"comments and blank lines", "\n# comment\n  # another\n module :\ta.so \r\n", true},
        {"unknown settings", "module: a.so\nx-custom: y\ncritical: yes", true},
        {"a value with a colon", "x-y: a:b\nmodule: a.so", true},
        {"enabled here", "module: a.so\nenable-in: other, vlmhintsd", true},
        {"enabled elsewhere", "module: a.so\nenable-in: p11-kit-proxy", false},
        {"disabled here", "module: a.so\ndisable-in: vlmhintsd", false},
        {"disabled elsewhere", "module: a.so\ndisable-in: p11-kit-proxy vlmhintsd2", true},
        {"remote", "module: a.so\nremote: |ssh somewhere", false},
        {"trust anchors", "module: a.so\ntrust-policy: yes", false},
        {"no trust anchors", "module: a.so\ntrust-policy: no", true},
        {"no module", "priority: 1", false},
        {"a blank module", "module:", false},
        {"an empty file", "", false},
        {"a priority that is no number", "module: a.so\npriority: high", true},
    };
    for (const Case& each : cases) {
        package("one.module", each.content);
        EXPECT_EQ(names().size(), each.taken ? 1U : 0U) << each.why;
    }
    EXPECT_THAT(warnings(), IsEmpty());
}

TEST_F(ModuleRegistryTest, TellsTheModulesThatHoldTrustAnchorsApart) {
    package("cards.module", "module: a.so\n");
    package("anchors.module", "module: b.so\ntrust-policy: yes\n");
    package("elsewhere.module", "module: c.so\ntrust-policy: yes\ndisable-in: vlmhintsd\n");

    EXPECT_THAT(names(), ElementsAre("cards"));
    EXPECT_THAT(names(ModuleKind::Trust), ElementsAre("anchors"));
}

TEST_F(ModuleRegistryTest, LeavesOutFilesOfOtherNames) {
    package("one.module~", "module: a.so");
    package(".hidden.module", "module: a.so");
    package("README", "no module at all");

    EXPECT_THAT(names(), IsEmpty());
    EXPECT_THAT(warnings(), IsEmpty());
}

TEST_F(ModuleRegistryTest, WarnsOnceOfEachMalformedFileAndGoesOn) {
    package("bad.module", "module a.so\n");
    package("binary.module", std::string("module: a.so\0", 13));
    package("huge.module", "module: a.so\n#" + std::string(70'000, 'x'));
    package("nameless.module", ": a.so\n");
    package("good.module", "module: b.so");

    EXPECT_THAT(names(), ElementsAre("good"));
    EXPECT_THAT(warnings(), testing::SizeIs(4));
    EXPECT_THAT(warnings(), testing::Each(HasSubstr("is not well formed")));
}

TEST_F(ModuleRegistryTest, WarnsOfAModuleThatIsNotThere) {
    package("gone.module", "module: gone.so");
    package("good.module", "module: a.so");

    EXPECT_THAT(names(), ElementsAre("good"));
    EXPECT_THAT(warnings(), ElementsAre("the card module gone is left out: there is no gone.so"));
}

TEST_F(ModuleRegistryTest, KnowsWhereThisMachineKeepsItsModules) {
    const ModuleFolders folders = ModuleFolders::ofThisMachine();

    for (const auto& folder : {folders.packageFiles, folders.adminFiles, folders.modules})
        EXPECT_TRUE(fs::path(folder).is_absolute()) << folder;
}

}  // namespace
}  // namespace vlm::service
