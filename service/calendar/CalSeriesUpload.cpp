// The half of CalUploader that sends the instances of a series: modified ones to their own server id, cancelled ones as deletions.
#include <algorithm>
#include <set>

#include "calendar/CalExceptionDates.h"
#include "calendar/CalJsonBuilder.h"
#include "calendar/CalUploader.h"
#include "common/SyncLog.h"
#include "platform/calendar_read.h"

using calendar_read::intOf;
using calendar_read::textOf;
using sync_result::kOk;

namespace {

std::string instanceUri(const std::string& seriesUri, const std::string& recurrenceId) {
    return seriesUri + "_" + recurrenceId;
}

// The exceptions of a record by their ids.
std::map<int, calendar_record_h> exceptionsOf(calendar_record_h record) {
    std::map<int, calendar_record_h> children;
    calendar_read::forEachChild(record, CALENDAR_EVENT_EXCEPTIONS, [&children](calendar_record_h child) {
        children.emplace(intOf(child, CALENDAR_EVENT_ID), child);
    });
    return children;
}

}  // namespace

CalUploader::Row* CalUploader::instanceRow(int seriesId, const std::string& recurrenceId) {
    const auto rows = mInstances.find(seriesId);
    if (rows == mInstances.end()) return nullptr;
    const auto found = std::find_if(rows->second.begin(), rows->second.end(),
                                    [&](const Row* row) { return row->recurrence_id == recurrenceId; });
    return found == rows->second.end() ? nullptr : *found;
}

bool CalUploader::hasUnsentDates(const Row& series, calendar_record_h record) {
    if (!mKind.hasSeries()) return false;
    const std::vector<std::string> dates = exception_dates::split(textOf(record, CALENDAR_EVENT_EXDATE));
    return std::any_of(dates.begin(), dates.end(), [&](const std::string& date) {
        const Row* row = instanceRow(series.event_id, date);
        return row == nullptr || row->event_id > 0;
    });
}

int CalUploader::seenVersion(const Row& row, calendar_record_h record) {
    int version = intOf(record, mKind.version);
    if (!mKind.hasSeries()) return version;
    const int own = intOf(record, CALENDAR_EVENT_OWN_VERSION);
    if (row.dirty == 0 && own > std::max(row.version, intOf(record, mKind.syncedVersion))) version = own - 1;
    calendar_read::forEachChild(record, CALENDAR_EVENT_EXCEPTIONS, [&](calendar_record_h child) {
        const int childVersion = intOf(child, CALENDAR_EVENT_VERSION);
        const Row* known = instanceRow(row.event_id, textOf(child, CALENDAR_EVENT_RECURRENCE_ID));
        const bool isSeen = known != nullptr && known->event_id == intOf(child, CALENDAR_EVENT_ID) &&
                            (known->dirty != 0 || known->version >= childVersion);
        const bool isOwnWrite = intOf(child, CALENDAR_EVENT_SYNCED_VERSION) == childVersion;
        if (!isSeen && !isOwnWrite) version = std::min(version, childVersion - 1);
    });
    return version;
}

void CalUploader::sendInstances(Row& series, calendar_record_h record) {
    if (series.dirty != 0 && !isParked(series) && hasUnsentDates(series, record) &&
        sendDates(series, record)) {
        series.dirty = 0;
        if (mpStore->updateItem(series) != kOk) SYNC_ERR("%s", mKind.texts.updateRow);
    }
    const std::map<int, calendar_record_h> children = exceptionsOf(record);
    const auto rows = mInstances.find(series.event_id);
    if (rows == mInstances.end()) return;
    for (Row* row : rows->second) {
        if (mEnd != End::kNone || isStopped()) return;
        if (row->dirty == 0 || row->event_id <= 0) continue;
        const auto child = children.find(row->event_id);
        if (child == children.end()) {
            // Taken away again on the device; the server's copy comes back with the next download.
            row->dirty = 0;
            if (mpStore->updateItem(*row) != kOk) SYNC_ERR("%s", mKind.texts.updateRow);
            continue;
        }
        if (!isParked(*row)) sendInstance(series, seenVersion(series, record), *row, child->second);
    }
}

