#include "calendar/CalUploader.h"

#include <algorithm>
#include <iterator>
#include <utility>

#include "calendar/CalItemWriter.h"
#include "calendar/CalTransaction.h"
#include "common/PageReader.h"
#include "common/SentMark.h"
#include "common/SyncLog.h"
#include "platform/calendar_read.h"

using sync_result::kFailed;
using sync_result::kOk;
using sync_result::kStopped;
using sync_result::kTokenFailed;

namespace {

constexpr const char* kStoreFails = "the device's stores cannot be written";
// Each time costs a commit; an edit that comes after it waits for the next run.
constexpr size_t kMarkedAtOnce = 32;

}  // namespace

CalUploader::CalUploader(CalSyncSide* side, CalUpSyncTask* task, IStopQuery* stopQuery, ParkedItems* parked,
                         CalBookMetaData book)
    : mSide(*side),
      mTask(*task),
      mpStopQuery(stopQuery),
      mParked(*parked),
      mBook(std::move(book)),
      mKind(side->manager().kind()),
      mRecords(mKind.view) {}

int CalUploader::run() {
    mpStore = mSide.manager().prepared();
    if (mpStore == nullptr || readRows() != kOk) return kFailed;
    const bool hasMarks = std::any_of(mRows.begin(), mRows.end(),
                                      [](const Row& row) { return row.dirty != 0 || row.deleted != 0; });
    if (!hasMarks) return kOk;
    if (CalManager::isReadOnly(mBook.calendar_id)) return dropMarks();
    if (findSentItems() != kOk) {
        if (mFailure.empty()) mFailure = kStoreFails;
        mResult = mResult != kOk ? mResult : kFailed;
    } else if (const int result = sendDirty(); result != kOk) {
        mResult = result;
    }
    for (Row& row : mRows) {
        if (mEnd == End::kAll || isStopped()) break;
        if (row.deleted != 0 && !isParked(row)) sendDeleted(row);
    }
    if (writeBack() != kOk && mResult == kOk) mResult = kFailed;
    return isStopped() ? kStopped : mResult;
}

int CalUploader::readRows() {
    std::vector<Row> rows;
    if (mpStore->getAllItems(mBook.calendar_id, &rows) != kOk) return kFailed;
    mRows.assign(rows.begin(), rows.end());
    mInstances.clear();
    for (Row& row : mRows) {
        if (row.original_event_id != 0) mInstances[row.original_event_id].push_back(&row);
    }
    return kOk;
}

// A book that became read-only: nobody takes what was changed before.
int CalUploader::dropMarks() {
    SyncTransaction transaction(mpStore->database());
    if (!transaction.begun()) return kFailed;
    for (Row& row : mRows) {
        if (row.dirty == 0 && row.deleted == 0) continue;
        SYNC_ERR("%s(%s) is read-only, the device's change of %s(%d) is not sent", mKind.bookName,
                 mBook.uri.c_str(), mKind.itemName, row.event_id);
        row.dirty = row.deleted = 0;
        if ((row.uri.empty() ? mpStore->forgetItem(row.event_id) : mpStore->updateItem(row)) != kOk)
            return kFailed;
    }
    return transaction.commit();
}

void CalUploader::fail(const Row& row, const UpReply& reply) {
    SYNC_ERR("%s(%d, %s) could not be sent: %s", mKind.itemName, row.event_id, row.uri.c_str(),
             reply.reason.c_str());
    if (reply.isForGood) {
        mParked.park(mKind.itemName, row.event_id, versionToPark(row), reply.reason);
    } else {
        mIsInTrouble = true;
    }
    if (mTask.isAskedToWait()) mEnd = End::kAll;
    if (mResult != kOk) return;
    mResult = reply.result != kOk ? reply.result : kFailed;
    mFailure = reply.result == kTokenFailed
                   ? "the account's authorisation is no longer accepted"
                   : std::string(mKind.bookName) + " " + mBook.uri + ": " + mKind.itemName + " " +
                         std::to_string(row.event_id) + " could not be sent: " + reply.reason;
}

