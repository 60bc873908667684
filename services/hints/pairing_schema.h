#pragma once

#include <SQLiteCpp/Database.h>

#include <optional>
#include <string>

namespace vlm::service {

// Brings the database to the present schema in one transaction. The answer is why that cannot be
// done: it is another program's, or newer than this program. May throw SQLite::Exception; nothing
// is changed then.
std::optional<std::string> migratePairings(SQLite::Database& database);

// Why the pairings in the database cannot be read as they are; nothing is changed. May throw
// SQLite::Exception.
std::optional<std::string> whyNotReadable(SQLite::Database& database);

}  // namespace vlm::service
