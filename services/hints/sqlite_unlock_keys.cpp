// The unlock keys of SqlitePairingStore.

#include <SQLiteCpp/Transaction.h>

#include "services/hints/pairing_database.h"

namespace vlm::service {

namespace {

UnlockKey readOne(Use& use) {
    return {use->getColumn(0).getString(), bytesOf(use->getColumn(1)), bytesOf(use->getColumn(2)),
            bytesOf(use->getColumn(3)), bytesOf(use->getColumn(4))};
}

void store(SQLite::Statement& statement, const UnlockKey& key) {
    Use use(statement);
    use->bind(1, key.account);
    use.bindBytes(2, key.hash);
    use.bindBytes(3, key.wrapKeyHash);
    use.bindBytes(4, key.wrapPublicInfo);
    use.bindBytes(5, key.wrapped);
    use->exec();
}

}  // namespace

std::optional<Refusal> SqlitePairingStore::storeUnlockKey(const UnlockKey& key) {
    return storeUnlockKeys({key});
}

std::optional<Refusal> SqlitePairingStore::storeUnlockKeys(const std::vector<UnlockKey>& keys) {
    const auto done = guarded([&] {
        SQLite::Transaction transaction(_database->connection,
                                        SQLite::TransactionBehavior::IMMEDIATE);
        for (const auto& key : keys) store(_database->storeUnlockKey, key);
        transaction.commit();
        return true;
    });
    return done ? std::nullopt : std::optional(done.refusal());
}

Outcome<std::optional<UnlockKey>> SqlitePairingStore::unlockKey(const std::string& account,
                                                                const platform::Bytes& hash) {
    return guarded([&]() -> std::optional<UnlockKey> {
        Use use(_database->unlockKey);
        use->bind(1, account);
        use.bindBytes(2, hash);
        if (!use->executeStep()) return std::nullopt;
        return readOne(use);
    });
}

Outcome<std::vector<UnlockKey>> SqlitePairingStore::unlockKeysOf(const std::string& account) {
    return guarded([&] {
        Use use(_database->unlockKeysOf);
        use->bind(1, account);
        std::vector<UnlockKey> keys;
        while (use->executeStep()) keys.push_back(readOne(use));
        return keys;
    });
}

Outcome<bool> SqlitePairingStore::eraseUnlockKey(const std::string& account,
                                                 const platform::Bytes& hash) {
    return guarded([&] {
        Use use(_database->eraseUnlockKey);
        use->bind(1, account);
        use.bindBytes(2, hash);
        return use->exec() > 0;
    });
}

}  // namespace vlm::service
