// The service socket: how it is opened, and who may use it.
#pragma once

#include <sys/un.h>

#include <string>

namespace platform::ipc {

// Fills the address of `path` (the root applied); false, with a log line, when it does not fit.
bool addressOf(const std::string& path, sockaddr_un* address);

// Takes `path` for this process until the descriptor is closed; a negative code (logged) when another process has it. Two that
// start together would each take the other's new socket for a stale one.
int claimService(const std::string& path);

// Opens, binds and listens as ipc.h says of pims_ipc_svc_init. The descriptor, or a negative code (logged).
int openService(const std::string& path, unsigned group, unsigned mode);

// Whether the process at the other end may call: the socket's owner, root, or a member of the socket's group when the mode
// lets the group write.
bool isPeerAllowed(int connection, const std::string& path);

// Whether the process that serves may be told secrets: root's, the caller's own, or the owner's of the device's stores. Anybody
// can open a socket in a folder that all may write, as long as no daemon does.
bool isServerTrusted(int connection);

}  // namespace platform::ipc
