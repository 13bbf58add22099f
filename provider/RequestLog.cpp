#include "RequestLog.h"

namespace provider {

void RequestLog::add(const std::string& name, RequestRecord record) {
    const std::lock_guard lock(mMutex);
    ++mCounts[record.method + " " + name];
    ++mTotal;
    mLast.push_back(std::move(record));
    if (mLast.size() > kKept) mLast.pop_front();
}

Json RequestLog::json() const {
    const std::lock_guard lock(mMutex);
    Json last = Json::array();
    for (const RequestRecord& record : mLast) {
        last.push_back({{"method", record.method},
                        {"path", record.target},
                        {"status", record.status},
                        {"bytes", record.bytes},
                        {"authorization", record.hasAuthorization},
                        {"gzip", record.isGzip},
                        {"account", record.account}});
    }
    return {{"total", mTotal}, {"counts", mCounts}, {"requests", last}};
}

void RequestLog::clear() {
    const std::lock_guard lock(mMutex);
    mCounts.clear();
    mLast.clear();
    mTotal = 0;
}

std::string withoutSecrets(const std::string& target) {
    for (const char* secret : {"access_token=", "refresh_token=", "client_secret="}) {
        if (target.find(secret) != std::string::npos) return target.substr(0, target.find('?')) + "?(hidden)";
    }
    return target;
}

}  // namespace provider