void CalUploader::sendInstance(const Row& series, int seriesVersion, Row& row, calendar_record_h child) {
    const bool hasOwnUri = !row.uri.empty() && row.uri != series.uri;
    const std::string uri = hasOwnUri ? row.uri : instanceUri(series.uri, row.recurrence_id);
    const std::string body = cal_json::convertException2Json(child, series.uri);
    if (body.empty()) {
        UpReply unreadable;
        unreadable.isForGood = true;
        unreadable.reason = "the instance cannot be written as JSON";
        return fail(row, unreadable);
    }
    const int version = intOf(child, mKind.version);
    const UpReply before = mTask.getEtag(mBook.uri, uri);
    if (before.answer == UpAnswer::kGone) {
        // From here on the row is known by the instance's own id, and goes when no list has it.
        row.uri = uri;
        return removeGone(row, version);
    }
    if (before.answer != UpAnswer::kAccepted) return endWith(row, before, End::kDirtyOfBook);
    // What the server has no exception for is shown with its series' etag.
    const std::string& known = hasOwnUri ? row.etag : series.etag;
    if (!known.empty() && before.etag != known) {
        SYNC_ERR("%s(%s) was changed on both sides, the device's change wins", mKind.itemName, uri.c_str());
    }
    std::string etag = before.etag;
    CalendarRecord server;
    const UpAnswer answer = update(row, uri, body, &etag, &server);
    if (answer != UpAnswer::kAccepted && answer != UpAnswer::kGone) return;
    row.uri = uri;
    if (answer == UpAnswer::kGone) return removeGone(row, version);
    row.etag = etag;
    row.dirty = 0;
    store(row, version, seriesVersion, std::move(server));  // an exception is as old as its series
}

bool CalUploader::sendDates(Row& series, calendar_record_h record) {
    const std::vector<std::string> dates = exception_dates::split(textOf(record, CALENDAR_EVENT_EXDATE));
    for (const Row* row : mInstances[series.event_id]) {
        if (row->event_id < 0 && std::find(dates.begin(), dates.end(), row->recurrence_id) == dates.end()) {
            SYNC_ERR("event(%s): the instance %s was taken back on the device, that is not sent",
                     series.uri.c_str(), row->recurrence_id.c_str());
        }
    }
    bool all = true;
    for (const std::string& date : dates) {
        if (mEnd != End::kNone || isStopped()) return false;
        const Row* row = instanceRow(series.event_id, date);
        if (row == nullptr || row->event_id > 0) all = sendDate(series, date) && all;
    }
    return all;
}

bool CalUploader::sendDate(const Row& series, const std::string& date) {
    Row* known = instanceRow(series.event_id, date);
    Row row;
    if (known != nullptr) row = *known;
    const bool hasOwnUri = !row.uri.empty() && row.uri != series.uri;
    const std::string uri = hasOwnUri ? row.uri : instanceUri(series.uri, date);
    const UpReply reply = mTask.remove(mBook.uri, uri);
    if (!reply.isRemoved()) {
        endWith(series, reply, End::kNone);
        return false;
    }
    ++mSent;
    if (row.event_id > 0) {
        // First changed, then cancelled: only the date is left.
        const int code = calendar_db_delete_record(mKind.view, row.event_id, {.by_sync = true});
        if (code != PLATFORM_ERROR_NONE && code != PLATFORM_ERROR_NOT_FOUND)
            SYNC_ERR("db_delete_records fail");
    }
    row.event_id = -series.event_id;
    row.calendar_id = series.calendar_id;
    row.original_event_id = series.event_id;
    row.recurrence_id = date;
    row.uri = uri;
    row.dirty = row.deleted = 0;
    // The list will have it as a cancelled item, with this etag.
    row.etag = mTask.getEtag(mBook.uri, uri).etag;
    if ((known != nullptr ? mpStore->updateItem(row) : mpStore->insertItem(row)) != kOk) {
        SYNC_ERR("%s", mKind.texts.insertRow);
        return false;
    }
    if (known != nullptr) {
        *known = row;
    } else {
        mInstances[series.event_id].push_back(&mRows.emplace_back(row));
    }
    return true;
}
