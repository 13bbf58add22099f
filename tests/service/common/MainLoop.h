// Running the default main context inside a test.
#pragma once

#include <glib.h>

#include <chrono>
#include <functional>

// Iterates until `done` holds; false after `limit`.
inline bool iterateUntil(const std::function<bool()>& done,
                         std::chrono::milliseconds limit = std::chrono::seconds(10)) {
    const auto deadline = std::chrono::steady_clock::now() + limit;
    // Something must wake a context that waits for nothing else.
    const guint tick = g_timeout_add(
        5, [](gpointer) -> gboolean { return G_SOURCE_CONTINUE; }, nullptr);
    bool held = done();
    while (!held && std::chrono::steady_clock::now() < deadline) {
        g_main_context_iteration(nullptr, TRUE);
        held = done();
    }
    g_source_remove(tick);
    return held;
}

// Runs what is ready now.
inline void iterateReady() {
    while (g_main_context_iteration(nullptr, FALSE) != FALSE) {
    }
}
