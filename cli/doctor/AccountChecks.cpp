#include <cmath>
#include <ctime>
#include <set>

#include "AccountService.h"
#include "DaemonLink.h"
#include "Failure.h"
#include "ServerUrl.h"
#include "SyncClient.h"
#include "SyncStatus.h"
#include "TokenFile.h"
#include "common/PeerVerification.h"
#include "doctor/Checks.h"
#include "doctor/ServerProbe.h"
#include "platform/error.h"
#include "platform/settings.h"

namespace doctor {

namespace {

constexpr int64_t kMostClockDifferenceSec = 5 * 60;
constexpr int64_t kDaySec = 24 * 60 * 60;
constexpr int64_t kSoonDays = 14;

std::string accountName(int id) {
    return "account " + std::to_string(id);
}

// The address that the daemon uses, as it makes it.
std::string urlOf(const std::string& server, int port, bool ssl) {
    const auto parsed = ServerUrl::parse(server);
    if (!parsed) return {};
    std::string url = server;
    if (parsed->scheme == ServerUrl::Scheme::kNone) url = (ssl ? "https://" : "http://") + url;
    if (port <= 0 || parsed->port > 0) return url;
    const size_t path = url.find('/', url.find("://") + 3);
    return url.insert(std::min(path, url.size()), ":" + std::to_string(port));
}

void addSetting(std::set<std::string>* urls, const char* key) {
    std::string value;
    if (vconf_get_str(key, &value) == PLATFORM_ERROR_NONE && !value.empty())
        urls->insert(urlOf(value, 0, true));
}

std::set<std::string> serversOf(const std::map<int, StoredAccount>& accounts, Findings& findings) {
    std::set<std::string> urls;
    for (const auto& [id, account] : accounts) {
        for (const StoredKind* kind : {&account.calendar, &account.contacts}) {
            if (!kind->isEnabled) continue;
            const std::string url = urlOf(kind->server, kind->port, account.ssl);
            if (!url.empty()) {
                urls.insert(url);
                continue;
            }
            findings.problem(
                accountName(id) + " names no server that can be used: \"" + kind->server + "\"",
                "set one with: vantor-pim-syncctl account update " + std::to_string(id) + " --server URL");
        }
    }
    addSetting(&urls, "db/vantor-pim-sync/token_server");
    addSetting(&urls, "db/vantor-pim-sync/people_server");
    urls.erase("");
    return urls;
}

void checkCertificate(const std::string& url, const ServerAnswer& answer, Findings& findings) {
    if (!answer.certificateProblem.empty()) {
        const std::string text =
            "the certificate of " + url + " is not to be trusted: " + answer.certificateProblem;
        const std::string advice =
            "ask whoever runs the server for a valid one, or install its authority's certificate";
        isPeerVerified() ? findings.problem(text, advice) : findings.notice(text, advice);
    }
    const int64_t days = (answer.certificateEndSec - time(nullptr)) / kDaySec;
    if (answer.certificateEndSec == 0 || days > kSoonDays) return;
    findings.notice("the certificate of " + url +
                        (days < 0 ? " has ended" : " ends in " + std::to_string(days) + " days"),
                    "tell whoever runs the server");
}

void checkClock(const std::string& url, const ServerAnswer& answer, Findings& findings) {
    if (answer.dateSec == 0) return;
    const int64_t difference = time(nullptr) - answer.dateSec;
    if (std::abs(difference) <= kMostClockDifferenceSec) return;
    findings.problem("the clock of this machine and that of " + url + " are " +
                         std::to_string(std::abs(difference) / 60) + " minutes apart",
                     "let the network set it: timedatectl set-ntp true");
}

void checkToken(int id, Findings& findings) {
    const std::string renew = "give one with: vantor-pim-syncctl account update " + std::to_string(id) +
                              " --refresh-token-file FILE";
    std::optional<std::string> token;
    try {
        token = token_file::read(id);
    } catch (const Failure& failure) {
        findings.problem(failure.what(), "remove " + token_file::path(id) + ", then " + renew);
        return;
    }
    const auto [mode, isOwn] = token_file::access(id);
    if (!token || token->empty()) {
        findings.problem(accountName(id) + " has no refresh token", renew);
    } else if ((mode & 077) != 0 || !isOwn) {
        findings.problem("the refresh token of " + accountName(id) + " can be read by others",
                         "chmod 600 " + token_file::path(id) + "; and renew it, for it may be known");
    } else {
        findings.good(accountName(id) + " has a refresh token");
    }
}

}  // namespace

void checkAccounts(std::vector<Finding>* all) {
    Findings findings(all, "accounts");
    const auto registered = account_service::accounts();
    const auto stored = account_store::accounts();
    if (registered.empty() && stored.empty()) {
        findings.notice("there is no account, so nothing is kept in step",
                        "add one with: vantor-pim-syncctl account add --help");
        return;
    }
    for (const auto& [id, email] : registered) {
        if (stored.contains(id)) continue;
        findings.problem(
            accountName(id) + " is registered, but the daemon does not have it",
            "remove it with: vantor-pim-syncctl account remove " + std::to_string(id) + ", and add it again");
    }
    for (const auto& [id, account] : stored) {
        if (registered.contains(id)) continue;
        findings.problem("the daemon has " + accountName(id) + ", which is not registered any more",
                         "remove it with: vantor-pim-syncctl account remove " + std::to_string(id));
    }
    if (!findings.hasProblem())
        findings.good(std::to_string(stored.size()) + (stored.size() == 1 ? " account" : " accounts"));
}

void checkTokens(std::vector<Finding>* all) {
    Findings findings(all, "tokens");
    for (const auto& [id, email] : account_service::accounts()) checkToken(id, findings);
}

void checkSyncs(std::vector<Finding>* all) {
    Findings findings(all, "syncs");
    if (!daemon_link::servingPid()) return;  // told elsewhere
    for (const SyncStatus& status : sync_status::all(0)) {
        if (!status.isEnabled) continue;
        const std::string what = accountName(status.account) + ", " + sync_client::kindName(status.kind);
        if (status.state == SYNC_AGENT_STATE_UNAVAILABLE) {
            findings.problem(what + ": the authorisation is no longer accepted",
                             sync_status::adviceFor(status));
        } else if (!status.failure.empty()) {
            findings.problem(what + ": " + status.failure,
                             "the daemon's lines: vantor-pim-syncctl log " + std::to_string(status.account));
        } else if (status.lastSyncSec == 0) {
            findings.notice(what + ": never synced",
                            "vantor-pim-syncctl sync " + std::to_string(status.account) + " --wait");
        } else {
            findings.good(what + ": the last sync ended well");
        }
    }
}

void checkServers(std::vector<Finding>* all) {
    Findings findings(all, "servers");
    for (const std::string& url : serversOf(account_store::accounts(), findings)) {
        const ServerAnswer answer = probeServer(url);
        if (!answer.isReached) {
            findings.problem(url + " does not answer: " + answer.failure,
                             "check the network, and the address with: vantor-pim-syncctl account list");
            continue;
        }
        findings.good(url + " answers");
        checkCertificate(url, answer, findings);
        checkClock(url, answer, findings);
    }
}

}  // namespace doctor
