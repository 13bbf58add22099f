// RecordsAhead: reads the records of an upload some dozens at a time, because each read of a store takes its lock and gives it back.
// Whoever takes one gets it as it is now: as soon as anybody has written, what was read before is read again.
// Owner: an uploader.   Threads: one worker.   Errors: platform/error.h.
#pragma once

#include <algorithm>
#include <unordered_map>
#include <utility>
#include <vector>

#include "platform/calendar.h"
#include "platform/contacts.h"

template <class RecordPtr, auto GetRecords, auto GetWriteMark>
class RecordsAhead {
public:
    explicit RecordsAhead(const char* view) : mpView(view) {}

    // The ids in the order in which their records will be taken.
    void expect(std::vector<int> ids) {
        mIds = std::move(ids);
        mNext = 0;
    }

    // PLATFORM_ERROR_NOT_FOUND when the store has no such record. An id that was not expected may be taken too.
    [[nodiscard]] int take(int id, RecordPtr* record) {
        uint64_t mark = 0;
        if (const int code = GetWriteMark(&mark); code != PLATFORM_ERROR_NONE) return code;
        const bool isSame = mark == std::exchange(mMark, mark);
        if (!isSame || !mRead.contains(id)) {
            // While others write, what is read ahead is read in vain.
            mAtOnce = isSame ? std::min(mAtOnce * 2, kMostAtOnce) : 1;
            if (const int code = readFrom(id); code != PLATFORM_ERROR_NONE) return code;
        }
        *record = std::move(mRead.extract(id).mapped());
        return *record != nullptr ? PLATFORM_ERROR_NONE : PLATFORM_ERROR_NOT_FOUND;
    }

private:
    static constexpr size_t kMostAtOnce = 32;

    [[nodiscard]] int readFrom(int id) {
        std::vector<int> ids{id};
        const auto found = std::find(mIds.begin() + static_cast<std::ptrdiff_t>(mNext), mIds.end(), id);
        if (found != mIds.end()) {
            mNext = static_cast<size_t>(found - mIds.begin());
            const size_t count = std::min(mAtOnce, mIds.size() - mNext);
            ids.assign(found, found + static_cast<std::ptrdiff_t>(count));
        }
        mRead.clear();
        std::vector<typename RecordPtr::pointer> records(ids.size(), nullptr);
        if (const int code = GetRecords(mpView, ids.data(), ids.size(), records.data());
            code != PLATFORM_ERROR_NONE) {
            return code;
        }
        for (size_t i = 0; i < ids.size(); ++i) mRead[ids[i]] = RecordPtr(records[i]);
        return PLATFORM_ERROR_NONE;
    }

    const char* const mpView;
    std::vector<int> mIds;
    size_t mNext = 0;  // no record before this one is taken any more
    uint64_t mMark = 0;
    size_t mAtOnce = 1;
    std::unordered_map<int, RecordPtr> mRead;  // NULL: the store has none
};

using CalendarRecordsAhead =
    RecordsAhead<CalendarRecord, calendar_db_get_records_by_id, calendar_db_get_write_mark>;
using ContactsRecordsAhead =
    RecordsAhead<ContactsRecord, contacts_db_get_records_by_id, contacts_db_get_write_mark>;
