// The daemon's entry: opens the service socket, brings the service up, runs the main loop until SIGTERM or SIGINT.
#include <glib-object.h>
#include <grp.h>
#include <malloc.h>
#include <sys/stat.h>

#include <csignal>
#include <cstdio>
#include <string_view>

#include "common/SyncLog.h"
#include "common/SyncService.h"
#include "common/vantor_pim_sync_ipc_marshal.h"
#include "platform/root.h"
#include "platform/service_manager.h"
#include "server/vantor_pim_sync_server_ipc.h"

namespace {

constexpr const char* kSocketGroupName = "vantor-pim-sync";
constexpr unsigned kSocketGroup = 6005;  // the device's own, where no group has the name
constexpr unsigned kSocketMode = 0660;
// Whoever starts the daemon: the modes that the stores ask for hold, and nobody else may ever write.
constexpr mode_t kFileCreationMask = 0002;

// A page comes and goes many times in a sync. Memory that is given back to the kernel and fetched again for each costs more than
// the page's own work, and an arena a thread keeps as much again for each account.
void tuneMemory() {
    constexpr int kKeptBytes = 4 * 1024 * 1024;
    mallopt(M_ARENA_MAX, 1);
    mallopt(M_TRIM_THRESHOLD, kKeptBytes);
    mallopt(M_TOP_PAD, kKeptBytes / 4);
}

unsigned socketGroup() {
    const group* named = getgrnam(kSocketGroupName);
    return named != nullptr ? named->gr_gid : kSocketGroup;
}

void initializeTypes() {
    // Done by the library itself today; kept for older ones.
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wdeprecated-declarations"
    g_type_init();
#pragma GCC diagnostic pop
}

}  // namespace

static int __server_main() {
    platform::protectMemory();
    tuneMemory();
    std::signal(SIGHUP, SIG_IGN);  // there is nothing to read again: settings and accounts are watched
    std::signal(SIGPIPE,
                SIG_IGN);  // of a client, a server or a log that went away: the write's error says so
    umask(kFileCreationMask);
    initializeTypes();
    (void)pims_ipc_svc_init(kServiceSocket, socketGroup(), kSocketMode);
    if (!vantor_pim_sync_server_ipc_register()) return 0;
    const std::string root = platform::rootFolder();
    SYNC_INFO("serving %s", root.empty() ? "the system" : root.c_str());
    (void)vantor_pim_sync_initialize();
    platform::watchMainLoop();
    platform::tellReady("Idle");
    pims_ipc_svc_run_main_loop(nullptr);
    platform::tellStopping();
    (void)vantor_pim_sync_finalize();
    // Running syncs are told to stop and waited for: nothing may run into the end of the process.
    if (SyncService::exists()) SyncService::getInstance().quiesce();
    pims_ipc_svc_deinit();
    SYNC_INFO("ended");
    return 0;
}

int main(int argc, char** argv) {
    constexpr int kMisused = 2;
    if (argc == 2 && std::string_view(argv[1]) == "--help") {
        std::puts(
            "vantor-pim-sync: keeps calendars, to-dos and contacts in step with a cloud account.\n"
            "Takes no arguments. VANTOR_PIM_SYNC_ROOT names the device's folder, VANTOR_PIM_SYNC_LOG the "
            "lowest\n"
            "severity that is logged (debug, info, warning, error). Ends on SIGTERM and SIGINT, and at once "
            "with\n"
            "status 0 when the device has no account of the provider. Accounts are managed with "
            "vantor-pim-syncctl.");
        return 0;
    }
    if (argc == 2 && std::string_view(argv[1]) == "--version") {
        std::puts("vantor-pim-sync " VPS_VERSION);
        return 0;
    }
    if (argc != 1) {
        std::fprintf(stderr, "vantor-pim-sync: takes no arguments, see --help\n");
        return kMisused;
    }
    return __server_main();
}
