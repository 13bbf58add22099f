// status: how the syncs of the accounts stand, from the daemon while it runs, else from its stores.
#include <vector>

#include "AccountService.h"
#include "AccountStore.h"
#include "Command.h"
#include "DaemonLink.h"
#include "Failure.h"
#include "Names.h"
#include "Output.h"
#include "PendingCounts.h"
#include "SyncClient.h"
#include "SyncState.h"
#include "TimeText.h"

namespace {

Json timeOrNull(int64_t seconds) {
    return seconds > 0 ? Json(time_text::composeRfc3339(seconds)) : Json();
}

PendingCounts pendingOf(int account, vantor_pim_sync_type_e kind, const SyncState& published,
                        bool isRunning) {
    const auto dirty = published.dirty();
    const auto deleted = published.deleted();
    if (isRunning && dirty && deleted) return {*dirty, *deleted};
    return kind == VANTOR_PIM_SYNC_TYPE_CALENDAR ? pending_counts::calendarOf(account)
                                                 : pending_counts::contactsOf(account);
}

int64_t lastSyncOf(int account, vantor_pim_sync_type_e kind, const StoredAccount& stored, bool isRunning) {
    int seconds = 0;
    if (isRunning && vantor_pim_sync_get_sync_time(account, kind, &seconds) == 0) return seconds;
    return kind == VANTOR_PIM_SYNC_TYPE_CALENDAR ? stored.calendar.syncedSec : stored.contacts.syncedSec;
}

Json statusOf(int account, vantor_pim_sync_type_e kind, const StoredAccount& stored, bool isRunning) {
    const SyncState published(account, kind);
    const int state = isRunning ? sync_client::state(account, kind) : SYNC_AGENT_STATE_NONE;
    const PendingCounts pending = pendingOf(account, kind, published, isRunning);
    return {{"account", account},
            {"kind", sync_client::kindName(kind)},
            {"state", std::string(nameOf(kStates, state))},
            {"lastSync", timeOrNull(lastSyncOf(account, kind, stored, isRunning))},
            {"pending", {{"dirty", pending.dirty}, {"deleted", pending.deleted}}},
            {"failure", published.failure()},
            {"nextSync", isRunning ? timeOrNull(published.nextAlarm()) : Json()}};
}

// Every account that the account service or the daemon has; `only` 0: all.
std::vector<Json> allStatus(int only) {
    const auto stored = account_store::accounts();
    std::map<int, StoredAccount> accounts = stored;
    for (const auto& [id, email] : account_service::accounts()) accounts.try_emplace(id);
    if (only > 0 && !accounts.contains(only)) {
        throw Failure("there is no account " + std::to_string(only) +
                      "; see: vantor-pim-syncctl account list");
    }
    const bool isRunning = daemon_link::servingPid().has_value();
    std::vector<Json> all;
    for (const auto& [id, account] : accounts) {
        if (only > 0 && id != only) continue;
        for (const vantor_pim_sync_type_e kind :
             {VANTOR_PIM_SYNC_TYPE_CALENDAR, VANTOR_PIM_SYNC_TYPE_CONTACTS}) {
            all.push_back(statusOf(id, kind, account, isRunning));
        }
    }
    return all;
}

std::string cell(const Json& value) {
    return value.is_string() ? value.get<std::string>() : "";
}

void table(const std::vector<Json>& all) {
    output::Table table(
        {"ACCOUNT", "KIND", "STATE", "LAST SYNC", "NEXT SYNC", "TO SEND", "TO DELETE", "FAILURE"});
    for (const Json& status : all) {
        table.add({status["account"].dump(), status["kind"], status["state"], cell(status["lastSync"]),
                   cell(status["nextSync"]), status["pending"]["dirty"].dump(),
                   status["pending"]["deleted"].dump(), status["failure"]});
    }
    table.print();
}

struct Options {
    int account = 0;
    bool isJson = false;
};

}  // namespace

Action buildStatus(CLI::App& app) {
    auto options = std::make_shared<Options>();
    command::addId(app, "ACCOUNT", options->account, "Only this account");
    command::addJson(app, options->isJson);
    return [options] {
        const std::vector<Json> all = allStatus(options->account);
        if (!options->isJson) {
            table(all);
            return kExitDone;
        }
        output::JsonArray array;
        for (const Json& status : all) array.add(status);
        array.end();
        return kExitDone;
    };
}
