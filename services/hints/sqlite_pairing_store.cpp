#include "services/hints/sqlite_pairing_store.h"

#include <filesystem>
#include <utility>

#include "platform/text.h"
#include "services/hints/pairing_database.h"
#include "services/hints/pairing_schema.h"
#include "services/hints/private_file.h"
#include "services/hints/status.h"

namespace vlm::service {

namespace {

// How long a statement waits for another program that holds the database, an administrator's shell
// for instance. Everybody's requests wait with it.
constexpr int kPatienceMilliseconds = 250;

Refusal cannotOpen(const std::string& path, std::string_view why) {
    return {status::kStoreFailed,
            platform::text("The pairings in {} cannot be used: {}.", path, why)};
}

std::vector<Pairing> readAll(Use& use) {
    std::vector<Pairing> pairings;
    while (use->executeStep())
        pairings.push_back({use->getColumn(0).getString(), bytesOf(use->getColumn(1)),
                            use->getColumn(2).getInt64(), use->getColumn(3).getInt64()});
    return pairings;
}

}  // namespace

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
        database.exec("PRAGMA foreign_keys = ON");
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
        use.bindBytes(2, hash);
        use->bind(3, now);
        return use->exec();
    });
    return done ? std::nullopt : std::optional(done.refusal());
}

Outcome<bool> SqlitePairingStore::unpair(const std::string& account, const platform::Bytes& hash) {
    return guarded([&] {
        Use use(_database->unpair);
        use->bind(1, account);
        use.bindBytes(2, hash);
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
        use.bindBytes(1, hash);
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