void CalUploader::endWith(const Row& row, const UpReply& reply, End end) {
    fail(row, reply);
    mEnd = reply.answer == UpAnswer::kNoAnswer ? End::kAll : std::max(mEnd, end);
    if (reply.result == kTokenFailed) mResult = kTokenFailed;
}

// --- new items

// Items of an earlier run whose answer was lost: those that the server lists are ours already.
int CalUploader::findSentItems() {
    const bool some = std::any_of(mRows.begin(), mRows.end(), [](const Row& row) {
        return row.uri.empty() && sent_mark::isOn(row.etag) && (row.dirty != 0 || row.deleted != 0);
    });
    if (!some) return kOk;
    CalBookSnapshot snapshot(mKind);
    if (snapshot.load(*mpStore, mBook) != kOk) return kFailed;
    CalItemWriter writer(mpStore, &snapshot);
    const int fetched = readPages<CalListPage>(
        [&](const std::string& token, CalListPage* page) { return mSide.getItems(mBook.uri, token, page); },
        [&](CalListPage& page) {
            std::erase_if(page.entries, [&](const CalListInfoPtr& entry) {
                return snapshot.rowByUri(entry->id) != nullptr || snapshot.orphan(entry->id) != 0;
            });
            const int result = mSide.getContent(mBook.uri, snapshot, &page);
            return result != kOk ? result : writer.adoptSent(page);
        },
        [this] { return isStopped(); });
    if (fetched == kOk) return readRows();
    // Without the list nobody knows, so those items wait; the others go on.
    mSkipUnconfirmed = mIsInTrouble = true;
    mResult = fetched;
    mFailure = std::string(mKind.bookName) + " " + mBook.uri + ": " + mSide.failure();
    if (fetched == kTokenFailed || mSide.unreachable()) mEnd = End::kAll;
    return readRows();
}

int CalUploader::markAsSent(std::span<const Outgoing> items) {
    SyncTransaction transaction(mpStore->database());
    if (!transaction.begun()) return kFailed;
    for (const Outgoing& item : items) {
        if (!item.body || !isNewToServer(*item.row)) continue;
        item.row->etag = sent_mark::of(item.says);
        if (mpStore->updateItem(*item.row) != kOk) return kFailed;
    }
    return transaction.commit();
}

bool CalUploader::isNewToServer(const Row& row) const {
    return row.uri.empty() && row.dirty != 0 && row.deleted == 0 && row.original_event_id == 0 &&
           !isParked(row) && !waitsForList(row);
}

bool CalUploader::waitsForList(const Row& row) const {
    return mSkipUnconfirmed && row.uri.empty() && sent_mark::isOn(row.etag);
}

// --- items

std::vector<CalUploader::Row*> CalUploader::dirtyItems() {
    std::vector<Row*> dirty;
    for (Row& row : mRows) {
        if (row.original_event_id != 0 || row.deleted != 0) continue;
        const auto instances = mInstances.find(row.event_id);
        const bool hasDirtyInstance =
            instances != mInstances.end() &&
            std::any_of(instances->second.begin(), instances->second.end(),
                        [](const Row* instance) { return instance->dirty != 0 && instance->event_id > 0; });
        if (row.dirty != 0 || hasDirtyInstance) dirty.push_back(&row);
    }
    return dirty;
}

int CalUploader::sendDirty() {
    const std::vector<Row*> dirty = dirtyItems();
    std::vector<int> ids;
    std::transform(dirty.begin(), dirty.end(), std::back_inserter(ids),
                   [](const Row* row) { return row->event_id; });
    mRecords.expect(std::move(ids));
    for (std::span<Row* const> rest(dirty); !rest.empty();) {
        const std::span<Row* const> next = rest.first(std::min(rest.size(), kMarkedAtOnce));
        rest = rest.subspan(next.size());
        const std::vector<Outgoing> items = prepare(next);
        if (markAsSent(items) != kOk) {
            if (mResult == kOk) mFailure = kStoreFails;
            return mResult != kOk ? mResult : kFailed;
        }
        for (const Outgoing& item : items) {
            if (mEnd != End::kNone) return mResult;
            if (isStopped()) return kStopped;
            sendItem(item);
        }
    }
    return mResult;
}

