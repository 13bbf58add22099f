#include <sys/stat.h>
#include <sys/statvfs.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <memory>

#include "AccountService.h"
#include "DaemonLink.h"
#include "Device.h"
#include "Failure.h"
#include "ReadOnlyDatabase.h"
#include "common/PeerVerification.h"
#include "doctor/Checks.h"
#include "platform/error.h"
#include "platform/keys.h"
#include "platform/root.h"
#include "platform/settings.h"

namespace doctor {

namespace {

constexpr int kAnswerMs = 2000;
constexpr uint64_t kEnoughBytes = 64ULL << 20;
constexpr const char* kInitAdvice = "make it with: vantor-pim-syncctl init";

struct FreeDeleter {
    void operator()(char* text) const noexcept { free(text); }
};

std::string modeText(mode_t mode) {
    char text[8];
    (void)std::snprintf(text, sizeof text, "%04o", static_cast<unsigned>(mode & 07777));
    return text;
}

// What is open to more people than it should be.
mode_t excess(mode_t mode, mode_t expected) {
    return mode & 0077 & ~expected;
}

void checkPath(const std::string& path, bool isFolder, mode_t expected, Findings& findings) {
    struct stat info {};
    if (lstat(path.c_str(), &info) != 0) {
        errno == ENOENT ? findings.problem(path + " is missing", kInitAdvice)
                        : findings.problem(path + " cannot be looked at: " + std::strerror(errno),
                                           "run this as the daemon's user or as root");
    } else if (isFolder ? !S_ISDIR(info.st_mode) : !S_ISREG(info.st_mode)) {
        findings.problem(path + " is not a plain " + (isFolder ? "folder" : "file"),
                         "move it away, then " + std::string(kInitAdvice));
    } else if (excess(info.st_mode, expected) != 0) {
        findings.problem(path + " is open to others: its mode is " + modeText(info.st_mode) + ", not " +
                             modeText(expected),
                         "chmod " + modeText(expected) + " " + path);
    }
}

// A store that holds what a person entered is not to be thrown away lightly; the others the daemon can make again.
struct StoreFile {
    const char* path;
    const char* what;
    const char* advice;
};
constexpr const char* kRecordAdvice =
    "stop the daemon and bring the file back from a backup; without one, move it away: what was in step "
    "comes again from the "
    "server, what was only here is lost";
constexpr const char* kSyncAdvice =
    "stop the daemon and bring the file back from a backup together with the records; without one, move it "
    "away: the next "
    "sync compares everything anew";
constexpr StoreFile kStores[] = {
    {"/opt/usr/data/records/calendar.db", "the events and to-dos of the device", kRecordAdvice},
    {"/opt/usr/data/records/contacts.db", "the contacts of the device", kRecordAdvice},
    {"/opt/usr/dbspace/.vantor_pim_sync_account.db", "the daemon's accounts", kSyncAdvice},
    {"/opt/usr/dbspace/.vantor_pim_sync_calendar.db", "what is known of the server's events", kSyncAdvice},
    {"/opt/usr/dbspace/.vantor_pim_sync_todo.db", "what is known of the server's tasks", kSyncAdvice},
    {"/opt/usr/dbspace/.vantor_pim_sync_contacts.db", "what is known of the server's contacts", kSyncAdvice},
};

void checkStore(const StoreFile& file, Findings& findings) {
    const std::string path = platform::rootedPath(file.path);
    try {
        const ReadOnlyDatabase store(file.path);
        if (!store.isOpen()) return;  // made when it is needed
        const SqliteStatement row = store.prepare("PRAGMA quick_check(1)");
        const bool isWhole = store.step(row) && ReadOnlyDatabase::text(row, 0) == "ok";
        if (!isWhole) findings.problem(path + " (" + file.what + ") is damaged", file.advice);
    } catch (const Failure& failure) {
        findings.problem(std::string(failure.what()) + " (" + file.what + ")", file.advice);
    }
}

}  // namespace

void checkFolders(std::vector<Finding>* all) {
    Findings findings(all, "folders");
    for (const device::Folder& folder : device::folders()) {
        if (folder.isOfTheSystem && !device::isPrivate()) continue;
        checkPath(platform::rootedPath(folder.path), /*isFolder=*/true, folder.mode, findings);
    }
    for (const std::string& path : device::notificationFiles())
        checkPath(platform::rootedPath(path), /*isFolder=*/false, device::kNotificationMode, findings);
    if (!findings.hasProblem()) findings.good("the folders and notification files are there");
}

void checkKeys(std::vector<Finding>* all) {
    Findings findings(all, "keys");
    for (const char* name : {"vantor.tovik.client.id", "vantor.tovik.client.secret"}) {
        char* raw = nullptr;
        const int code = key_storage_get(name, &raw);
        const std::unique_ptr<char, FreeDeleter> value(raw);
        const std::string set =
            std::string("vantor-pim-syncctl key set ") + name + " (its value on standard input)";
        if (code == PLATFORM_ERROR_NOT_FOUND) {
            findings.problem(std::string("the key ") + name + " is not set, so no token is given out",
                             "set it with: " + set);
        } else if (code == PLATFORM_ERROR_PERMISSION_DENIED) {
            findings.problem(
                std::string("the key ") + name + " is open to others, or belongs to another user",
                "store it anew with: " + set);
        } else if (code != PLATFORM_ERROR_NONE) {
            findings.problem(std::string("the key ") + name + " cannot be read",
                             "store it anew with: " + set);
        }
    }
    if (!findings.hasProblem()) findings.good("both keys are set and readable by their owner alone");
}

void checkDisk(std::vector<Finding>* all) {
    Findings findings(all, "disk");
    for (const char* folder : {device::kStoreFolder, device::kDataFolder}) {
        const std::string path = platform::rootedPath(folder);
        struct statvfs info {};
        if (statvfs(path.c_str(), &info) != 0) continue;  // a missing folder is told elsewhere
        const uint64_t bytes = static_cast<uint64_t>(info.f_bavail) * info.f_frsize;
        if (bytes < kEnoughBytes)
            findings.problem("only " + std::to_string(bytes >> 20) + " MB are free at " + path, "make room");
        if (info.f_files > 0 && info.f_favail == 0)
            findings.problem("no further file can be made at " + path, "remove files there");
    }
    if (!findings.hasProblem()) findings.good("there is room");
}

void checkStores(std::vector<Finding>* all) {
    Findings findings(all, "stores");
    for (const StoreFile& file : kStores) checkStore(file, findings);
    if (!findings.hasProblem()) findings.good("the stores are whole");
}

void checkSettings(std::vector<Finding>* all) {
    Findings findings(all, "settings");
    int value = 0;
    if (vconf_get_int("db/account/auto_sync", &value) == PLATFORM_ERROR_NONE && value == 0) {
        findings.notice("scheduled syncs are switched off",
                        "switch them on with: vantor-pim-syncctl setting set db/account/auto_sync 1");
    }
    if (!isPeerVerified()) {
        findings.notice(
            "servers are not asked to prove who they are, so another could pose as one and read the account",
            "turn it on with: vantor-pim-syncctl setting set db/vantor-pim-sync/verify_peer 1");
    }
}

void checkDaemon(std::vector<Finding>* all) {
    Findings findings(all, "daemon");
    if (!daemon_link::servingPid()) {
        // Without an account it does not stay up, which is as it should be.
        account_service::accounts().empty()
            ? findings.good("the daemon does not run, there is nothing to do")
            : findings.problem("the daemon does not run", daemon_link::startAdvice());
    } else if (!daemon_link::isAnswering(kAnswerMs)) {
        findings.problem("the daemon does not answer", "its log tells why: vantor-pim-syncctl log");
    } else {
        findings.good("the daemon answers");
    }
}

}  // namespace doctor
