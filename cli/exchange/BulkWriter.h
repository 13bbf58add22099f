// BulkWriter.h: writes new records some hundred at a time, each lot in one transaction. A record that the store
// refuses is left out and told of; what was written before a failure of the store itself stays, and is counted.
#pragma once

#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "exchange/ImportReport.h"
#include "platform/calendar.h"

namespace exchange {

class BulkWriter {
public:
    struct Calls {
        int (*insertMany)(calendar_list_h list, const record_write_options_s& options);
        int (*insertOne)(calendar_record_h record, int* id, const record_write_options_s& options);
    };
    BulkWriter(const Calls& calls, ImportReport& report, bool isDryRun)
        : mCalls(calls), mReport(report), mIsDryRun(isDryRun) {}

    struct NewRecord {
        CalendarRecord record;
        std::string title;
        size_t line = 0;
        std::shared_ptr<void> needs;  // kept until the record is written
        size_t bytes = 0;             // of what it needs
    };
    void add(NewRecord record);
    // Must be called at the end. A Failure when the store cannot be written.
    void flush();

private:
    void writeEach();

    const Calls mCalls;
    ImportReport& mReport;
    const bool mIsDryRun;
    std::vector<NewRecord> mRecords;
    size_t mBytes = 0;
};

}  // namespace exchange
