#include "SyncStatus.h"

#include <cstdlib>

#include "AccountService.h"
#include "AccountStore.h"
#include "DaemonLink.h"
#include "Device.h"
#include "Failure.h"
#include "Names.h"
#include "SyncClient.h"
#include "SyncState.h"
#include "TimeText.h"

namespace sync_status {

namespace {

constexpr int64_t kMinute = 60;
constexpr int64_t kHour = 60 * kMinute;
constexpr int64_t kDay = 24 * kHour;
constexpr size_t kIndent = 4;

enum Column { kAccount, kKind, kStateColumn, kLast, kNext, kToSend, kToDelete };

Json timeOrNull(int64_t seconds) {
    return seconds > 0 ? Json(time_text::composeRfc3339(seconds)) : Json();
}

const StoredKind& storedKind(const StoredAccount& account, vantor_pim_sync_type_e kind) {
    return kind == VANTOR_PIM_SYNC_TYPE_CALENDAR ? account.calendar : account.contacts;
}

PendingCounts pendingOf(const SyncStatus& status, const SyncState& published) {
    const auto dirty = published.dirty();
    const auto deleted = published.deleted();
    if (status.isServed && dirty && deleted) return {*dirty, *deleted};
    return status.kind == VANTOR_PIM_SYNC_TYPE_CALENDAR ? pending_counts::calendarOf(status.account)
                                                        : pending_counts::contactsOf(status.account);
}

SyncStatus statusOf(int account, vantor_pim_sync_type_e kind, const StoredKind& stored, bool isServed) {
    const SyncState published(account, kind);
    SyncStatus status;
    status.account = account;
    status.kind = kind;
    status.isServed = isServed;
    status.isEnabled = stored.isEnabled;
    status.lastSyncSec = stored.syncedSec;
    status.failure = published.failure();
    status.pending = pendingOf(status, published);
    if (!isServed) return status;
    status.state = sync_client::state(account, kind);
    status.nextSyncSec = published.nextAlarm();
    status.progress = published.progress();
    int seconds = 0;
    if (vantor_pim_sync_get_sync_time(account, kind, &seconds) == 0) status.lastSyncSec = seconds;
    return status;
}

// "3 min": the largest unit, which is as exact as a person needs it.
std::string span(int64_t seconds) {
    if (seconds < kHour) return std::to_string(seconds / kMinute) + " min";
    if (seconds < 2 * kDay) return std::to_string(seconds / kHour) + " h";
    return std::to_string(seconds / kDay) + " days";
}

std::string ago(int64_t then, int64_t now) {
    if (then <= 0) return "never";
    if (then > now + kMinute) return "in the future";
    return now - then < kMinute ? "just now" : span(now - then) + " ago";
}

std::string ahead(int64_t then, int64_t now) {
    if (then <= 0) return "";
    return then - now < kMinute ? "at once" : "in " + span(then - now);
}

std::string stateText(const SyncStatus& status) {
    if (!status.isEnabled) return "off";
    if (!status.isServed) return "no daemon";
    return std::string(nameOf(kStates, status.state));
}

terminal::Colour colourOf(const SyncStatus& status) {
    using terminal::Colour;
    if (!status.isEnabled) return Colour::kDim;
    if (!status.isServed || status.state == SYNC_AGENT_STATE_UNAVAILABLE) return Colour::kBad;
    if (status.state == SYNC_AGENT_STATE_IN_PROGRESS) return Colour::kBusy;
    return status.failure.empty() ? Colour::kGood : Colour::kBad;
}

std::string countText(int count) {
    return count == 0 ? "" : std::to_string(count);
}

}  // namespace

std::vector<SyncStatus> all(int only) {
    std::map<int, StoredAccount> accounts = account_store::accounts();
    for (const auto& [id, email] : account_service::accounts()) accounts.try_emplace(id);
    if (only > 0 && !accounts.contains(only)) {
        throw Failure("there is no account " + std::to_string(only) +
                      "; see: vantor-pim-syncctl account list");
    }
    const bool isServed = daemon_link::servingPid().has_value();
    std::vector<SyncStatus> found;
    for (const auto& [id, account] : accounts) {
        if (only > 0 && id != only) continue;
        for (const vantor_pim_sync_type_e kind :
             {VANTOR_PIM_SYNC_TYPE_CALENDAR, VANTOR_PIM_SYNC_TYPE_CONTACTS}) {
            found.push_back(statusOf(id, kind, storedKind(account, kind), isServed));
        }
    }
    return found;
}

Json toJson(const SyncStatus& status) {
    return {{"account", status.account},
            {"kind", sync_client::kindName(status.kind)},
            {"state", std::string(nameOf(kStates, status.state))},
            {"lastSync", timeOrNull(status.lastSyncSec)},
            {"pending", {{"dirty", status.pending.dirty}, {"deleted", status.pending.deleted}}},
            {"failure", status.failure},
            {"nextSync", timeOrNull(status.nextSyncSec)}};
}

std::string adviceFor(const SyncStatus& status) {
    const std::string number = std::to_string(status.account);
    if (!status.isEnabled) return {};
    if (!status.isServed) return daemon_link::startAdvice();
    if (status.state == SYNC_AGENT_STATE_UNAVAILABLE) {
        return "renew the token with: vantor-pim-syncctl account update " + number +
               " --refresh-token-file FILE";
    }
    if (status.state == SYNC_AGENT_STATE_NONE) {
        return "the daemon does not sync it; its log tells why: vantor-pim-syncctl log " + number;
    }
    if (status.failure.empty()) return {};
    return "find the cause with: vantor-pim-syncctl doctor; the daemon's lines: vantor-pim-syncctl log " +
           number;
}

std::string toText(const std::vector<SyncStatus>& all, size_t columns, int64_t nowSec) {
    output::Table table({"ACCOUNT", "KIND", "STATE", "LAST SYNC", "NEXT SYNC", "TO SEND", "TO DELETE"});
    std::string notes;
    for (const SyncStatus& status : all) {
        const std::string kind = sync_client::kindName(status.kind);
        table.add({std::to_string(status.account), kind, stateText(status), ago(status.lastSyncSec, nowSec),
                   ahead(status.nextSyncSec, nowSec), countText(status.pending.dirty),
                   countText(status.pending.deleted)});
        table.colour(kStateColumn, colourOf(status));
        const std::string title = "Account " + std::to_string(status.account) + ", " + kind + ": ";
        if (!status.progress.empty())
            notes += output::wrapped(title + output::printable(status.progress), columns, 0) + "\n";
        const std::string advice = adviceFor(status);
        if (advice.empty()) continue;
        const std::string problem =
            status.isServed && !status.failure.empty() ? status.failure : stateText(status);
        notes += terminal::coloured(output::wrapped(title + output::printable(problem), columns, 0),
                                    terminal::Colour::kBad) +
                 "\n" + output::wrapped(advice, columns, kIndent) + "\n";
    }
    return table.text(columns) + (notes.empty() ? "" : "\n") + notes;
}

}  // namespace sync_status
