// CalBookSnapshot: what one book holds before a comparison, read once: metadata rows and the state of the device's records.
// Owner: one syncEventPage run.   Threads: one worker. Memory: ids, uris, etags and versions, never event bodies.
#pragma once

#include <deque>
#include <map>
#include <string>
#include <string_view>
#include <unordered_map>
#include <unordered_set>
#include <utility>
#include <vector>

#include "calendar/CalItemKind.h"
#include "calendar/CalItemStore.h"

// The state of a record on the device.
struct CalRecordState {
    int version = 0;        // of its last write (a series: also of its exceptions)
    int ownVersion = 0;     // of its last write, exceptions left out
    int syncedVersion = 0;  // of the sync's own last write, 0 when it never wrote it
    std::string etag;       // as stored with the sync's own last write; only of a record without a row
    bool isBehind = false;  // its uid or etag is not its row's
    // Known of an item that may have reached the server:
    bool hasDates = false;      // cancelled instances
    std::string sentMark = {};  // of what it says now

    [[nodiscard]] bool isEnginesOwnWrite() const { return syncedVersion != 0 && syncedVersion == version; }
};

class CalBookSnapshot {
public:
    explicit CalBookSnapshot(const CalItemKind& kind) : mKind(kind) {}

    // Reads the rows and records of `book`.
    [[nodiscard]] int load(CalItemStore& store, const CalBookMetaData& book);

    [[nodiscard]] const CalItemKind& kind() const { return mKind; }
    [[nodiscard]] const CalBookMetaData& book() const { return mBook; }

    // The row of an ordinary event or series, or of an instance by its own uri; NULL when unknown.
    [[nodiscard]] const CalEventMetaData* rowByUri(const std::string& uri) const;
    [[nodiscard]] const CalEventMetaData* instanceRow(int seriesEventId,
                                                      const std::string& recurrenceId) const;
    // NULL when there is no such record on the device.
    [[nodiscard]] const CalRecordState* record(int eventId) const;
    // The id of a record that the sync once wrote for `uri` and that has no row, 0 when none.
    [[nodiscard]] int orphan(const std::string& uri) const;
    // The row of an item that may have reached the server and that was sent, or is now, with this mark; NULL when none.
    [[nodiscard]] const CalEventMetaData* unconfirmed(const std::string& mark) const;
    [[nodiscard]] bool hasUnconfirmed() const { return !mUnconfirmed.empty(); }
    // Rows that the server knows by a uri of their own: what a complete list may delete.
    [[nodiscard]] std::vector<const CalEventMetaData*> knownToServer() const;

    // Whether the row's record is gone although nobody deleted it: the next download makes it again.
    [[nodiscard]] bool isLost(const CalEventMetaData& row) const;
    // Whether the device's record holds a change that has not been sent: a mark, or a version that nobody but a user wrote.
    [[nodiscard]] bool hasLocalChange(const CalEventMetaData& row) const;
    // The same of any instance of a series.
    [[nodiscard]] bool hasChangedInstance(int seriesEventId) const;
    // Whether the record is older than its row: it was sent, and a kill came before it learned what the server made of it.
    [[nodiscard]] bool isBehindRow(const CalEventMetaData& row) const;
    // Whether a user wrote the record, or an exception of the series, since the change walk last looked.
    [[nodiscard]] bool hasUnseenChange(const CalEventMetaData& row) const;

    // Keeps the snapshot in step with what a page wrote.
    void put(const CalEventMetaData& row);
    void putRecord(int eventId, CalRecordState state);
    // The row of a series takes the version that a write of one of its instances gave to it.
    void setVersion(int seriesEventId, int version);

private:
    using InstanceKey = std::pair<int, std::string>;

    [[nodiscard]] int readRecordStates();
    void index(size_t position);
    void readUnconfirmed();

    const CalItemKind& mKind;
    CalBookMetaData mBook;
    std::deque<CalEventMetaData> mRows;                   // never moved
    std::unordered_map<std::string_view, size_t> mByUri;  // by the rows' own texts
    std::unordered_map<int, size_t> mByEventId;           // ordinary events
    std::map<InstanceKey, size_t> mInstances;
    std::unordered_map<int, CalRecordState> mRecords;
    std::unordered_map<std::string, int> mOrphans;  // by server id
    std::unordered_set<int> mDeletedByUser;         // not examined yet
    std::multimap<std::string, size_t>
        mUnconfirmed;  // rows by marks: of what was sent, and of what their records say
};
