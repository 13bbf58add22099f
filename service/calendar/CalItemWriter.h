// CalItemWriter: writes the items of one book page by page: plan, records in one transaction of the calendar service, rows
// in one transaction of the metadata store; and knows at the end what a complete list no longer holds.
// Owner: one syncEventPage run or one single-item call.   Threads: one worker.
// Errors: 0 or -1, logged. A page that could not be written leaves both stores as they were, or records without rows, which
// the next run takes over.
#pragma once

#include <map>
#include <string>
#include <unordered_map>
#include <unordered_set>
#include <vector>

#include "calendar/CalBookSnapshot.h"
#include "calendar/CalItemStore.h"
#include "calendar/CalPagePlan.h"

class CalItemWriter {
public:
    // Neither is owned; the snapshot is kept in step with what is written.
    CalItemWriter(CalItemStore* store, CalBookSnapshot* snapshot);

    // Counts the entries as listed and writes what is new or changed.
    [[nodiscard]] int writePage(const CalListPage& page);
    // Writes the instances that came before their series; those without a series are logged.
    [[nodiscard]] int writeWaiting();

    // Takes the entries that are ours from an earlier run whose answer was lost, and nothing else.
    [[nodiscard]] int adoptSent(const CalListPage& page);

    // --- after the last page
    // False when an item could not be read at all: then the list proves nothing.
    [[nodiscard]] bool listIsProof() const { return mListIsProof; }
    // Rows known to the server that no page listed, the instances of such series included.
    [[nodiscard]] std::vector<CalEventMetaData> unlisted() const;
    // Counts the ids of a second look as listed.
    void markListed(const CalListPage& page);
    // Deletes what is unlisted from the device and its rows. A row with a change that has not been sent stays.
    [[nodiscard]] int deleteUnlisted();

    struct Counts {
        int inserted = 0;
        int updated = 0;
        int deleted = 0;
    };
    [[nodiscard]] const Counts& counts() const { return mCounts; }

private:
    // What one transaction over the records has done so far.
    struct Batch {
        std::unordered_map<std::string, int> insertedIds;  // ordinary items, by uri
        std::map<int, int> seriesVersions;        // version that a child's or date's write gave to a series
        std::unordered_set<const void*> skipped;  // planned items whose record had moved on
    };

    [[nodiscard]] int write(CalPagePlan* plan);
    [[nodiscard]] int writeRecords(CalPagePlan* plan, Batch* batch);
    [[nodiscard]] int insertItems(CalPagePlan* plan, Batch* batch);
    [[nodiscard]] int updateItems(CalPagePlan* plan, Batch* batch);
    void resolveSeries(CalPagePlan* plan, Batch* batch);
    [[nodiscard]] int insertException(CalPagePlan* plan, Batch* batch);
    [[nodiscard]] int updateException(CalPagePlan* plan, Batch* batch);
    [[nodiscard]] int writeExceptions(CalPagePlan* plan, Batch* batch, bool isNew, int* count);
    [[nodiscard]] int deleteExceptions(const std::vector<PlannedInstance*>& instances, Batch* batch);
    [[nodiscard]] int writeExceptionDates(CalPagePlan* plan, Batch* batch);
    [[nodiscard]] int writeRows(CalPagePlan* plan, const Batch& batch);
    [[nodiscard]] int writeSeriesVersions(const CalPagePlan& plan, const Batch& batch);
    void remember(const CalPagePlan& plan, const Batch& batch);
    [[nodiscard]] int expectedSeriesVersion(int seriesId) const;
    void logKept(const CalEventMetaData& row) const;
    [[nodiscard]] std::vector<CalEventMetaData> deletable() const;
    [[nodiscard]] int deleteRecords(std::vector<CalEventMetaData>* gone, Batch* batch);
    [[nodiscard]] int deleteRows(const std::vector<CalEventMetaData>& gone, const Batch& batch);

    CalItemStore* const mpStore;
    CalBookSnapshot* const mpSnapshot;
    std::unordered_set<std::string> mListed;
    CalList mWaiting;
    bool mListIsProof = true;
    Counts mCounts;
};
