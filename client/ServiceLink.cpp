#include "ServiceLink.h"

#include "common/vantor_pim_sync_ipc_marshal.h"
#include "platform/error.h"

namespace {

constexpr int kFailed = -1;
constexpr size_t kRequestBytes = 1024;

}  // namespace

ServiceLink& ServiceLink::getInstance() {
    static ServiceLink* const instance = new ServiceLink;
    return *instance;
}

int ServiceLink::connect() {
    if (mpIpc) return PLATFORM_ERROR_NONE;
    pims_ipc_h ipc = nullptr;
    const int code = pims_ipc_create(kServiceSocket, &ipc);
    if (code == PLATFORM_ERROR_NONE) mpIpc.reset(ipc);
    return code;
}

void ServiceLink::disconnect() {
    mpIpc.reset();
}

int ServiceLink::exchange(const char* command, int timeoutMs, pims_ipc_data_h request, DataPtr* reply) {
    pims_ipc_data_h data = nullptr;
    const int code = pims_ipc_call(mpIpc.get(), kServiceModule, command, request, &data, timeoutMs);
    reply->reset(data);
    // A connection that failed once is never in step again.
    if (code != PLATFORM_ERROR_NONE && code != PLATFORM_ERROR_NOT_FOUND) mpIpc.reset();
    return code;
}

int ServiceLink::call(const char* command, bool isRead, int timeoutMs, const Put& put, const Take& take) {
    const DataPtr request(pims_ipc_data_create_with_size(kRequestBytes, 0));
    if (!request || put(request.get()) != 0) return kFailed;
    // The daemon may have been restarted since the last call. Whether it is still at the other end is asked before a call that
    // must not be carried out twice.
    if (mpIpc && !isRead && !pims_ipc_is_alive(mpIpc.get())) mpIpc.reset();
    DataPtr reply;
    int code = PLATFORM_ERROR_NOT_FOUND;
    for (int attempt = 0; attempt < (isRead ? 2 : 1); ++attempt) {
        if (connect() != PLATFORM_ERROR_NONE) return kFailed;
        code = exchange(command, timeoutMs, request.get(), &reply);
        if (code != PLATFORM_ERROR_IO) break;
    }
    int result = kFailed;
    if (code != PLATFORM_ERROR_NONE || !reply) return kFailed;
    if (vantor_pim_sync_ipc_unmarshal_int(reply.get(), &result) != 0) return kFailed;
    if (result == 0 && take && take(reply.get()) != 0) return kFailed;
    return result;
}
