// Cards and pairings as vlmctl lists them: real service, software cards, real database.

#include <SQLiteCpp/Database.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <iterator>

#include "control_machine.h"

namespace vlm::test {
namespace {

using ::testing::HasSubstr;
using ::testing::MatchesRegex;

constexpr const char* kTime = "[0-9]+-[0-9]+-[0-9]+T[0-9]+:[0-9]+:[0-9]+Z";

class ControlOfCards : public ::testing::Test {
protected:
    // Two cards, with one identity each: a card is paired with one account.
    void startWithCards() {
        machine.machine.cards.add("Blue", {identity("p256", "Alice Example")});
        machine.machine.cards.add("Red", {identity("p256", "Bob Example")});
        machine.machine.startService();
        const auto listing = machine.machine.vlmbind({"-i"}).output;
        alice = hashOf("Alice Example", listing);
        bob = hashOf("Bob Example", listing);
        ASSERT_NE(alice, "") << listing;
        ASSERT_NE(bob, "") << listing;
    }
    static std::string hashOf(const std::string& name, const std::string& listing) {
        const auto at = listing.find("\t" + name);
        return at == std::string::npos || at < 64 ? "" : listing.substr(at - 64, 64);
    }
    void pair(const std::string& account, const std::string& hash) {
        const auto paired = machine.machine.vlmbind({"-p", "-u", account, "-h", hash});
        ASSERT_EQ(paired.status, 0) << paired.output;
    }
    // The database of the service, two folders above the programs.
    std::string database() const {
        return machine.machine.tool().parent_path().parent_path().parent_path() / "state" /
               "hints.sqlite3";
    }

    ControlMachine machine;
    std::string alice;  // the public-key hashes
    std::string bob;
};

TEST_F(ControlOfCards, ListsTheSameAsTheTool) {
    if (getuid() != 0) GTEST_SKIP() << "the bus lets only root be the hints service";
    startWithCards();

    const auto listed = machine.vlmctl({"tokens", "--no-legend"});

    EXPECT_EQ(listed.status, 0) << listed.errors;
    EXPECT_THAT(listed.output,
                HasSubstr("Blue  Alice Example  unpaired  -  " + alice + "  pkcs11:"));
    EXPECT_THAT(listed.output, HasSubstr("Red   Bob Example    unpaired  -  " + bob + "  pkcs11:"));
}

TEST_F(ControlOfCards, ShowsAPairingWithItsCardAndInTheDatabase) {
    if (getuid() != 0) GTEST_SKIP() << "pairing needs root";
    startWithCards();
    pair("root", alice);
    pair("nobody", bob);

    EXPECT_THAT(machine.vlmctl({"tokens", "--no-legend"}).output,
                HasSubstr("Blue  Alice Example  used for login  root    " + alice));
    EXPECT_THAT(machine.vlmctl({"pairings", "--database", database()}).output,
                MatchesRegex("ACCOUNT  PUBLIC KEY HASH +PAIRED AT\nnobody   " + bob + "  " + kTime +
                             "\nroot     " + alice + "  " + kTime + "\n"));
    EXPECT_THAT(
        machine.vlmctl({"pairings", "--database", database(), "--user", "root", "--no-legend"})
            .output,
        MatchesRegex("root  " + alice + "  " + kTime + "\n"));
    EXPECT_EQ(machine.vlmctl({"pairings", "--user", "root", "--no-legend"}).output,
              "root  " + alice + "  -\n");
}

TEST_F(ControlOfCards, TellsAnOrdinaryUserTheOwnPairingsOnly) {
    if (getuid() != 0) GTEST_SKIP() << "only root can run the tool as another user";
    startWithCards();
    pair("root", alice);
    pair("nobody", bob);

    const auto own = machine.vlmctl({"pairings", "--no-legend"}, kOrdinaryUser);
    const auto other = machine.vlmctl({"pairings", "--user", "root"}, kOrdinaryUser);
    const auto file = machine.vlmctl({"pairings", "--database", database()}, kOrdinaryUser);
    const auto cards = machine.vlmctl({"tokens"}, kOrdinaryUser);

    EXPECT_EQ(own.output, "nobody  " + bob + "  -\n");
    EXPECT_EQ(other.status, 1);
    EXPECT_THAT(other.errors, HasSubstr("Those of another account are for root only"));
    EXPECT_EQ(file.status, 1);
    EXPECT_EQ(file.output, "");
    EXPECT_THAT(cards.output, HasSubstr("Alice Example  paired          another account"));
    EXPECT_THAT(cards.output, HasSubstr("Bob Example    used for login  nobody"));
}

TEST_F(ControlOfCards, SaysThatTheServiceIsNotThere) {
    const auto tokens = machine.vlmctl({"tokens"});
    const auto pairings = machine.vlmctl({"pairings", "--user", "root"});

    EXPECT_EQ(tokens.status, 1);
    EXPECT_EQ(tokens.output, "");
    EXPECT_THAT(tokens.errors, HasSubstr("vlmctl: the hints service gave no answer about cards"));
    EXPECT_EQ(pairings.status, 1);
    EXPECT_THAT(pairings.errors,
                HasSubstr("vlmctl: the hints service gave no answer about the pairings"));
}

// Databases that are no running service's.
class ControlOfDatabases : public ControlOfCards {
protected:
    Ended read(const std::string& path) { return machine.vlmctl({"pairings", "--database", path}); }
    static std::string contentOf(const std::string& path) {
        std::ifstream file(path, std::ios::binary);
        return {std::istreambuf_iterator<char>(file), {}};
    }