std::vector<CalUploader::Outgoing> CalUploader::prepare(std::span<Row* const> rows) {
    std::vector<Outgoing> items;
    for (Row* row : rows) {
        if (waitsForList(*row)) continue;
        Outgoing item;
        item.row = row;
        if (const int code = mRecords.take(row->event_id, &item.record); code != PLATFORM_ERROR_NONE) {
            // Deleted since the marks were set: the next walk finds that.
            if (code != PLATFORM_ERROR_NOT_FOUND) SYNC_ERR("db_get_record fail");
            continue;
        }
        item.isDue = row->dirty != 0 && !isParked(*row);
        CalJsonObject body;
        if (item.isDue && mKind.compose(item.record.get(), &body) == kOk) {
            item.says = mKind.comparable(body.object());
            item.body = std::move(body);
        }
        items.push_back(std::move(item));
    }
    return items;
}

void CalUploader::sendItem(const Outgoing& item) {
    Row& row = *item.row;
    if (item.isDue) {
        if (!item.body) {
            UpReply unreadable;
            unreadable.isForGood = true;
            unreadable.reason = "the record cannot be written as JSON";
            return fail(row, unreadable);
        }
        row.uri.empty() ? insertItem(item) : updateItem(item);
    }
    if (mKind.hasSeries() && !row.uri.empty() && mEnd == End::kNone) sendInstances(row, item.record.get());
}

void CalUploader::insertItem(const Outgoing& item) {
    Row& row = *item.row;
    calendar_record_h record = item.record.get();
    const UpReply reply = mTask.insert(mBook.uri, item.body->getJsonString());
    switch (reply.answer) {
        case UpAnswer::kAccepted:
            row.uri = reply.uri;
            row.etag = reply.etag;
            // A series stays marked until the server has its cancelled instances too.
            row.dirty = hasUnsentDates(row, record) ? 1 : 0;
            return storeAnswer(item, seenVersion(row, record), converted(reply));
        case UpAnswer::kRefused:
            fail(row, reply);
            row.etag.clear();
            if (mpStore->updateItem(row) != kOk) SYNC_ERR("%s", mKind.texts.updateRow);
            return;
        case UpAnswer::kGone:
        case UpAnswer::kUnclear:
        case UpAnswer::kNoAnswer:
            return endWith(row, reply, End::kNone);
    }
}

void CalUploader::updateItem(const Outgoing& item) {
    Row& row = *item.row;
    calendar_record_h record = item.record.get();
    const int version = seenVersion(row, record);
    const UpReply before = mTask.getEtag(mBook.uri, row.uri);
    if (before.answer == UpAnswer::kGone) return removeGone(row, version);
    if (before.answer != UpAnswer::kAccepted) return endWith(row, before, End::kDirtyOfBook);
    if (!row.etag.empty() && before.etag != row.etag) {
        SYNC_ERR("%s(%s) was changed on both sides, the device's change wins", mKind.itemName,
                 row.uri.c_str());
    }
    CalendarRecord server;
    const UpAnswer answer = update(row, row.uri, item.body->getJsonString(), &row.etag, &server);
    if (answer == UpAnswer::kGone) return removeGone(row, version);
    if (answer != UpAnswer::kAccepted) return;
    row.dirty = hasUnsentDates(row, record) ? 1 : 0;
    storeAnswer(item, version, std::move(server));
}

CalendarRecord CalUploader::converted(const UpReply& reply) const {
    CalendarRecord server;
    if (reply.item != nullptr) (void)mKind.convert(jsonObjectOf(reply.item), &server);
    return server;
}

void CalUploader::storeAnswer(const Outgoing& sent, int version, CalendarRecord server) {
    Row& row = *sent.row;
    if (server != nullptr && mKind.comparableOfConverted(server.get()) != sent.says) {
        // What the server made of it must come down.
        SYNC_INFO("%s(%s) is not what was sent, it is compared again", mKind.itemName, row.uri.c_str());
        row.etag.clear();
    }
    store(row, version, version, std::move(server));
}

