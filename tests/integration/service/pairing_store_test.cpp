// What every store of pairings does, the fake of the unit tests included, and what is true of the
// database file only.

#include "services/hints/pairing_store.h"

#include <SQLiteCpp/Database.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>

#include "cards.h"
#include "fake_pairing_store.h"
#include "private_folder.h"
#include "services/hints/sqlite_pairing_store.h"
#include "services/hints/status.h"

namespace vlm::service {
namespace {

using testing::HasSubstr;

template <typename Store>
class PairingStoreContract;

template <>
class PairingStoreContract<fakes::FakePairingStore> : public testing::Test {
protected:
    PairingStore& store() { return _store; }

private:
    fakes::FakePairingStore _store;
};

template <>
class PairingStoreContract<SqlitePairingStore> : public testing::Test {
protected:
    PairingStoreContract() {
        auto opened = SqlitePairingStore::open(_folder.path() / "hints.sqlite3");
        if (opened) _store = std::move(*opened);
    }
    void SetUp() override { ASSERT_TRUE(_store); }
    PairingStore& store() { return *_store; }

private:
    PrivateFolder _folder;
    std::unique_ptr<SqlitePairingStore> _store;
};

std::vector<platform::Bytes> hashesOf(const Outcome<std::vector<Pairing>>& pairings) {
    std::vector<platform::Bytes> hashes;
    if (pairings)
        for (const auto& pairing : *pairings) hashes.push_back(pairing.hash);
    return hashes;
}

std::vector<std::string> accountsOf(const Outcome<std::vector<Pairing>>& pairings) {
    std::vector<std::string> accounts;
    if (pairings)
        for (const auto& pairing : *pairings) accounts.push_back(pairing.account);
    return accounts;
}

TYPED_TEST_SUITE_P(PairingStoreContract);

TYPED_TEST_P(PairingStoreContract, HasNoPairingsAtFirst) {
    EXPECT_FALSE(*this->store().isPaired("alice"));
    EXPECT_TRUE(this->store().pairingsOf("alice")->empty());
    EXPECT_TRUE(this->store().pairingsWith(hashOf(1))->empty());
}

TYPED_TEST_P(PairingStoreContract, TellsWhatWasPaired) {
    EXPECT_FALSE(this->store().pair("alice", hashOf(1), 77));

    EXPECT_TRUE(*this->store().isPaired("alice"));
    const auto pairings = this->store().pairingsOf("alice");
    ASSERT_EQ(pairings->size(), 1u);
    EXPECT_EQ((*pairings)[0].account, "alice");
    EXPECT_EQ((*pairings)[0].hash, hashOf(1));
    EXPECT_EQ((*pairings)[0].pairedAt, 77);
}

TYPED_TEST_P(PairingStoreContract, TellsTheLatestFirstWhateverTheClockSays) {
    this->store().pair("alice", hashOf(1), 300);
    this->store().pair("alice", hashOf(2), 200);
    this->store().pair("alice", hashOf(3), 100);

    EXPECT_THAT(hashesOf(this->store().pairingsOf("alice")),
                testing::ElementsAre(hashOf(3), hashOf(2), hashOf(1)));
}

TYPED_TEST_P(PairingStoreContract, MakesAPairThatIsThereAlreadyTheLatest) {
    this->store().pair("alice", hashOf(1), 100);
    this->store().pair("alice", hashOf(2), 100);
    this->store().pair("alice", hashOf(1), 200);

    const auto pairings = this->store().pairingsOf("alice");
    EXPECT_THAT(hashesOf(pairings), testing::ElementsAre(hashOf(1), hashOf(2)));
    EXPECT_EQ((*pairings)[0].pairedAt, 200);
    EXPECT_GT((*pairings)[0].sequence, (*pairings)[1].sequence);
}

TYPED_TEST_P(PairingStoreContract, LetsAKeyServeSeveralAccounts) {
    this->store().pair("alice", hashOf(1), 100);
    this->store().pair("bob", hashOf(1), 100);

    EXPECT_THAT(accountsOf(this->store().pairingsWith(hashOf(1))),
                testing::ElementsAre("bob", "alice"));
}

TYPED_TEST_P(PairingStoreContract, UnpairsThatPairOnlyAndSaysWhetherItWasThere) {
    this->store().pair("alice", hashOf(1), 100);
    this->store().pair("alice", hashOf(2), 100);
    this->store().pair("bob", hashOf(1), 100);

    EXPECT_TRUE(*this->store().unpair("alice", hashOf(1)));
    EXPECT_FALSE(*this->store().unpair("alice", hashOf(1)));
    EXPECT_FALSE(*this->store().unpair("carol", hashOf(1)));

    EXPECT_THAT(hashesOf(this->store().pairingsOf("alice")), testing::ElementsAre(hashOf(2)));
    EXPECT_TRUE(*this->store().isPaired("bob"));
}

TYPED_TEST_P(PairingStoreContract, TellsAccountsApartByTheirExactNames) {
    this->store().pair("alice", hashOf(1), 100);

    for (const auto* other : {"Alice", "alic", "alice ", "a%", "' OR 1=1 --"})
        EXPECT_FALSE(*this->store().isPaired(other)) << other;
}

TYPED_TEST_P(PairingStoreContract, GivesNoSequenceTwice) {
    this->store().pair("alice", hashOf(1), 100);
    const auto first = (*this->store().pairingsOf("alice"))[0].sequence;
    this->store().unpair("alice", hashOf(1));
    this->store().pair("alice", hashOf(1), 100);

    EXPECT_GT((*this->store().pairingsOf("alice"))[0].sequence, first);
}

REGISTER_TYPED_TEST_SUITE_P(PairingStoreContract, HasNoPairingsAtFirst, TellsWhatWasPaired,
                            TellsTheLatestFirstWhateverTheClockSays,
                            MakesAPairThatIsThereAlreadyTheLatest, LetsAKeyServeSeveralAccounts,
                            UnpairsThatPairOnlyAndSaysWhetherItWasThere,
                            TellsAccountsApartByTheirExactNames, GivesNoSequenceTwice);
using Stores = testing::Types<fakes::FakePairingStore, SqlitePairingStore>;
INSTANTIATE_TYPED_TEST_SUITE_P(EveryStore, PairingStoreContract, Stores);

class SqlitePairingStoreTest : public testing::Test {
protected:
    Outcome<std::unique_ptr<SqlitePairingStore>> open() { return SqlitePairingStore::open(path()); }

