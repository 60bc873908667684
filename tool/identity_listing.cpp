#include "tool/identity_listing.h"

#include <algorithm>
#include <optional>
#include <utility>
#include <vector>

#include "bind/bind_operation.h"
#include "bind/token_info.h"
#include "platform/harmless_text.h"
#include "platform/text.h"
#include "tool/exit_status.h"
#include "util/bind_utils.h"

namespace vlm {

using platform::Bytes;
using platform::text;

namespace {

using Rows = std::map<std::string, std::string>;
using AccountByHash = std::map<Bytes, std::string>;

struct Groups {
    Rows used, notUsed, unpaired;
};

template <typename Map>
std::optional<std::string> lookUp(const Map& map, const typename Map::key_type& key) {
    const auto found = map.find(key);
    if (found == map.end()) return std::nullopt;
    return found->second;
}

AccountByHash accountsByHash(const TokenInfo& info) {
    AccountByHash accounts;
    for (const auto& [account, hash] : info.authentication) accounts[hash] = account;
    return accounts;
}

// The listing may be read by programs, which want names whole.
std::string shownWhole(std::string_view name) {
    return platform::harmlessText(name, platform::kAllCharacters);
}

// A key is listed once, in the first group that it belongs to.
Groups groupsOf(const std::vector<Bytes>& hashes, const TokenInfo& info,
                const AccountByHash& accounts) {
    Groups groups;
    for (const auto& hash : hashes) {
        const std::string hex = *BindUtils::dataToHex(hash);
        const auto name = lookUp(info.names, hash);
        if (const auto account = lookUp(accounts, hash))
            groups.used[hex] = shownWhole(text("{} - {}", *account, name));
        else if (const auto shown = lookUp(info.bound, hash))
            groups.notUsed[hex] = shownWhole(text("{} - {}", *shown, name));
        else if (const auto offered = lookUp(info.offered, hash))
            groups.unpaired[hex] = shownWhole(*offered);
    }
    return groups;
}

void printGroups(const Groups& groups, Console& console) {
    bool printed = dumpList(groups.used,
                            "Paired identities which are used for authentication:", false, console);
    printed =
        dumpList(groups.notUsed,
                 "Paired identities which are not used for authentication:", printed, console);
    dumpList(groups.unpaired, "Unpaired identities:", printed, console);
}

}  // namespace

bool dumpList(const Rows& rows, std::string_view title, bool printedBefore, Console& console) {
    if (rows.empty()) return printedBefore;
    // A stable sort, so that rows with equal values keep the order of their hashes.
    std::vector<std::pair<std::string, std::string>> sorted(rows.begin(), rows.end());
    std::ranges::stable_sort(sorted, {}, &std::pair<std::string, std::string>::second);

    if (printedBefore) console.print("");
    console.print(std::string(title));
    for (const auto& [key, value] : sorted) console.print(text("{}\t{}", key, value));
    return true;
}

int listIdentities(Console& console) {
    const auto record = BindOperation::init()->tokenData(std::nullopt);
    if (!record) {
        BindUtils::log().notice("no token data found");
        return kExitFailure;
    }

    const TokenInfo info(*record);
    const auto accounts = accountsByHash(info);
    bool first = true;
    for (const auto& token : info.tokens) {
        const std::string name = shownWhole(text("{}", lookUp(info.cardNames, token)));
        console.print(text("{}SmartCard: {}", std::exchange(first, false) ? "" : "\n", name));
        const auto hashes = info.hashesByToken.find(token);
        if (hashes != info.hashesByToken.end())
            printGroups(groupsOf(hashes->second, info, accounts), console);
    }
    return kExitSuccess;
}

}  // namespace vlm