UpAnswer CalUploader::update(const Row& row, const std::string& uri, const std::string& body,
                             std::string* etag, CalendarRecord* server) {
    UpReply answer = mTask.update(mBook.uri, uri, body);
    if (answer.answer == UpAnswer::kGone) return answer.answer;
    if (answer.answer != UpAnswer::kAccepted) {
        endWith(row, answer, End::kNone);
        return answer.answer;
    }
    if (answer.isCancelled) {
        // It takes changes but stays cancelled: without an etag the row differs from the list, and the download takes it away.
        etag->clear();
        SYNC_ERR("%s(%s) is cancelled on the server, the device's change is dropped", mKind.itemName,
                 uri.c_str());
        return UpAnswer::kAccepted;
    }
    const UpReply after = mTask.getEtag(mBook.uri, uri);
    if (after.answer != UpAnswer::kAccepted) {
        SYNC_ERR("Failed to get etag");
        if (after.answer == UpAnswer::kNoAnswer) endWith(row, after, End::kAll);
        // Then nothing names the item that was changed.
        if (answer.uri.empty()) {
            endWith(row, after, End::kNone);
            return UpAnswer::kUnclear;
        }
    }
    // What somebody else wrote in between comes down with the next download, so the etag of our own write is kept.
    const std::string& known = !answer.etag.empty() ? answer.etag : after.etag;
    if (!known.empty()) *etag = known;
    *server = converted(answer);
    return UpAnswer::kAccepted;
}

// The device's copy goes with the next download.
void CalUploader::removeGone(Row& row, int version) {
    const UpReply reply = mTask.remove(mBook.uri, row.uri);
    if (!reply.isRemoved()) return endWith(row, reply, End::kNone);
    SYNC_ERR("%s(%s) is no longer on the server, the device's change is dropped", mKind.itemName,
             row.uri.c_str());
    row.dirty = 0;
    row.version = version;
    if (mpStore->updateItem(row) != kOk) SYNC_ERR("%s", mKind.texts.updateRow);
}

void CalUploader::sendDeleted(Row& row) {
    if (row.uri.empty()) {
        if (waitsForList(row)) return;
        if (row.etag == sent_mark::kNamesNothing) {
            SYNC_ERR("%s(%d) was deleted before the server's answer to it was known", mKind.itemName,
                     row.event_id);
        }
        if (mpStore->forgetItem(row.event_id) != kOk) SYNC_ERR("%s", mKind.texts.deleteRow);
        return;
    }
    const UpReply reply = mTask.remove(mBook.uri, row.uri);
    if (!reply.isRemoved()) return endWith(row, reply, End::kNone);
    ++mSent;
    mParked.forget(mKind.itemName, row.event_id);
    row.deleted = row.dirty = 0;
    if (mpStore->updateItem(row) != kOk) SYNC_ERR("%s", mKind.texts.updateRow);
}

void CalUploader::store(Row& row, int version, int expectedVersion, CalendarRecord server) {
    row.version = version;
    ++mSent;
    mParked.forget(mKind.itemName, row.event_id);
    if (mpStore->updateItem(row) != kOk) {
        SYNC_ERR("%s", mKind.texts.updateRow);
        mIsInTrouble = true;
        if (mResult == kOk) mFailure = kStoreFails;
        mResult = kFailed;
        mEnd = End::kAll;
        return;
    }
    mSentItems.push_back({{row.event_id, expectedVersion, row.uri, row.etag}, std::move(server)});
}

// The records learn what the server calls them, so that they can be recognised without their rows.
int CalUploader::writeBack() {
    if (mSentItems.empty()) return kOk;
    CalTransaction transaction;
    if (!transaction.begun()) {
        SYNC_ERR("get svc fail");
        return kFailed;
    }
    for (const Sent& sent : mSentItems) {
        if (!::writeBack(mKind, sent.record, sent.server.get())) return kFailed;
    }
    if (!transaction.commit()) {
        SYNC_ERR("get svc fail");
        return kFailed;
    }
    return mSide.manager().passOwnWrites(mBook.calendar_id);
}
