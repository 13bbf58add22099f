#include "platform/service_manager.h"

#include <glib.h>
#include <sys/prctl.h>
#include <systemd/sd-daemon.h>

#include <cstdint>
#include <fstream>
#include <string>

namespace platform {

namespace {

bool isTraced() {
    std::ifstream status("/proc/self/status");
    for (std::string word; status >> word;) {
        if (word != "TracerPid:") continue;
        int tracer = 0;
        return status >> tracer && tracer != 0;
    }
    return false;
}

gboolean tellAlive(gpointer) {
    sd_notify(/*unset_environment=*/0, "WATCHDOG=1");
    return G_SOURCE_CONTINUE;
}

}  // namespace

void tellReady(const char* status) {
    sd_notifyf(0, "READY=1\nSTATUS=%s", status);
}

void tellStopping() {
    sd_notify(0, "STOPPING=1");
}

void tellStatus(const char* status) {
    sd_notifyf(0, "STATUS=%s", status);
}

void watchMainLoop() {
    constexpr uint64_t kUsPerMs = 1000;
    uint64_t intervalUs = 0;
    if (sd_watchdog_enabled(0, &intervalUs) <= 0) return;
    g_timeout_add(static_cast<guint>(intervalUs / kUsPerMs / 2), tellAlive, nullptr);
}

void protectMemory() {
    if (!isTraced()) prctl(PR_SET_DUMPABLE, 0, 0, 0, 0);
}

}  // namespace platform
