// What every store of unlock keys does, the fake of the unit tests included, and how a database
// from before there were any is brought up to date.

#include "services/hints/unlock_key_store.h"

#include <SQLiteCpp/Database.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include "cards.h"
#include "fake_pairing_store.h"
#include "private_folder.h"
#include "services/hints/sqlite_pairing_store.h"
#include "services/hints/status.h"

namespace vlm::service {
namespace {

using testing::ElementsAre;

UnlockKey keyFor(const std::string& account, std::uint8_t hash, std::uint8_t content = 7) {
    return {account, hashOf(hash), hashOf(90), platform::Bytes(91, 1),
            platform::Bytes(200, content)};
}

template <typename Store>
class UnlockKeyStoreContract;

template <>
class UnlockKeyStoreContract<fakes::FakePairingStore> : public testing::Test {
protected:
    fakes::FakePairingStore& store() { return _store; }

private:
    fakes::FakePairingStore _store;
};

template <>
class UnlockKeyStoreContract<SqlitePairingStore> : public testing::Test {
protected:
    void SetUp() override {
        auto opened = SqlitePairingStore::open(_folder.path() / "hints.sqlite3");
        ASSERT_TRUE(opened) << opened.refusal().text;
        _store = std::move(*opened);
    }
    SqlitePairingStore& store() { return *_store; }

private:
    PrivateFolder _folder;
    std::unique_ptr<SqlitePairingStore> _store;
};

TYPED_TEST_SUITE_P(UnlockKeyStoreContract);

TYPED_TEST_P(UnlockKeyStoreContract, HasNoneForAPairingAtFirst) {
    this->store().pair("alice", hashOf(1), 1);

    EXPECT_EQ(*this->store().unlockKey("alice", hashOf(1)), std::nullopt);
    EXPECT_TRUE(this->store().unlockKeysOf("alice")->empty());
}

TYPED_TEST_P(UnlockKeyStoreContract, GivesBackWhatWasStored) {
    this->store().pair("alice", hashOf(1), 1);

    ASSERT_FALSE(this->store().storeUnlockKey(keyFor("alice", 1)));

    EXPECT_EQ(*this->store().unlockKey("alice", hashOf(1)), keyFor("alice", 1));
    EXPECT_EQ(*this->store().unlockKey("alice", hashOf(2)), std::nullopt);
    EXPECT_EQ(*this->store().unlockKey("bob", hashOf(1)), std::nullopt);
}

TYPED_TEST_P(UnlockKeyStoreContract, ReplacesTheOneThatIsThere) {
    this->store().pair("alice", hashOf(1), 1);
    this->store().storeUnlockKey(keyFor("alice", 1, 7));

    ASSERT_FALSE(this->store().storeUnlockKey(keyFor("alice", 1, 8)));

    EXPECT_THAT(*this->store().unlockKeysOf("alice"), ElementsAre(keyFor("alice", 1, 8)));
}

TYPED_TEST_P(UnlockKeyStoreContract, StoresNothingWithoutThePairing) {
    this->store().pair("alice", hashOf(1), 1);

    EXPECT_EQ(this->store().storeUnlockKey(keyFor("alice", 2))->status, status::kNotPaired);
    EXPECT_EQ(this->store().storeUnlockKey(keyFor("bob", 1))->status, status::kNotPaired);

    EXPECT_TRUE(this->store().unlockKeysOf("alice")->empty());
    EXPECT_TRUE(this->store().unlockKeysOf("bob")->empty());
}

TYPED_TEST_P(UnlockKeyStoreContract, TellsThoseOfOneAccount) {
    for (const auto* account : {"alice", "bob"})
        for (const std::uint8_t hash : {2, 1}) {
            this->store().pair(account, hashOf(hash), 1);
            ASSERT_FALSE(this->store().storeUnlockKey(keyFor(account, hash)));
        }

    EXPECT_THAT(*this->store().unlockKeysOf("bob"),
                ElementsAre(keyFor("bob", 1), keyFor("bob", 2)));
}

TYPED_TEST_P(UnlockKeyStoreContract, StoresAllOfSeveralOrNone) {
    this->store().pair("alice", hashOf(1), 1);
    this->store().pair("alice", hashOf(2), 1);
    this->store().storeUnlockKey(keyFor("alice", 1, 7));

    EXPECT_EQ(this->store().storeUnlockKeys({keyFor("alice", 1, 8), keyFor("alice", 3, 8)})->status,
              status::kNotPaired);
    EXPECT_THAT(*this->store().unlockKeysOf("alice"), ElementsAre(keyFor("alice", 1, 7)));

    EXPECT_FALSE(this->store().storeUnlockKeys({keyFor("alice", 1, 9), keyFor("alice", 2, 9)}));
    EXPECT_THAT(*this->store().unlockKeysOf("alice"),
                ElementsAre(keyFor("alice", 1, 9), keyFor("alice", 2, 9)));
}

TYPED_TEST_P(UnlockKeyStoreContract, ErasesOneAndSaysWhetherItWasThere) {
    this->store().pair("alice", hashOf(1), 1);
    this->store().storeUnlockKey(keyFor("alice", 1));

    EXPECT_TRUE(*this->store().eraseUnlockKey("alice", hashOf(1)));
    EXPECT_FALSE(*this->store().eraseUnlockKey("alice", hashOf(1)));

    EXPECT_TRUE(*this->store().isPaired("alice")) << "the pairing stands";
}

TYPED_TEST_P(UnlockKeyStoreContract, LosesItWithItsPairingOnly) {
    for (const auto* account : {"alice", "bob"}) {
        this->store().pair(account, hashOf(1), 1);
        this->store().storeUnlockKey(keyFor(account, 1));
    }

    this->store().unpair("alice", hashOf(1));
    this->store().pair("alice", hashOf(1), 2);

    EXPECT_EQ(*this->store().unlockKey("alice", hashOf(1)), std::nullopt);
    EXPECT_EQ(*this->store().unlockKey("bob", hashOf(1)), keyFor("bob", 1));
}

TYPED_TEST_P(UnlockKeyStoreContract, KeepsItWhenTheSameIsPairedAgain) {
    this->store().pair("alice", hashOf(1), 1);
    this->store().storeUnlockKey(keyFor("alice", 1));

    this->store().pair("alice", hashOf(1), 2);

    EXPECT_EQ(*this->store().unlockKey("alice", hashOf(1)), keyFor("alice", 1));
}

TYPED_TEST_P(UnlockKeyStoreContract, TakesTextForDataOnly) {
    const std::string name = "a'); DROP TABLE unlock_key; --";
    this->store().pair(name, hashOf(1), 1);

    ASSERT_FALSE(this->store().storeUnlockKey(keyFor(name, 1)));

    EXPECT_THAT(*this->store().unlockKeysOf(name), ElementsAre(keyFor(name, 1)));
}

REGISTER_TYPED_TEST_SUITE_P(UnlockKeyStoreContract, HasNoneForAPairingAtFirst,
                            GivesBackWhatWasStored, ReplacesTheOneThatIsThere,
                            StoresNothingWithoutThePairing, TellsThoseOfOneAccount,
                            StoresAllOfSeveralOrNone, ErasesOneAndSaysWhetherItWasThere,
                            LosesItWithItsPairingOnly, KeepsItWhenTheSameIsPairedAgain,
                            TakesTextForDataOnly);
using Stores = testing::Types<fakes::FakePairingStore, SqlitePairingStore>;
INSTANTIATE_TYPED_TEST_SUITE_P(EveryStore, UnlockKeyStoreContract, Stores);

// A database as the first version made it.
class FirstVersion : public testing::Test {
protected:
    FirstVersion() {
        SQLite::Database database(path(), SQLite::OPEN_READWRITE | SQLite::OPEN_CREATE);
        database.exec(R"(
            PRAGMA journal_mode = WAL;
            CREATE TABLE pairing (
                sequence INTEGER PRIMARY KEY AUTOINCREMENT,
                account TEXT NOT NULL CHECK (account <> ''),
                hash BLOB NOT NULL CHECK (typeof(hash) = 'blob' AND length(hash) = 32),
                paired_at INTEGER NOT NULL,
                UNIQUE (account, hash)
            );
            CREATE INDEX pairing_by_hash ON pairing (hash);
            INSERT INTO pairing VALUES (1, 'gone', zeroblob(32), 50);
            INSERT INTO pairing VALUES (7, 'alice', zeroblob(32), 70);
            DELETE FROM pairing WHERE account = 'gone';
            PRAGMA application_id = 1986817392;
            PRAGMA user_version = 1;)");
        chmod(path().c_str(), 0600);
    }
    std::string path() const { return _folder.path() / "hints.sqlite3"; }
    int number(const char* query) { return SQLite::Database(path()).execAndGet(query).getInt(); }
    void change(const char* statements) {
        SQLite::Database(path(), SQLite::OPEN_READWRITE).exec(statements);
    }

