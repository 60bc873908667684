#include "services/hints/pairing_schema.h"

#include <SQLiteCpp/Transaction.h>

#include <array>

#include "platform/text.h"

namespace vlm::service {

namespace {

// "vlmp": tells our database from any other.
constexpr int kApplication = 0x766C6D70;

// Each step takes a database from the version that is its place in the list to the next one. A
// step that was released is never changed.
constexpr std::array kSteps = {
    // AUTOINCREMENT: a sequence is never used again, so that the latest pairing is the one with
    // the largest, also after the latest was removed.
    R"(CREATE TABLE pairing (
           sequence INTEGER PRIMARY KEY AUTOINCREMENT,
           account TEXT NOT NULL CHECK (account <> ''),
           hash BLOB NOT NULL CHECK (typeof(hash) = 'blob' AND length(hash) = 32),
           paired_at INTEGER NOT NULL,
           UNIQUE (account, hash)
       );
       CREATE INDEX pairing_by_hash ON pairing (hash);)",
    // An unlock key goes with its pairing.
    R"(CREATE TABLE unlock_key (
           account TEXT NOT NULL,
           hash BLOB NOT NULL,
           wrap_hash BLOB NOT NULL CHECK (typeof(wrap_hash) = 'blob' AND length(wrap_hash) = 32),
           wrap_public_info BLOB NOT NULL
               CHECK (typeof(wrap_public_info) = 'blob' AND length(wrap_public_info) > 0),
           wrapped BLOB NOT NULL CHECK (typeof(wrapped) = 'blob' AND length(wrapped) > 0),
           PRIMARY KEY (account, hash),
           FOREIGN KEY (account, hash) REFERENCES pairing (account, hash) ON DELETE CASCADE
       ) WITHOUT ROWID;)",
};

constexpr const char* kOthers =
    "it is the database of another program. Move it away or give another path";

std::string newerThanThis(int version) {
    return platform::text(
        "its version is {}, and this program knows versions up to {}. "
        "Install the newer program again",
        version, kSteps.size());
}

int number(SQLite::Database& database, const char* query) {
    return database.execAndGet(query).getInt();
}

}  // namespace

std::optional<std::string> migratePairings(SQLite::Database& database) {
    SQLite::Transaction transaction(database, SQLite::TransactionBehavior::IMMEDIATE);
    const auto application = number(database, "PRAGMA application_id");
    const auto version = number(database, "PRAGMA user_version");
    const bool isEmpty = number(database, "SELECT count(*) FROM sqlite_master") == 0;
    const bool isNew = isEmpty && application == 0 && version == 0;
    if (!isNew && application != kApplication) return kOthers;
    if (version < 0 || static_cast<std::size_t>(version) > kSteps.size())
        return newerThanThis(version);
    if (static_cast<std::size_t>(version) == kSteps.size()) return std::nullopt;

    for (auto step = static_cast<std::size_t>(version); step < kSteps.size(); ++step)
        database.exec(kSteps[step]);
    database.exec(platform::text("PRAGMA application_id = {}", kApplication));
    database.exec(platform::text("PRAGMA user_version = {}", kSteps.size()));
    transaction.commit();
    return std::nullopt;
}

std::optional<std::string> whyNotReadable(SQLite::Database& database) {
    if (number(database, "PRAGMA application_id") != kApplication) return kOthers;
    const auto version = number(database, "PRAGMA user_version");
    if (version < 0 || static_cast<std::size_t>(version) > kSteps.size())
        return newerThanThis(version);
    if (static_cast<std::size_t>(version) < kSteps.size())
        return platform::text(
            "its version is {}, which the hints service brings to {} when it next starts", version,
            kSteps.size());
    return std::nullopt;
}

}  // namespace vlm::service
