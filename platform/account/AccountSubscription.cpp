// Subscriptions to the account service's events.
#include <algorithm>
#include <list>
#include <memory>
#include <vector>

#include "../base/StoreWatch.h"
#include "AccountStore.h"
#include "platform/account.h"
#include "platform/error.h"

using platform::SqlStore;
using platform::account::store;

struct account_subscribe_s {
    account_event_cb callback = nullptr;
    void* userData = nullptr;
};

namespace {

struct Event {
    int64_t sequence = 0;
    std::string type;
    int accountId = 0;
};

class Subscriptions {
public:
    static Subscriptions& instance() {
        static Subscriptions* const subscriptions = new Subscriptions;
        return *subscriptions;
    }

    int add(account_subscribe_h handle) {
        if (mHandles.empty()) {
            if (const int code = begin(); code != PLATFORM_ERROR_NONE) return code;
        }
        mHandles.push_back(handle);
        return PLATFORM_ERROR_NONE;
    }

    void remove(account_subscribe_h handle) {
        mHandles.remove(handle);
        if (mHandles.empty()) mWatch.reset();
    }

private:
    int begin() {
        if (const int code = store().open(); code != PLATFORM_ERROR_NONE) return code;
        mWatch = std::make_unique<platform::StoreWatch>(store().path(), [this] { look(); });
        if (!mWatch->isWatching()) {
            mWatch.reset();
            return PLATFORM_ERROR_IO;
        }
        const int code =
            store().read("SELECT coalesce(max(sequence), 0) FROM events", {}, [this](sqlite3_stmt* row) {
                mSeen = sqlite3_column_int64(row, 0);
                return false;
            });
        if (code != PLATFORM_ERROR_NONE) mWatch.reset();
        return code;
    }

    void look() {
        std::vector<Event> events;
        const int code =
            store().read("SELECT sequence, type, account_id FROM events WHERE sequence > ? ORDER BY sequence",
                         {mSeen}, [&events](sqlite3_stmt* row) {
                             events.push_back({sqlite3_column_int64(row, 0), SqlStore::text(row, 1),
                                               sqlite3_column_int(row, 2)});
                             return true;
                         });
        if (code != PLATFORM_ERROR_NONE) return mWatch->again();
        for (const Event& event : events) {
            mSeen = event.sequence;
            tell(event);
        }
    }

    void tell(const Event& event) {
        const std::list<account_subscribe_h> handles = mHandles;
        for (account_subscribe_h handle : handles) {
            const bool alive = std::find(mHandles.begin(), mHandles.end(), handle) != mHandles.end();
            if (!alive || handle->callback(event.type.c_str(), event.accountId, handle->userData)) continue;
            mHandles.remove(handle);
        }
    }

    std::list<account_subscribe_h> mHandles;
    std::unique_ptr<platform::StoreWatch> mWatch;
    int64_t mSeen = 0;
};

}  // namespace

int account_subscribe_create(account_subscribe_h* handle) {
    if (handle == nullptr) return PLATFORM_ERROR_INVALID_PARAMETER;
    *handle = new account_subscribe_s;
    return PLATFORM_ERROR_NONE;
}

int account_subscribe_notification(account_subscribe_h handle, account_event_cb callback, void* user_data) {
    if (handle == nullptr || callback == nullptr || handle->callback != nullptr)
        return PLATFORM_ERROR_INVALID_PARAMETER;
    handle->callback = callback;
    handle->userData = user_data;
    return Subscriptions::instance().add(handle);
}

int account_unsubscribe_notification(account_subscribe_h handle) {
    if (handle == nullptr) return PLATFORM_ERROR_NONE;
    Subscriptions::instance().remove(handle);
    delete handle;
    return PLATFORM_ERROR_NONE;
}