    TemporaryFolder folder;
    const std::string file = folder.path() / "a.sqlite3";
};

TEST_F(ControlOfDatabases, NeverMakesOne) {
    const auto refused = read(file);

    EXPECT_EQ(refused.status, 1);
    EXPECT_THAT(refused.errors, HasSubstr(file + " cannot be used: there is none"));
    EXPECT_TRUE(std::filesystem::is_empty(folder.path()));
}

TEST_F(ControlOfDatabases, ReadsOneWhoseServiceHasEndedAndLeavesItAsItWas) {
    if (getuid() != 0) GTEST_SKIP() << "pairing needs root";
    startWithCards();
    pair("root", alice);
    machine.machine.stopService();
    const auto before = contentOf(database());

    const auto listed = read(database());

    EXPECT_EQ(listed.status, 0) << listed.errors;
    EXPECT_THAT(listed.output, HasSubstr("root     " + alice));
    EXPECT_EQ(contentOf(database()), before);
    machine.machine.startService();
    EXPECT_THAT(read(database()).output, HasSubstr("root     " + alice));
}

TEST_F(ControlOfDatabases, RefusesOnesThatItDoesNotUnderstandAndChangesNothing) {
    const std::pair<const char*, const char*> rows[] = {
        {"CREATE TABLE a (b)", "another program"},
        {"PRAGMA application_id = 1986817392; PRAGMA user_version = 99; CREATE TABLE a (b)",
         "Install the newer program again"},
        {"PRAGMA application_id = 1986817392; CREATE TABLE a (b)", "when it next starts"},
    };
    for (const auto& [made, why] : rows) {
        SCOPED_TRACE(made);
        std::filesystem::remove(file);
        SQLite::Database(file, SQLite::OPEN_READWRITE | SQLite::OPEN_CREATE).exec(made);
        const auto before = contentOf(file);

        const auto refused = read(file);

        EXPECT_EQ(refused.status, 1);
        EXPECT_THAT(refused.errors, HasSubstr(why));
        EXPECT_EQ(contentOf(file), before);
    }
}

TEST_F(ControlOfDatabases, RefusesWhatIsNoDatabaseWithoutWaitingForIt) {
    folder.write("text", "SQLite is not in here, and this is long enough to be looked at.");
    ASSERT_EQ(mkfifo((folder.path() / "pipe").c_str(), 0600), 0);

    for (const char* name : {"text", "pipe", "."}) {
        SCOPED_TRACE(name);

        const auto refused = read(folder.path() / name);

        EXPECT_EQ(refused.status, 1);
        EXPECT_THAT(refused.errors, HasSubstr(" cannot be used: "));
    }
}

}  // namespace
}  // namespace vlm::test
