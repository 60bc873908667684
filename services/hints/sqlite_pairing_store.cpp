#include "services/hints/sqlite_pairing_store.h"

#include <SQLiteCpp/Database.h>
#include <SQLiteCpp/Statement.h>

#include <filesystem>
#include <utility>

#include "platform/text.h"
#include "services/hints/pairing_schema.h"
#include "services/hints/private_file.h"
#include "services/hints/status.h"

namespace vlm::service {

namespace {

// How long a statement waits for another program that holds the database, an administrator's shell
// for instance. Everybody's requests wait with it.
constexpr int kPatienceMilliseconds = 250;

Refusal failed(const char* why) {
    return {status::kStoreFailed,
            platform::text("The pairings could not be read or written: {}. The system log of the "
                           "hints service may say more.",
                           why)};
}

Refusal cannotOpen(const std::string& path, std::string_view why) {
    return {status::kStoreFailed,
            platform::text("The pairings in {} cannot be used: {}.", path, why)};
}

// A prepared statement for one use; it is ready for the next one when this goes.
class Use {
public:
    explicit Use(SQLite::Statement& statement) : _statement(statement) {}
    Use(const Use&) = delete;
    Use& operator=(const Use&) = delete;
    ~Use() { _statement.tryReset(); }

    SQLite::Statement* operator->() { return &_statement; }

    void bindHash(int index, const platform::Bytes& hash) {
        _statement.bind(index, hash.data(), static_cast<int>(hash.size()));
    }

private:
    SQLite::Statement& _statement;
};

platform::Bytes bytesOf(const SQLite::Column& column) {
    const auto* first = static_cast<const std::uint8_t*>(column.getBlob());
    return first ? platform::Bytes(first, first + column.getBytes()) : platform::Bytes();
}

std::vector<Pairing> readAll(Use& use) {
    std::vector<Pairing> pairings;
    while (use->executeStep())
        pairings.push_back({use->getColumn(0).getString(), bytesOf(use->getColumn(1)),
                            use->getColumn(2).getInt64(), use->getColumn(3).getInt64()});
    return pairings;
}

// What throws is caught here, at the border of the library.
template <typename Work>
auto guarded(Work work) -> Outcome<decltype(work())> {
    try {
        return work();
    } catch (const std::exception& error) {
        return failed(error.what());
    }
}

}  // namespace

// The connection and what is prepared on it, in the order of their making.
struct SqlitePairingStore::Database {
    explicit Database(SQLite::Database opened)
        : connection(std::move(opened)),
          pair(connection,
               "INSERT OR REPLACE INTO pairing (account, hash, paired_at) VALUES (?, ?, ?)"),
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
          anyOf(connection, "SELECT 1 FROM pairing WHERE account = ? LIMIT 1") {}

    SQLite::Database connection;
    SQLite::Statement pair;
    SQLite::Statement unpair;
    SQLite::Statement ofAccount;
    SQLite::Statement withHash;
    SQLite::Statement all;
    SQLite::Statement anyOf;
};

SqlitePairingStore::SqlitePairingStore(std::unique_ptr<Database> database)
    : _database(std::move(database)) {}

SqlitePairingStore::~SqlitePairingStore() = default;

Outcome<std::unique_ptr<SqlitePairingStore>> SqlitePairingStore::open(const std::string& path) {
    if (const auto reason = preparePrivateFile(path)) return cannotOpen(path, *reason);
    try {
        SQLite::Database database(path, SQLite::OPEN_READWRITE, kPatienceMilliseconds);
        // First, since the next line changes the file, and it may be somebody else's.
        if (const auto reason = migratePairings(database)) return cannotOpen(path, *reason);
        if (database.execAndGet("PRAGMA journal_mode = WAL").getString() != "wal")
            return cannotOpen(path, "its file system does not allow a write-ahead log");
        database.exec("PRAGMA synchronous = FULL");
        return std::unique_ptr<SqlitePairingStore>(
            new SqlitePairingStore(std::make_unique<Database>(std::move(database))));
    } catch (const std::exception& error) {
        return cannotOpen(path, platform::text("{}. If it is damaged, move it away and restore a "
                                               "copy of it",
                                               error.what()));
    }
}

Outcome<std::unique_ptr<SqlitePairingStore>> SqlitePairingStore::openToRead(
    const std::string& path) {
    // A pipe in the file's place must not make this wait.
    std::error_code error;
    const auto file = std::filesystem::status(path, error);
    if (file.type() == std::filesystem::file_type::not_found)
        return cannotOpen(path, "there is none; the hints service makes it when it first starts");
    if (error) return cannotOpen(path, error.message());
    if (!std::filesystem::is_regular_file(file)) return cannotOpen(path, "it is no regular file");
    try {
        SQLite::Database database(path, SQLite::OPEN_READONLY, kPatienceMilliseconds);
        if (const auto reason = whyNotReadable(database)) return cannotOpen(path, *reason);
        return std::unique_ptr<SqlitePairingStore>(
            new SqlitePairingStore(std::make_unique<Database>(std::move(database))));
    } catch (const std::exception& failure) {
        return cannotOpen(path, failure.what());
    }
}

std::optional<Refusal> SqlitePairingStore::pair(const std::string& account,
                                                const platform::Bytes& hash, std::int64_t now) {
    const auto done = guarded([&] {
        Use use(_database->pair);
        use->bind(1, account);
        use.bindHash(2, hash);
        use->bind(3, now);
        return use->exec();
    });
    return done ? std::nullopt : std::optional(done.refusal());
}

Outcome<bool> SqlitePairingStore::unpair(const std::string& account, const platform::Bytes& hash) {
    return guarded([&] {
        Use use(_database->unpair);
        use->bind(1, account);
        use.bindHash(2, hash);
        return use->exec() > 0;
    });
}

Outcome<std::vector<Pairing>> SqlitePairingStore::pairingsOf(const std::string& account) {
    return guarded([&] {
        Use use(_database->ofAccount);
        use->bind(1, account);
        return readAll(use);
    });
}

Outcome<std::vector<Pairing>> SqlitePairingStore::pairingsWith(const platform::Bytes& hash) {
    return guarded([&] {
        Use use(_database->withHash);
        use.bindHash(1, hash);
        return readAll(use);
    });
}

Outcome<std::vector<Pairing>> SqlitePairingStore::allPairings() {
    return guarded([&] {
        Use use(_database->all);
        return readAll(use);
    });
}

Outcome<bool> SqlitePairingStore::isPaired(const std::string& account) {
    return guarded([&] {
        Use use(_database->anyOf);
        use->bind(1, account);
        return use->executeStep();
    });
}

}  // namespace vlm::service
