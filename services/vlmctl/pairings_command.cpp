// Who is paired with which keys.

#include <string>
#include <vector>

#include "hints/hints_client.h"
#include "platform/platform.h"
#include "platform/process_info.h"
#include "platform/text.h"
#include "services/hints/sqlite_pairing_store.h"
#include "services/vlmctl/commands.h"
#include "services/vlmctl/exit_status.h"
#include "services/vlmctl/json.h"
#include "services/vlmctl/shown.h"
#include "services/vlmctl/table.h"

namespace vlm::control {

namespace {

using platform::String;
using platform::text;
using service::Outcome;
using service::Pairing;
using service::Refusal;
using service::SqlitePairingStore;
using Pairings = std::vector<Pairing>;

// The service tells hashes only, the latest pairing first; when they were made stays 0.
Outcome<Pairings> askService(const std::string& account) {
    const auto hashes = VLCopyLegacyBindings(String(account), /*flag=*/false);
    if (!hashes)
        return Refusal{0, text("the hints service gave no answer about the pairings of {}; "
                               "\"systemctl status vlmhintsd\" and \"journalctl "
                               "SUBSYSTEM=org.vlm.token\" say why. Those of another account are "
                               "for root only",
                               account)};
    Pairings pairings;
    for (const auto& hash : *hashes)
        if (const auto* bytes = hash.bytes()) pairings.push_back({account, *bytes, 0, 0});
    return pairings;
}

Outcome<Pairings> readDatabase(const std::string& path, const std::optional<std::string>& account) {
    auto store = SqlitePairingStore::openToRead(path);
    if (!store) return store.refusal();
    return account ? (*store)->pairingsOf(*account) : (*store)->allPairings();
}

bool isRoot() { return platform::current().processInfo().effectiveUserId() == 0; }

Outcome<Pairings> pairingsFor(const Arguments& arguments) {
    const auto& account = arguments.user;
    if (arguments.database) return readDatabase(*arguments.database, account);
    if (account) return askService(*account);
    if (isRoot()) return readDatabase(SqlitePairingStore::kUsualPath, std::nullopt);
    return askService(platform::current().processInfo().ownerUserName());
}

std::string timeOf(const Pairing& pairing) {
    return pairing.sequence == 0 ? "" : pointInTime(pairing.pairedAt);
}

void printTable(const Pairings& pairings, const Arguments& arguments, Output& output) {
    Table table({"ACCOUNT", "PUBLIC KEY HASH", "PAIRED AT"});
    for (const auto& pairing : pairings)
        table.add({pairing.account, platform::hexadecimal(pairing.hash), timeOf(pairing)});
    table.print(output, arguments.legend, "No pairings.");
}

Json jsonOf(const Pairings& pairings) {
    Json::Array list;
    for (const auto& pairing : pairings) {
        const auto time = timeOf(pairing);
        list.emplace_back(Json::Object{{"account", pairing.account},
                                       {"hash", platform::hexadecimal(pairing.hash)},
                                       {"pairedAt", time.empty() ? Json() : Json(time)}});
    }
    return Json::Object{{"pairings", std::move(list)}};
}

}  // namespace

int listPairings(const Arguments& arguments, Output& output) {
    const auto pairings = pairingsFor(arguments);
    if (!pairings) {
        output.complain(pairings.refusal().text);
        return kExitFailure;
    }
    if (arguments.json) {
        output.print(jsonOf(*pairings).text());
    } else {
        printTable(*pairings, arguments, output);
    }
    return kExitSuccess;
}

}  // namespace vlm::control
