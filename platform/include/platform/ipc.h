// ipc.h: calls between processes over a Unix stream socket.
// Wire: a frame is a little-endian uint32 length and that many bytes: uint32 sequence, then items; an item is
// a uint32 size and that many bytes. A request's first two items are module and command (text, no NUL), then
// the data items. A reply repeats the sequence, then one uint32 item: 0 (handled; the data items follow),
// 1 (handled, without reply data) or 2 (unknown module or command).
// Limits: a frame is at most kMaxFrameBytes, an item at most kMaxItemBytes; a peer that breaks the format or
// a limit is disconnected, others are not affected. A client that connects and says nothing costs a descriptor. Requests that
// are not whole yet may take 16 frames' room in all; who makes it more is disconnected.
// Peers: the socket's owner, root, and members of the socket's group; others are disconnected.
#pragma once

#include <cstddef>
#include <cstdint>

inline constexpr uint32_t kMaxFrameBytes = 1024 * 1024;
inline constexpr uint32_t kMaxItemBytes = 256 * 1024;

// An ordered sequence of byte blocks. Not shared between threads.
struct pims_ipc_data_s;
using pims_ipc_data_h = pims_ipc_data_s*;
// `size` is a hint, `flags` must be 0. NULL when out of memory.
pims_ipc_data_h pims_ipc_data_create_with_size(size_t size, int flags);
void pims_ipc_data_destroy(pims_ipc_data_h data);
// Appends a copy. Refused: NULL data, NULL value with a size above 0, an item or frame over its limit.
[[nodiscard]] int pims_ipc_data_put(pims_ipc_data_h data, const void* value, size_t size);
// The next item in order, or NULL when none is left; the block belongs to `data` and is aligned for int32.
void* pims_ipc_data_get(pims_ipc_data_h data, size_t* size);

// --- server: main thread only -------------------------------------------------------------------
struct pims_ipc_s;
using pims_ipc_h = pims_ipc_s*;
// `data_in` is NULL when the request carried no items. The handler may store a reply into *data_out (which
// starts NULL); the library destroys it after sending.
using pims_ipc_call_cb = void (*)(pims_ipc_h ipc, pims_ipc_data_h data_in, pims_ipc_data_h* data_out,
                                  void* user_data);

// Opens the service socket at `path` (the root is applied) with group and mode. A stale socket of this user is
// removed, one that another process serves is refused, links and other files are never followed or removed.
// Without the right to give the socket to the group it keeps its own; the log says so. The log tells every
// refusal. A path that does not fit sockaddr_un is refused with a clear line.
[[nodiscard]] int pims_ipc_svc_init(const char* path, unsigned group, unsigned mode);
// Fails when the socket could not be opened.
[[nodiscard]] int pims_ipc_svc_register(const char* module, const char* command, pims_ipc_call_cb callback,
                                        void* user_data);
// Creates a main loop on the default main context and runs it (or `main_loop`, a GMainLoop, when not NULL)
// until SIGTERM or SIGINT.
void pims_ipc_svc_run_main_loop(void* main_loop);
// Closes all connections and removes the socket if it is still ours.
int pims_ipc_svc_deinit();

// --- client: any one thread at a time a handle ----------------------------------------------------
// Connects. PLATFORM_ERROR_NOT_FOUND when nobody serves the path, PLATFORM_ERROR_PERMISSION_DENIED when the caller may not or
// what is there is no socket (links are not followed), PLATFORM_ERROR_FAILED when it is served by a user who has nothing to do with the
// device's stores.
[[nodiscard]] int pims_ipc_create(const char* path, pims_ipc_h* ipc);
int pims_ipc_destroy(pims_ipc_h ipc);
// Blocks until the reply, at most `timeout_ms`. *data_out is NULL for a reply without data; the caller
// destroys it. PLATFORM_ERROR_NOT_FOUND: unknown module or command. After PLATFORM_ERROR_TIMED_OUT or
// PLATFORM_ERROR_IO the handle is broken and every call fails.
[[nodiscard]] int pims_ipc_call(pims_ipc_h ipc, const char* module, const char* command,
                                pims_ipc_data_h data_in, pims_ipc_data_h* data_out, int timeout_ms);
// Whether the serving process still holds the connection; asks nobody, takes no time.
[[nodiscard]] bool pims_ipc_is_alive(pims_ipc_h ipc);
// The process id of the serving process.
[[nodiscard]] int pims_ipc_get_server_pid(pims_ipc_h ipc, int* pid);
