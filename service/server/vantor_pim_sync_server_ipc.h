// The eight commands that the daemon serves over IPC.   Threads: the IPC library's main loop, one request at a time.
#pragma once

// Registers the commands in order. False at the first one that is refused (logged); later ones are then not registered.
[[nodiscard]] bool vantor_pim_sync_server_ipc_register();
