// SqlitePairingStore: the pairings in a database file, and the unlock keys beside them.
//
// Write-ahead log with full synchronisation: a pairing survives a power cut once pair() returned.
// The statements are prepared once.

#pragma once

#include <memory>
#include <string>

#include "services/hints/pairing_store.h"
#include "services/hints/unlock_key_store.h"

namespace vlm::service {

class SqlitePairingStore final : public PairingStore, public UnlockKeyStore {
public:
    static constexpr const char* kUsualPath = "/var/lib/vlm/hints.sqlite3";

    // Opens the database, or makes it, and brings it to the present schema. Refused: a place that
    // others may touch (private_file.h), a file that is no database, is another program's or is
    // damaged, and a schema that is newer than this program. The file is left as it was then.
    static Outcome<std::unique_ptr<SqlitePairingStore>> open(const std::string& path);

    // Opens a database that is there, to read it only: for a program beside the service. It is
    // never made, never migrated, and what would change it is refused. The library that reads it
    // may leave its own empty files beside it, which the service clears away.
    static Outcome<std::unique_ptr<SqlitePairingStore>> openToRead(const std::string& path);

    ~SqlitePairingStore() override;

    std::optional<Refusal> pair(const std::string& account, const platform::Bytes& hash,
                                std::int64_t now) override;
    Outcome<bool> unpair(const std::string& account, const platform::Bytes& hash) override;
    Outcome<std::vector<Pairing>> pairingsOf(const std::string& account) override;
    Outcome<std::vector<Pairing>> pairingsWith(const platform::Bytes& hash) override;
    Outcome<bool> isPaired(const std::string& account) override;

    std::optional<Refusal> storeUnlockKey(const UnlockKey& key) override;
    std::optional<Refusal> storeUnlockKeys(const std::vector<UnlockKey>& keys) override;
    Outcome<std::optional<UnlockKey>> unlockKey(const std::string& account,
                                                const platform::Bytes& hash) override;
    Outcome<std::vector<UnlockKey>> unlockKeysOf(const std::string& account) override;
    Outcome<bool> eraseUnlockKey(const std::string& account, const platform::Bytes& hash) override;

    // Everybody's, account by account, the latest of each first.
    Outcome<std::vector<Pairing>> allPairings();

private:
    struct Database;
    explicit SqlitePairingStore(std::unique_ptr<Database> database);

    std::unique_ptr<Database> _database;
};

}  // namespace vlm::service
