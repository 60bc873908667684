// The open database of SqlitePairingStore, for the files that make up that class.
//
// Threads: one. Errors: what throws is caught by guarded(), at the border of the library.

#pragma once

#include <SQLiteCpp/Database.h>
#include <SQLiteCpp/Statement.h>
#include <sqlite3.h>

#include <utility>

#include "platform/text.h"
#include "services/hints/sqlite_pairing_store.h"
#include "services/hints/status.h"

namespace vlm::service {

inline Refusal failed(const char* why) {
    return {status::kStoreFailed,
            platform::text("The pairings could not be read or written: {}. The system log of the "
                           "hints service may say more.",
                           why)};
}

// What is stored beside a pairing cannot be without it.
inline Refusal notPaired() {
    return {status::kNotPaired, "The account is not paired with this key any more."};
}

// What throws is caught here, at the border of the library.
template <typename Work>
auto guarded(Work work) -> Outcome<decltype(work())> {
    try {
        return work();
    } catch (const SQLite::Exception& error) {
        if (error.getExtendedErrorCode() == SQLITE_CONSTRAINT_FOREIGNKEY) return notPaired();
        return failed(error.what());
    } catch (const std::exception& error) {
        return failed(error.what());
    }
}

// A prepared statement for one use; it is ready for the next one when this goes.
class Use {
public:
    explicit Use(SQLite::Statement& statement) : _statement(statement) {}
    Use(const Use&) = delete;
    Use& operator=(const Use&) = delete;
    ~Use() { _statement.tryReset(); }

    SQLite::Statement* operator->() { return &_statement; }

    void bindBytes(int index, const platform::Bytes& bytes) {
        _statement.bind(index, bytes.data(), static_cast<int>(bytes.size()));
    }

private:
    SQLite::Statement& _statement;
};

inline platform::Bytes bytesOf(const SQLite::Column& column) {
    const auto* first = static_cast<const std::uint8_t*>(column.getBlob());
    return first ? platform::Bytes(first, first + column.getBytes()) : platform::Bytes();
}

// The connection and what is prepared on it, in the order of their making.
struct SqlitePairingStore::Database {
    explicit Database(SQLite::Database opened)
        : connection(std::move(opened)),
          // A pair that is there keeps its row, and so what belongs to it.
          pair(connection,
               "INSERT INTO pairing (account, hash, paired_at) VALUES (?, ?, ?) "
               "ON CONFLICT (account, hash) DO UPDATE "
               "SET sequence = excluded.sequence, paired_at = excluded.paired_at"),
          unpair(connection, "DELETE FROM pairing WHERE account = ? AND hash = ?"),
          ofAccount(connection,
                    "SELECT account, hash, sequence, paired_at FROM pairing "
                    "WHERE account = ? ORDER BY sequence DESC"),
          withHash(connection,
                   "SELECT account, hash, sequence, paired_at FROM pairing "
                   "WHERE hash = ? ORDER BY sequence DESC"),
          all(connection,
              "SELECT account, hash, sequence, paired_at FROM pairing "
              "ORDER BY account, sequence DESC"),
          anyOf(connection, "SELECT 1 FROM pairing WHERE account = ? LIMIT 1"),
          storeUnlockKey(connection,
                         "INSERT OR REPLACE INTO unlock_key "
                         "(account, hash, wrap_hash, wrap_public_info, wrapped) "
                         "VALUES (?, ?, ?, ?, ?)"),
          unlockKey(connection,
                    "SELECT account, hash, wrap_hash, wrap_public_info, wrapped FROM unlock_key "
                    "WHERE account = ? AND hash = ?"),
          unlockKeysOf(connection,
                       "SELECT account, hash, wrap_hash, wrap_public_info, wrapped "
                       "FROM unlock_key WHERE account = ? ORDER BY hash"),
          eraseUnlockKey(connection, "DELETE FROM unlock_key WHERE account = ? AND hash = ?") {}

    SQLite::Database connection;
    SQLite::Statement pair;
    SQLite::Statement unpair;
    SQLite::Statement ofAccount;
    SQLite::Statement withHash;
    SQLite::Statement all;
    SQLite::Statement anyOf;
    SQLite::Statement storeUnlockKey;
    SQLite::Statement unlockKey;
    SQLite::Statement unlockKeysOf;
    SQLite::Statement eraseUnlockKey;
};

}  // namespace vlm::service
