// sync, stop: asking the daemon for a sync, and waiting for its end.
#include <algorithm>
#include <vector>

#include "AccountStore.h"
#include "Command.h"
#include "DaemonLink.h"
#include "Failure.h"
#include "Names.h"
#include "Output.h"
#include "SyncClient.h"
#include "SyncState.h"
#include "SyncWait.h"

namespace {

constexpr const char* kAll = "all";
constexpr int kMostStartTries = 5;

struct SyncOptions {
    int account = 0;
    std::string kind = kAll;
    bool waits = false;
};

void declare(CLI::App& app, SyncOptions& options) {
    command::addId(app, "ACCOUNT", options.account, "The account")->required();
    app.add_option("KIND", options.kind, "calendar, contacts or all (which is meant when nothing is said)")
        ->check(CLI::IsMember({"calendar", "contacts", kAll}));
}

// "all" is what is switched on.
std::vector<vantor_pim_sync_type_e> kindsOf(const SyncOptions& options) {
    if (const auto one = valueOf(kKinds, options.kind)) return {static_cast<vantor_pim_sync_type_e>(*one)};
    const AccountRecord record = sync_client::account(options.account);
    if (record == nullptr) {
        throw Failure("the daemon does not have the account " + std::to_string(options.account) +
                      "; see: vantor-pim-syncctl account list");
    }
    std::vector<vantor_pim_sync_type_e> kinds;
    if (record->calsync) kinds.push_back(VANTOR_PIM_SYNC_TYPE_CALENDAR);
    if (record->ctsync) kinds.push_back(VANTOR_PIM_SYNC_TYPE_CONTACTS);
    if (kinds.empty()) {
        throw Failure("every sync of the account " + std::to_string(options.account) +
                      " is off; turn one on with: vantor-pim-syncctl account update " +
                      std::to_string(options.account) + " --calendar");
    }
    return kinds;
}

bool isSwitchedOn(int account, vantor_pim_sync_type_e kind) {
    const AccountRecord record = sync_client::account(account);
    if (!record) return false;
    return kind == VANTOR_PIM_SYNC_TYPE_CALENDAR ? record->calsync : record->ctsync;
}

// The run to wait for. A sync that is going on or queued already is as good as a new one.
int start(int account, vantor_pim_sync_type_e kind) {
    const SyncState state(account, kind);
    const int before = state.run();
    int code = 0;
    for (int tries = 0; tries < kMostStartTries; ++tries) {
        code = vantor_pim_sync_start(account, kind);
        if (code == 0) break;
        const int now = sync_client::state(account, kind);
        if (now == SYNC_AGENT_STATE_IN_PROGRESS) break;
        // Ready again: the sync that was in the way ended just now, so the next start is taken. Ready is also what a
        // kind says that was switched off.
        const bool isOn = now == SYNC_AGENT_STATE_READY && isSwitchedOn(account, kind);
        if (!isOn || tries + 1 == kMostStartTries) throw Failure(sync_client::refusal(code, account, kind));
    }
    output::progress(sync_client::kindName(kind) + (code == 0 ? ": sync started" : ": a sync is going on"));
    const int run = state.run();
    if (run != before || state.ended() < run ||
        sync_client::state(account, kind) != SYNC_AGENT_STATE_IN_PROGRESS)
        return run;
    // The daemon could not write its number: to wait for the last one that it wrote would be over at once.
    return std::max(run, state.ended()) + 1;
}

// What went wrong, "" for nothing.
std::string waitFor(SyncWait& wait, int account, vantor_pim_sync_type_e kind, int run) {
    const SyncState state(account, kind);
    wait.untilEnded(state, run);
    if (state.downResult() == 0 && state.upResult() == 0) {
        output::progress(sync_client::kindName(kind) + ": in step");
        return {};
    }
    if (sync_client::state(account, kind) == SYNC_AGENT_STATE_UNAVAILABLE) {
        return sync_client::refusal(state.downResult(), account, kind);
    }
    const std::string text = state.failure();
    return text.empty() ? "the sync failed (download " + std::to_string(state.downResult()) + ", upload " +
                              std::to_string(state.upResult()) + "); the daemon's log tells why"
                        : text;
}

void sync(const SyncOptions& options) {
    daemon_link::requireRunning();
    SyncWait wait;
    std::string problems;
    // A kind that cannot be synced does not keep the other from it.
    const auto attempt = [&problems](vantor_pim_sync_type_e kind, auto&& step) {
        std::string problem;
        try {
            problem = step();
        } catch (const Failure& failure) {
            problem = failure.what();
        }
        if (!problem.empty()) {
            problems += (problems.empty() ? "" : "; ") + sync_client::kindName(kind) + ": " + problem;
        }
    };
    std::vector<std::pair<vantor_pim_sync_type_e, int>> runs;
    for (const vantor_pim_sync_type_e kind : kindsOf(options)) {
        attempt(kind, [&] {
            runs.emplace_back(kind, start(options.account, kind));
            return std::string();
        });
    }
    if (options.waits) {
        for (const auto& [kind, run] : runs) {
            attempt(kind, [&, kind = kind, run = run] { return waitFor(wait, options.account, kind, run); });
        }
    }
    if (!problems.empty()) throw Failure(problems);
}

// Like a service manager: what does not run is stopped already.
void stop(const SyncOptions& options) {
    daemon_link::requireRunning();
    for (const vantor_pim_sync_type_e kind : kindsOf(options)) {
        const int code = vantor_pim_sync_stop(options.account, kind);
        const bool isIdle = sync_client::state(options.account, kind) != SYNC_AGENT_STATE_IN_PROGRESS;
        const bool isOn = isSwitchedOn(options.account, kind);
        if (code == 0) {
            output::line(sync_client::kindName(kind) + ": sync stopped");
        } else if (isOn && isIdle) {
            output::line(sync_client::kindName(kind) + ": no sync is going on");
        } else {
            throw Failure(sync_client::kindName(kind) + ": " +
                          sync_client::refusal(code, options.account, kind));
        }
    }
}

}  // namespace

Action buildSync(CLI::App& app) {
    auto options = std::make_shared<SyncOptions>();
    declare(app, *options);
    app.add_flag("--wait", options->waits,
                 "Return when the sync has ended; exit status 0 only if it ended well");
    return [options] {
        sync(*options);
        return kExitDone;
    };
}

Action buildStop(CLI::App& app) {
    auto options = std::make_shared<SyncOptions>();
    declare(app, *options);
    return [options] {
        stop(*options);
        return kExitDone;
    };
}
