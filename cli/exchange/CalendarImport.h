// CalendarImport.h: a calendar file into one calendar of the store.
#pragma once

#include <map>
#include <vector>

#include "exchange/BulkWriter.h"
#include "exchange/CalendarRecords.h"
#include "exchange/ICalendarReader.h"
#include "exchange/ImportOptions.h"
#include "exchange/ImportReport.h"

namespace exchange {

class CalendarImport {
public:
    // The calendar store must be open.
    CalendarImport(const ImportOptions& options, ImportReport& report);

    // Reads the whole file, then writes: a series and its instances may stand anywhere in it. A Failure when the file
    // or the store fails; the report then tells what was done.
    void run(ItemReader& reader);

private:
    void read(ItemReader& reader);
    // False when the item waits for a zone that may still come.
    bool take(const RawItem& raw, bool mayWait);
    void joinInstances();
    void join(CalendarItem& series, CalendarItem& instance);
    void decide(const CalendarItem& item, KnownItems& known, BulkWriter& writer);
    void settle(const CalendarItem& item, const KnownItems::Found& found, BulkWriter& writer);

    const ImportOptions& mOptions;
    ImportReport& mReport;
    CalendarRecords mRecords;
    TimeZones mZones;
    ICalendarReader mReader;
    std::vector<CalendarItem> mItems;
    std::vector<const CalendarItem*> mUndecided;
};

}  // namespace exchange
