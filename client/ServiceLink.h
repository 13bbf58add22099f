// ServiceLink: this process' connection to the daemon.   Owner: process-wide, made on first use.   Threads: one at a time.
#pragma once

#include <functional>
#include <memory>

#include "platform/ipc.h"

class ServiceLink {
public:
    static ServiceLink& getInstance();

    // Connects when there is no connection. A code of platform/error.h.
    [[nodiscard]] int connect();
    void disconnect();

    using Put = std::function<int(pims_ipc_data_h request)>;
    using Take = std::function<int(pims_ipc_data_h reply)>;
    // Calls a command: `put` fills the request, `take` reads what follows a result of 0. Gives the daemon's result, or -1 when it
    // could not be asked. `isRead`: the call changes nothing and may be repeated after the daemon was restarted; any other is
    // sent again only when the old connection was known to be dead before it was used.
    [[nodiscard]] int call(const char* command, bool isRead, int timeoutMs, const Put& put, const Take& take);

private:
    struct Destroy {
        void operator()(pims_ipc_s* ipc) const noexcept { pims_ipc_destroy(ipc); }
        void operator()(pims_ipc_data_s* data) const noexcept { pims_ipc_data_destroy(data); }
    };
    using DataPtr = std::unique_ptr<pims_ipc_data_s, Destroy>;

    [[nodiscard]] int exchange(const char* command, int timeoutMs, pims_ipc_data_h request, DataPtr* reply);

    std::unique_ptr<pims_ipc_s, Destroy> mpIpc;
};