    // Why the database is not opened.
    std::string refusal() {
        const auto opened = open();
        if (opened) return "(opened)";
        EXPECT_EQ(opened.refusal().status, status::kStoreFailed);
        EXPECT_THAT(opened.refusal().text, HasSubstr(path()));
        return opened.refusal().text;
    }
    void makeDatabase() { ASSERT_TRUE(open()); }
    void change(const std::string& statements) {
        SQLite::Database database(path(), SQLite::OPEN_READWRITE | SQLite::OPEN_CREATE);
        database.exec(statements);
        chmod(path().c_str(), 0600);
    }
    std::string content() const {
        std::ifstream file(path());
        std::string text;
        std::getline(file, text, '\0');
        return text;
    }

    std::filesystem::path folder() const { return _folder.path() / "vlm"; }
    std::string path() const { return folder() / "hints.sqlite3"; }

private:
    PrivateFolder _folder;
};

mode_t modeOf(const std::filesystem::path& path) {
    struct stat state = {};
    return stat(path.c_str(), &state) == 0 ? state.st_mode & 07777 : 0;
}

TEST_F(SqlitePairingStoreTest, MakesItsFolderAndFileForThisUserOnly) {
    const auto store = open();

    ASSERT_TRUE(store);
    EXPECT_EQ(modeOf(folder()), 0700u);
    ASSERT_FALSE((*store)->pair("alice", hashOf(1), 1));
    for (const auto& file : std::filesystem::directory_iterator(folder()))
        EXPECT_EQ(modeOf(file.path()), 0600u) << file.path();
}

TEST_F(SqlitePairingStoreTest, KeepsPairingsWhenItIsOpenedAgain) {
    ASSERT_FALSE((*open())->pair("alice", hashOf(1), 1));

    EXPECT_TRUE(*(*open())->isPaired("alice"));
}

TEST_F(SqlitePairingStoreTest, HasAPairingOnDiskWhenPairReturns) {
    const auto store = open();
    ASSERT_FALSE((*store)->pair("alice", hashOf(1), 1));

    SQLite::Database other(path(), SQLite::OPEN_READONLY);

    EXPECT_EQ(other.execAndGet("SELECT account FROM pairing").getString(), "alice");
    EXPECT_EQ(other.execAndGet("PRAGMA journal_mode").getString(), "wal");
}

TEST_F(SqlitePairingStoreTest, MarksTheDatabaseAsItsOwn) {
    makeDatabase();

    SQLite::Database other(path(), SQLite::OPEN_READONLY);

    EXPECT_EQ(other.execAndGet("PRAGMA application_id").getInt(), 0x766C6D70);
    EXPECT_EQ(other.execAndGet("PRAGMA user_version").getInt(), 2);
}

TEST_F(SqlitePairingStoreTest, RefusesASchemaThatIsNewerThanItself) {
    makeDatabase();
    change("PRAGMA user_version = 99");

    EXPECT_THAT(refusal(), HasSubstr("version is 99"));
}

TEST_F(SqlitePairingStoreTest, RefusesTheDatabaseOfAnotherProgramAndLeavesItAsItIs) {
    std::filesystem::create_directory(folder());
    chmod(folder().c_str(), 0700);
    change("CREATE TABLE recipe (name TEXT); PRAGMA user_version = 1");

    EXPECT_THAT(refusal(), HasSubstr("another program"));

    SQLite::Database other(path(), SQLite::OPEN_READONLY);
    EXPECT_EQ(other.execAndGet("PRAGMA journal_mode").getString(), "delete");
    EXPECT_EQ(other.execAndGet("SELECT count(*) FROM sqlite_master").getInt(), 1);
}

TEST_F(SqlitePairingStoreTest, RefusesADatabaseWithTheMarkOfAnotherProgram) {
    makeDatabase();
    change("PRAGMA application_id = 4711");

    EXPECT_THAT(refusal(), HasSubstr("another program"));
}

TEST_F(SqlitePairingStoreTest, RefusesAFileThatIsNoDatabaseAndLeavesItAsItIs) {
    makeDatabase();
    const std::string words(1000, 'x');
    std::ofstream(path(), std::ios::trunc) << words;

    EXPECT_THAT(refusal(), HasSubstr("move it away"));
    EXPECT_EQ(content(), words);
}

TEST_F(SqlitePairingStoreTest, RefusesADatabaseWhoseTableIsGone) {
    makeDatabase();
    change("DROP TABLE pairing");

    EXPECT_THAT(refusal(), HasSubstr("pairing"));
}

TEST_F(SqlitePairingStoreTest, RefusesPermissionsForOthers) {
    makeDatabase();

    chmod(path().c_str(), 0640);
    EXPECT_THAT(refusal(), HasSubstr("chmod 0600"));
    chmod(path().c_str(), 0600);
    chmod(folder().c_str(), 0755);
    EXPECT_THAT(refusal(), HasSubstr("chmod 0700"));
    chmod(folder().c_str(), 0700);
    EXPECT_EQ(refusal(), "(opened)");
}

TEST_F(SqlitePairingStoreTest, RefusesSymbolicLinks) {
    makeDatabase();
    const auto elsewhere = folder().string() + "-elsewhere";

    std::filesystem::rename(path(), path() + ".real");
    std::filesystem::create_symlink(path() + ".real", path());
    EXPECT_THAT(refusal(), HasSubstr("symbolic link"));
    std::filesystem::rename(path() + ".real", path());

    std::filesystem::rename(folder(), elsewhere);
    std::filesystem::create_directory_symlink(elsewhere, folder());
    EXPECT_THAT(refusal(), HasSubstr("symbolic link"));
}

TEST_F(SqlitePairingStoreTest, RefusesAFileWithASecondName) {
    makeDatabase();
    std::filesystem::create_hard_link(path(), path() + ".second");

    EXPECT_THAT(refusal(), HasSubstr("second name"));
}

TEST_F(SqlitePairingStoreTest, RefusesWhatIsNoFile) {
    std::filesystem::create_directories(path());
    chmod(folder().c_str(), 0700);
    EXPECT_NE(refusal(), "(opened)");

    std::filesystem::remove(path());
    ASSERT_EQ(mkfifo(path().c_str(), 0600), 0);
    EXPECT_THAT(refusal(), HasSubstr("not of the right kind"));
}

TEST_F(SqlitePairingStoreTest, RefusesAFileOfAnotherUser) {
    if (geteuid() != 0) GTEST_SKIP() << "only root can give a file away";
    makeDatabase();

    ASSERT_EQ(chown(path().c_str(), 65534, 65534), 0);

    EXPECT_THAT(refusal(), HasSubstr("belongs to the user 65534"));
}

TEST_F(SqlitePairingStoreTest, RefusesAFolderThatIsNotThere) {
    const auto opened = SqlitePairingStore::open(path() + "/no/such/folder/file");

    ASSERT_FALSE(opened);
    EXPECT_THAT(opened.refusal().text, HasSubstr("No such file"));
}

TEST_F(SqlitePairingStoreTest, RefusesARelativePath) {
    const auto opened = SqlitePairingStore::open("hints.sqlite3");

    ASSERT_FALSE(opened);
    EXPECT_THAT(opened.refusal().text, HasSubstr("absolute"));
}

TEST_F(SqlitePairingStoreTest, SaysSoWhenSomebodyElseHoldsTheDatabase) {
    const auto store = open();
    ASSERT_FALSE((*store)->pair("alice", hashOf(1), 1));
    SQLite::Database other(path(), SQLite::OPEN_READWRITE);
    other.exec("BEGIN IMMEDIATE");

    const auto refusal = (*store)->pair("alice", hashOf(2), 1);

    ASSERT_TRUE(refusal);
    EXPECT_EQ(refusal->status, status::kStoreFailed);
    EXPECT_THAT(refusal->text, HasSubstr("locked"));
    EXPECT_TRUE(*(*store)->isPaired("alice"));
    other.exec("ROLLBACK");
    EXPECT_FALSE((*store)->pair("alice", hashOf(2), 1));
}

TEST_F(SqlitePairingStoreTest, SaysSoWhenTheDatabaseGoesBadUnderIt) {
    const auto store = open();
    change("DROP TABLE pairing");

    EXPECT_EQ((*store)->pair("alice", hashOf(1), 1)->status, status::kStoreFailed);
    EXPECT_EQ((*store)->pairingsOf("alice").refusal().status, status::kStoreFailed);
    EXPECT_EQ((*store)->unpair("alice", hashOf(1)).refusal().status, status::kStoreFailed);
}

TEST_F(SqlitePairingStoreTest, StoresNoHashOfAnotherSize) {
    const auto store = open();

    EXPECT_EQ((*store)->pair("alice", platform::Bytes(31), 1)->status, status::kStoreFailed);
    EXPECT_EQ((*store)->pair("", hashOf(1), 1)->status, status::kStoreFailed);
}

}  // namespace
}  // namespace vlm::service
