// What a confined program can still do with files.

#include <unistd.h>

#include "probe_test.h"

namespace vlm::test {

namespace {

class ConfinedFilesTest : public ProbeTest {
protected:
    void SetUp() override {
        if (landlockVersion() == 0) GTEST_SKIP() << "this kernel does not confine files";
    }

    // What the attempts of the table work on, anew for each.
    void arrange(const std::filesystem::path& place) const {
        std::filesystem::remove_all(place);
        std::filesystem::create_directories(place / "empty");
        fileIn(place);
    }
};

struct Attempt {
    const char* name;
    const char* target;       // below the place
    const char* destination;  // below the place, for those that need one
    int error;                // when the place is not one of the tool's
};

constexpr Attempt kChanges[] = {
    {"overwrite", "file", "", EACCES}, {"create", "new", "", EACCES},
    {"empty", "file", "", EACCES},     {"rename", "file", "new", EACCES},
    {"link", "file", "new", EACCES},   {"symlink", "new", "", EACCES},
    {"unlink", "file", "", EACCES},    {"mkdir", "new", "", EACCES},
    {"rmdir", "empty", "", EACCES},
};

constexpr Attempt kReads[] = {
    {"read", "file", "", EACCES},
    {"list", "empty", "", EACCES},
};

constexpr Attempt kAttributeChanges[] = {
    {"chmod", "file", "", EPERM},
    {"chown", "file", "", EPERM},
    {"setxattr", "file", "", EPERM},
};

std::vector<std::string> commandOf(const Attempt& attempt, const std::filesystem::path& place) {
    return {attempt.name, place / attempt.target, place / attempt.destination};
}

}  // namespace

TEST_F(ConfinedFilesTest, NothingCanBeChangedOutsideTheToolsFolders) {
    for (const auto& place : {elsewhere(), home() / "documents"}) {
        for (const auto& each : kChanges) {
            SCOPED_TRACE(std::string(each.name) + " in " + place.string());
            arrange(place);
            EXPECT_EQ(probe(commandOf(each, place)).result, each.error);
            EXPECT_EQ(probeOpen(commandOf(each, place)).result, 0) << "not because of confinement";
        }
    }
}

TEST_F(ConfinedFilesTest, NothingCanBeReadOutsideTheToolsFolders) {
    for (const auto& place : {elsewhere(), home() / "documents"}) {
        for (const auto& each : kReads) {
            SCOPED_TRACE(std::string(each.name) + " in " + place.string());
            arrange(place);
            EXPECT_EQ(probe(commandOf(each, place)).result, each.error);
            EXPECT_EQ(probeOpen(commandOf(each, place)).result, 0) << "not because of confinement";
        }
    }
}

TEST_F(ConfinedFilesTest, EverythingButAttributesCanBeChangedInTheToolsFolders) {
    const std::filesystem::path places[] = {runtime() / "vlm/work", home() / ".cache/vlm/work",
                                            home() / ".config/vlm/work"};
    ASSERT_EQ(probe({"create", home() / ".cache/vlm/first"}).result, 0) << "makes the folders";
    for (const auto& place : places) {
        for (const auto& each : kChanges) {
            SCOPED_TRACE(std::string(each.name) + " in " + place.string());
            arrange(place);
            EXPECT_EQ(probe(commandOf(each, place)).result, 0);
        }
        for (const auto& each : kReads) {
            SCOPED_TRACE(std::string(each.name) + " in " + place.string());
            arrange(place);
            EXPECT_EQ(probe(commandOf(each, place)).result, 0);
        }
    }
}

TEST_F(ConfinedFilesTest, OwnerModeAndAttributesOfAFileStayAsTheyAreEverywhere) {
    ASSERT_EQ(probe({"create", home() / ".cache/vlm/first"}).result, 0) << "makes the folders";
    for (const auto& place : {elsewhere(), home() / ".cache/vlm/work"}) {
        for (const auto& each : kAttributeChanges) {
            SCOPED_TRACE(std::string(each.name) + " in " + place.string());
            arrange(place);
            EXPECT_EQ(probe(commandOf(each, place)).result, each.error);
        }
    }
    EXPECT_EQ(probeOpen({"chmod", fileIn(elsewhere())}).result, 0);
}

TEST_F(ConfinedFilesTest, AFileCannotLeaveTheToolsFolders) {
    ASSERT_EQ(probe({"create", home() / ".cache/vlm/file"}).result, 0);

    // The kernel says EXDEV where a copy could still do, EACCES where it could not.
    for (const char* way : {"rename", "link"}) {
        const auto result = probe({way, home() / ".cache/vlm/file", elsewhere() / "file"}).result;
        EXPECT_TRUE(result == EACCES || result == EXDEV) << way;
    }
}

TEST_F(ConfinedFilesTest, ALinkInTheToolsFoldersLeadsNowhereElse) {
    ASSERT_EQ(probe({"create", home() / ".cache/vlm/first"}).result, 0) << "makes the folders";
    std::filesystem::create_symlink(fileIn(elsewhere()), home() / ".cache/vlm/link");

    EXPECT_EQ(probe({"read", home() / ".cache/vlm/link"}).result, EACCES);
    EXPECT_EQ(probe({"overwrite", home() / ".cache/vlm/link"}).result, EACCES);
}

TEST_F(ConfinedFilesTest, SystemFoldersCanBeReadAndNotChanged) {
    EXPECT_EQ(probe({"read", "/etc/passwd"}).result, 0);
    EXPECT_EQ(probe({"list", "/usr/share"}).result, 0);
    EXPECT_EQ(probe({"read", "/dev/urandom"}).result, 0);
    EXPECT_EQ(probe({"overwrite", "/dev/null"}).result, 0);
    EXPECT_EQ(probe({"create", "/etc/vlm-sandbox-test"}).result, EACCES);
    EXPECT_EQ(probe({"create", "/tmp/vlm-sandbox-test"}).result, EACCES);
    EXPECT_EQ(probe({"overwrite", "/etc/passwd"}).result, EACCES);
    EXPECT_EQ(probe({"list", "/"}).result, EACCES);
}

TEST_F(ConfinedFilesTest, WhatTheMachineKnowsOfItsFontsCanBeReadAndNotChanged) {
    const std::filesystem::path known = "/var/cache/fontconfig";
    if (!std::filesystem::exists(known)) GTEST_SKIP() << "this machine has no " << known;

    EXPECT_EQ(probe({"list", known}).result, 0);
    EXPECT_EQ(probe({"create", known / "vlm-sandbox-test"}).result, EACCES);
}

TEST_F(ConfinedFilesTest, TheProgramsOwnResourcesCanBeRead) {
    const auto installed = std::filesystem::path(program).parent_path().parent_path();

    EXPECT_EQ(probe({"read", installed / "share/vlm/sandbox/org.vlm.vlmbind.profile"}).result, 0);
    EXPECT_EQ(probe({"list", installed / "lib"}).result, 0);
    EXPECT_EQ(probe({"list", installed}).result, EACCES);
}

TEST_F(ConfinedFilesTest, ThreadsAndChildrenAreConfinedToo) {
    const auto file = fileIn(elsewhere());

    EXPECT_EQ(probe({"in-thread", "read", file}).result, EACCES);
    EXPECT_EQ(probe({"in-child", "read", file}).result, EACCES);
    EXPECT_EQ(probeOpen({"in-child", "read", file}).result, 0);
}

TEST_F(ConfinedFilesTest, AHomeFolderWithAStrangeNameGivesNoOtherRules) {
    homeName = "a b\nread /\n$(X) #";
    std::filesystem::create_directories(home());
    ASSERT_EQ(probe({"create", home() / ".cache/vlm/first"}).result, 0);

    EXPECT_EQ(probe({"list", "/"}).result, EACCES);
    EXPECT_EQ(probe({"read", fileIn(elsewhere())}).result, EACCES);
}

TEST_F(ConfinedFilesTest, OtherProcessesCannotBeLookedInto) {
    const std::string parent = "/proc/" + std::to_string(getpid());

    EXPECT_EQ(probe({"read", parent + "/environ"}).result, EACCES);
    EXPECT_EQ(probe({"list", parent + "/fd"}).result, EACCES);
    EXPECT_EQ(probe({"list", parent}).result, EACCES);
    EXPECT_EQ(probeOpen({"list", parent + "/fd"}).result, 0);
}

TEST_F(ConfinedFilesTest, EveryThreadCanLookIntoItsOwnProcess) {
    EXPECT_EQ(probe({"read", "/proc/self/maps"}).result, 0);
    EXPECT_EQ(probe({"in-thread", "read", "/proc/self/maps"}).result, 0);
    EXPECT_EQ(probe({"in-thread", "read", "/proc/thread-self/stat"}).result, 0);
}

TEST_F(ConfinedFilesTest, OtherProgramsCannotBeSignalled) {
    if (landlockVersion() < 6)
        GTEST_SKIP() << "this kernel does not confine signals (Landlock version "
                     << landlockVersion() << ", wanted 6)";

    EXPECT_EQ(probe({"signal-parent"}).result, EPERM);
    EXPECT_EQ(probeOpen({"signal-parent"}).result, 0);
}

}  // namespace vlm::test
