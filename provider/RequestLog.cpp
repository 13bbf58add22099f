#include "RequestLog.h"

#include <algorithm>
#include <cmath>

namespace provider {

namespace {

Json recordJson(const RequestRecord& record) {
    return {{"method", record.method},
            {"path", record.target},
            {"status", record.status},
            {"bytes", record.bytes},
            {"authorization", record.hasAuthorization},
            {"gzip", record.isGzip},
            {"account", record.account},
            {"ms", std::round(record.elapsedMs * 10) / 10}};
}

}  // namespace

void RequestLog::add(const std::string& name, RequestRecord record) {
    const std::lock_guard lock(mMutex);
    ++mCounts[record.method + " " + name];
    ++mTotal;
    ++mLastNumber;
    mLast.push_back(std::move(record));
    if (mLast.size() > kKept) mLast.pop_front();
}

Json RequestLog::json() const {
    const std::lock_guard lock(mMutex);
    Json last = Json::array();
    for (const RequestRecord& record : mLast) last.push_back(recordJson(record));
    return {{"total", mTotal}, {"counts", mCounts}, {"requests", last}};
}

Json RequestLog::since(std::uint64_t number, std::size_t atMost) const {
    const std::lock_guard lock(mMutex);
    const std::uint64_t after = mLastNumber - std::min(number, mLastNumber);
    const auto count = static_cast<std::ptrdiff_t>(std::min<std::uint64_t>({after, mLast.size(), atMost}));
    Json requests = Json::array();
    for (auto record = mLast.end() - count; record != mLast.end(); ++record)
        requests.push_back(recordJson(*record));
    return {{"last", mLastNumber}, {"requests", requests}};
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
