// account list, account show: what the account service and the daemon know of each account.
#include "AccountService.h"
#include "AccountStore.h"
#include "Command.h"
#include "Failure.h"
#include "Output.h"

namespace {

Json kindJson(const StoredKind& kind) {
    return {{"enabled", kind.isEnabled},
            {"server", kind.server},
            {"port", kind.port > 0 ? Json(kind.port) : Json()},
            {"period", kind.periodMinutes}};
}

// "registered": the account service has it; "configured": the daemon has it. Both are true for an account that works.
std::map<int, Json> accountsJson() {
    const auto registered = account_service::accounts();
    const auto stored = account_store::accounts();
    std::map<int, Json> all;
    const auto add = [&](int id, const std::string& email) {
        const auto found = stored.find(id);
        const StoredAccount account = found == stored.end() ? StoredAccount() : found->second;
        all[id] = {{"id", id},
                   {"email", email},
                   {"registered", registered.contains(id)},
                   {"configured", found != stored.end()},
                   {"calendar", kindJson(account.calendar)},
                   {"contacts", kindJson(account.contacts)},
                   {"ssl", account.ssl},
                   {"roaming", account.roaming}};
    };
    for (const auto& [id, email] : registered) add(id, email);
    for (const auto& [id, account] : stored) add(id, account.email);
    return all;
}

void listTable(const std::map<int, Json>& accounts) {
    output::Table table({"ID", "EMAIL", "CALENDAR", "CONTACTS", "SERVER"});
    const auto yes = [](const Json& kind) { return kind["enabled"] ? "on" : "off"; };
    for (const auto& [id, account] : accounts) {
        const std::string server = account["calendar"]["server"];
        table.add({std::to_string(id), account["email"], yes(account["calendar"]), yes(account["contacts"]),
                   server.empty() ? account["contacts"]["server"].get<std::string>() : server});
    }
    table.print();
}

struct Options {
    int id = 0;
    bool isJson = false;
};

}  // namespace

Action buildAccountList(CLI::App& app) {
    auto options = std::make_shared<Options>();
    command::addJson(app, options->isJson);
    return [options] {
        const std::map<int, Json> accounts = accountsJson();
        if (!options->isJson) {
            listTable(accounts);
            return kExitDone;
        }
        output::JsonArray array;
        for (const auto& [id, account] : accounts) array.add(account);
        array.end();
        return kExitDone;
    };
}

Action buildAccountShow(CLI::App& app) {
    auto options = std::make_shared<Options>();
    command::addId(app, "ID", options->id, "The account")->required();
    command::addJson(app, options->isJson);
    return [options] {
        const std::map<int, Json> accounts = accountsJson();
        const auto found = accounts.find(options->id);
        if (found == accounts.end()) {
            throw Failure("there is no account " + std::to_string(options->id) +
                          "; see: vantor-pim-syncctl account list");
        }
        options->isJson ? output::json(found->second) : output::fields(found->second);
        return kExitDone;
    };
}