    const platform::Bytes zeroes = platform::Bytes(32, 0);

private:
    PrivateFolder _folder;
};

TEST_F(FirstVersion, IsBroughtToThePresentOneWithItsPairings) {
    const auto store = SqlitePairingStore::open(path());

    ASSERT_TRUE(store) << store.refusal().text;
    EXPECT_THAT(*(*store)->pairingsOf("alice"), ElementsAre(Pairing{"alice", zeroes, 7, 70}));
    EXPECT_EQ(number("PRAGMA user_version"), 2);
    EXPECT_EQ(number("PRAGMA application_id"), 0x766C6D70);
}

TEST_F(FirstVersion, TakesUnlockKeysForTheOldPairingsFromThenOn) {
    const auto store = SqlitePairingStore::open(path());
    ASSERT_TRUE(store);
    const UnlockKey key{"alice", zeroes, hashOf(90), platform::Bytes(91, 1),
                        platform::Bytes(200, 7)};

    ASSERT_FALSE((*store)->storeUnlockKey(key));

    EXPECT_EQ(*(*store)->unlockKey("alice", zeroes), key);
    (*store)->unpair("alice", zeroes);
    EXPECT_EQ(number("SELECT count(*) FROM unlock_key"), 0);
}

TEST_F(FirstVersion, IsLeftAsItIsWhenItCannotBeBroughtUpToDate) {
    change("CREATE TABLE unlock_key (in_the_way INTEGER)");

    EXPECT_FALSE(SqlitePairingStore::open(path()));

    EXPECT_EQ(number("PRAGMA user_version"), 1);
    EXPECT_EQ(number("SELECT count(*) FROM pairing"), 1);
}

TEST_F(FirstVersion, IsNotChangedByWhoOnlyReads) {
    const auto store = SqlitePairingStore::openToRead(path());

    ASSERT_FALSE(store);
    EXPECT_THAT(store.refusal().text, testing::HasSubstr("its version is 1"));
    EXPECT_EQ(number("PRAGMA user_version"), 1);
}

class UnlockKeysOnDisk : public testing::Test {
protected:
    PrivateFolder folder;
    const std::string path = folder.path() / "hints.sqlite3";
};

TEST_F(UnlockKeysOnDisk, AreThereWhenTheDatabaseIsOpenedAgain) {
    {
        const auto store = SqlitePairingStore::open(path);
        ASSERT_TRUE(store);
        (*store)->pair("alice", hashOf(1), 1);
        ASSERT_FALSE((*store)->storeUnlockKey(keyFor("alice", 1)));
    }

    EXPECT_EQ(*(*SqlitePairingStore::open(path))->unlockKey("alice", hashOf(1)),
              keyFor("alice", 1));
}

TEST_F(UnlockKeysOnDisk, HaveNoPartsOfAnotherSize) {
    const auto store = SqlitePairingStore::open(path);
    ASSERT_TRUE(store);
    (*store)->pair("alice", hashOf(1), 1);
    auto shortHash = keyFor("alice", 1);
    shortHash.wrapKeyHash.pop_back();
    auto nothing = keyFor("alice", 1);
    nothing.wrapped.clear();

    EXPECT_EQ((*store)->storeUnlockKey(shortHash)->status, status::kStoreFailed);
    EXPECT_EQ((*store)->storeUnlockKey(nothing)->status, status::kStoreFailed);
}

TEST_F(UnlockKeysOnDisk, AreRefusedWhileSomebodyElseHoldsTheDatabase) {
    const auto store = SqlitePairingStore::open(path);
    ASSERT_TRUE(store);
    (*store)->pair("alice", hashOf(1), 1);
    SQLite::Database other(path, SQLite::OPEN_READWRITE);
    other.exec("BEGIN IMMEDIATE");

    EXPECT_EQ((*store)->storeUnlockKey(keyFor("alice", 1))->status, status::kStoreFailed);

    other.exec("ROLLBACK");
    EXPECT_FALSE((*store)->storeUnlockKey(keyFor("alice", 1)));
}

}  // namespace
}  // namespace vlm::service
