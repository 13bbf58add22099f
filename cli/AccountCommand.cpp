// account add, update, remove. The order of the steps is bound by the daemon: it does not stay up while the account
// service knows no account, and it does not start while the token file of an account is missing.
#include <glib.h>

#include <functional>
#include <vector>

#include "AccountOptions.h"
#include "AccountService.h"
#include "AccountStore.h"
#include "Command.h"
#include "DaemonLink.h"
#include "Device.h"
#include "Failure.h"
#include "InputFile.h"
#include "Output.h"
#include "TokenFile.h"

namespace {

constexpr vantor_pim_sync_type_e kBothKinds[] = {VANTOR_PIM_SYNC_TYPE_CALENDAR,
                                                 VANTOR_PIM_SYNC_TYPE_CONTACTS};

// Steps that are taken back in reverse order unless the whole was done.
class Undo {
public:
    Undo() = default;
    Undo(const Undo&) = delete;
    Undo& operator=(const Undo&) = delete;
    ~Undo() {
        for (auto step = mSteps.rbegin(); step != mSteps.rend(); ++step) {
            try {
                (*step)();
            } catch (const std::exception& problem) {
                output::progress(std::string("taking a step back failed: ") + problem.what());
            }
        }
    }
    void add(std::function<void()> step) { mSteps.push_back(std::move(step)); }
    void done() { mSteps.clear(); }

private:
    std::vector<std::function<void()>> mSteps;
};

std::string named(int id) {
    return "the account " + std::to_string(id);
}

[[noreturn]] void failUnknown(int id) {
    throw Failure("there is no account " + std::to_string(id) + "; see: vantor-pim-syncctl account list");
}

// Leaves the token where the daemon reads it and returns it. Without a new one, the one that is there.
std::string placeToken(const AccountOptions& options, Undo& undo) {
    const std::optional<std::string> former = token_file::read(options.id);
    if (options.tokenFile.empty()) {
        if (former && !former->empty()) return *former;
        throw Failure(named(options.id) + " has no refresh token; give it with --refresh-token-file FILE");
    }
    std::string token = input_file::readSecret(options.tokenFile, "the refresh token");
    if (token.find_first_of("\r\n \t") != std::string::npos) {
        throw Failure("the refresh token must be one word on one line");
    }
    undo.add([id = options.id, former] { former ? token_file::write(id, *former) : token_file::remove(id); });
    token_file::write(options.id, token);
    return token;
}

void startDaemon(Undo& undo) {
    if (!device::isPrivate()) return daemon_link::awaitService();
    if (daemon_link::ensureRunning()) undo.add([] { daemon_link::stop(); });
}

// --- add ------------------------------------------------------------------------------------------------------------

void addAccount(const AccountOptions& options) {
    device::prepare();
    if (account_store::accounts().contains(options.id)) {
        throw Failure(named(options.id) +
                      " exists already; change it with: vantor-pim-syncctl account update " +
                      std::to_string(options.id));
    }
    const AccountRecord record = sync_client::emptyRecord();
    record->account_id = options.id;
    record->calsync = true;
    record->ctsync = true;
    options.apply(*record);

    Undo undo;
    sync_client::setText(record->refresh_token, placeToken(options, undo));
    if (!account_service::accounts().contains(options.id)) {
        account_service::insert(options.id, options.email);
        undo.add([&options] { account_service::remove(options.id); });
    }
    startDaemon(undo);
    // Also for a call whose answer was lost: the daemon must not keep what the tool reports as failed.
    undo.add([&options] {
        if (sync_client::account(options.id)) vantor_pim_sync_remove_account(options.id);
    });
    sync_client::checkCall(vantor_pim_sync_add_account(record.get()), "adding " + named(options.id));
    undo.done();
}

// --- update ---------------------------------------------------------------------------------------------------------

void updateAccount(const AccountOptions& options) {
    if (options.saysNothing()) throw Misuse("account update needs at least one option (see --help)");
    if (!account_store::accounts().contains(options.id)) failUnknown(options.id);
    Undo undo;
    // First the token: without one the daemon would not even start.
    const std::string token = placeToken(options, undo);
    daemon_link::ensureRunning();
    const AccountRecord record = sync_client::account(options.id);
    if (record == nullptr)
        throw Failure("the daemon does not give " + named(options.id) + "; its log tells why");
    options.apply(*record);
    sync_client::setText(record->refresh_token, token);
    sync_client::checkCall(vantor_pim_sync_update_account(record.get()), "changing " + named(options.id));
    undo.done();
}

// --- remove ---------------------------------------------------------------------------------------------------------

bool isIdle(int id) {
    for (const vantor_pim_sync_type_e kind : kBothKinds) {
        if (sync_client::state(id, kind) == SYNC_AGENT_STATE_IN_PROGRESS) return false;
    }
    return true;
}

void stopBoth(int id) {
    constexpr int64_t kLimitUs = 30 * G_TIME_SPAN_SECOND;
    constexpr unsigned long kPauseUs = 50000;
    for (const vantor_pim_sync_type_e kind : kBothKinds) static_cast<void>(vantor_pim_sync_stop(id, kind));
    const int64_t deadline = g_get_monotonic_time() + kLimitUs;
    while (!isIdle(id)) {
        if (g_get_monotonic_time() > deadline) {
            throw Failure("a sync of " + named(id) + " does not stop; try again");
        }
        g_usleep(kPauseUs);
    }
}

// What the daemon needs to start and to know the account, where an earlier removal was cut short.
void makeWhole(int id, const std::string& email, Undo& undo) {
    if (!account_service::accounts().contains(id)) {
        account_service::insert(id, email);
        undo.add([id] { account_service::remove(id); });
    }
    const std::optional<std::string> token = token_file::read(id);
    if (token && !token->empty()) return;
    token_file::write(id, "removed");
    undo.add([id] { token_file::remove(id); });
}

void removeFromDaemon(int id, const std::string& email) {
    Undo undo;
    bool wasStarted = false;
    if (!daemon_link::servingPid()) {
        makeWhole(id, email, undo);
        wasStarted = daemon_link::ensureRunning();
        if (wasStarted) undo.add([] { daemon_link::stop(); });
    }
    stopBoth(id);
    const int code = vantor_pim_sync_remove_account(id);
    if (account_store::accounts().contains(id)) sync_client::checkCall(code, "removing " + named(id));
    undo.done();
    if (wasStarted) daemon_link::stop();
}

void removeAccount(int id) {
    const auto stored = account_store::accounts();
    const bool isStored = stored.contains(id);
    if (!isStored && !account_service::accounts().contains(id) && !token_file::read(id)) failUnknown(id);
    if (isStored) removeFromDaemon(id, stored.at(id).email);
    account_service::remove(id);
    token_file::remove(id);
}

}  // namespace

Action buildAccountAdd(CLI::App& app) {
    auto options = std::make_shared<AccountOptions>();
    command::addId(app, "--id", options->id, "The account's number on this device")->required();
    options->declare(app);
    return [options] {
        options->checkTexts();
        if (options->email.empty()) throw Misuse("--email is required (see --help)");
        if (options->server.empty() && options->calendarServer.empty()) {
            throw Misuse("--server is required (see --help)");
        }
        addAccount(*options);
        output::line(named(options->id) + " is added");
        return kExitDone;
    };
}

Action buildAccountUpdate(CLI::App& app) {
    auto options = std::make_shared<AccountOptions>();
    command::addId(app, "ID", options->id, "The account")->required();
    options->declare(app);
    return [options] {
        options->checkTexts();
        updateAccount(*options);
        return kExitDone;
    };
}

Action buildAccountRemove(CLI::App& app) {
    auto id = std::make_shared<int>(0);
    command::addId(app, "ID", *id, "The account")->required();
    return [id] {
        removeAccount(*id);
        return kExitDone;
    };
}
