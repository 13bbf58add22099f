// CalUploader: sends the marked items of one book.
// Owner: an upload run.   Threads: one worker.
//
// A mark is cleared when the server took the change, when none was needed, or when what was to be deleted is gone; whatever else
// happens it stays for the next run. A new item is marked as sent before it goes out, in the store: should its answer be lost, the
// next run looks for it in the server's list before it is sent again.
#pragma once

#include <list>
#include <map>
#include <optional>
#include <span>
#include <string>
#include <vector>

#include "calendar/CalSyncSide.h"
#include "calendar/CalUpSyncTasks.h"
#include "calendar/CalWriteBack.h"
#include "common/ParkedItems.h"
#include "common/RecordsAhead.h"
#include "common/SyncDirector.h"

class CalUploader {
public:
    // Nothing is owned; `stopQuery` may be NULL.
    CalUploader(CalSyncSide* side, CalUpSyncTask* task, IStopQuery* stopQuery, ParkedItems* parked,
                CalBookMetaData book);

    // 0, 1 when stopped, -5, or -1 with failure(). What could be sent was sent.
    [[nodiscard]] int run();

    [[nodiscard]] const std::string& failure() const { return mFailure; }
    // Whether the run of the account ends here.
    [[nodiscard]] bool mustEnd() const { return mEnd == End::kAll; }
    [[nodiscard]] int sent() const { return mSent; }
    // Whether a failure was the server's or the network's, not that of single items.
    [[nodiscard]] bool isInTrouble() const { return mIsInTrouble; }

private:
    enum class End { kNone, kDirtyOfBook, kAll };
    using Row = CalEventMetaData;

    // An item, or a series of which instances are marked.
    struct Outgoing {
        Row* row = nullptr;
        CalendarRecord record;
        bool isDue = false;  // itself
        std::optional<CalJsonObject> body;
        std::string says;  // comparable
    };

    struct Sent {
        CalWriteBack record;
        CalendarRecord server;  // the item as the server has it, NULL when it did not say
    };

    [[nodiscard]] bool isStopped() const { return mpStopQuery != nullptr && mpStopQuery->isStopped(); }
    // A deletion is a change of its own, also of an item whose last edit was refused.
    [[nodiscard]] static int versionToPark(const Row& row) {
        return row.deleted != 0 ? -1 - row.version : row.version;
    }
    [[nodiscard]] bool isParked(const Row& row) const {
        return mParked.isParked(mKind.itemName, row.event_id, versionToPark(row));
    }
    void fail(const Row& row, const UpReply& reply);
    void endWith(const Row& row, const UpReply& reply, End end);
    [[nodiscard]] int readRows();
    [[nodiscard]] int dropMarks();

    // --- new items
    [[nodiscard]] int findSentItems();
    [[nodiscard]] int markAsSent(std::span<const Outgoing> items);
    [[nodiscard]] bool isNewToServer(const Row& row) const;
    // An item of an earlier run without an answer, while the list could not be read.
    [[nodiscard]] bool waitsForList(const Row& row) const;

    // --- items
    [[nodiscard]] std::vector<Row*> dirtyItems();
    [[nodiscard]] int sendDirty();
    // Reads and composes what goes out next.
    [[nodiscard]] std::vector<Outgoing> prepare(std::span<Row* const> rows);
    void sendItem(const Outgoing& item);
    void insertItem(const Outgoing& item);
    void updateItem(const Outgoing& item);
    void removeGone(Row& row, int version);
    void sendDeleted(Row& row);
    // PATCH between two looks at the etag: accepted with the etag that the row takes; gone; or anything else, which is noted.
    [[nodiscard]] UpAnswer update(const Row& row, const std::string& uri, const std::string& body,
                                  std::string* etag, CalendarRecord* server);
    [[nodiscard]] CalendarRecord converted(const UpReply& reply) const;
    void storeAnswer(const Outgoing& sent, int version, CalendarRecord server);
    void store(Row& row, int version, int expectedVersion, CalendarRecord server);
    // The records learn what the server calls them.
    [[nodiscard]] int writeBack();

    // --- instances of a series
    void sendInstances(Row& series, calendar_record_h record);
    void sendInstance(const Row& series, int seriesVersion, Row& row, calendar_record_h child);
    // Whether every date was taken.
    [[nodiscard]] bool sendDates(Row& series, calendar_record_h record);
    [[nodiscard]] bool sendDate(const Row& series, const std::string& date);
    // The record's version, or the one before what a user changed since the changes were looked for and what is not sent with
    // the row: an exception, or the series when only its exceptions are sent. It is still to be found.
    [[nodiscard]] int seenVersion(const Row& row, calendar_record_h record);
    [[nodiscard]] bool hasUnsentDates(const Row& series, calendar_record_h record);
    [[nodiscard]] Row* instanceRow(int seriesId, const std::string& recurrenceId);

    CalSyncSide& mSide;
    CalUpSyncTask& mTask;
    IStopQuery* const mpStopQuery;
    ParkedItems& mParked;
    const CalBookMetaData mBook;
    const CalItemKind& mKind;
    CalItemStore* mpStore = nullptr;

    CalendarRecordsAhead mRecords;
    std::list<Row> mRows;
    std::map<int, std::vector<Row*>> mInstances;  // by series
    std::vector<Sent> mSentItems;
    bool mSkipUnconfirmed = false;
    End mEnd = End::kNone;
    bool mIsInTrouble = false;
    int mResult = sync_result::kOk;
    int mSent = 0;
    std::string mFailure;
};
