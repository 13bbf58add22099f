// CalPagePlan: decides, for one page of server events, what is to be inserted, updated, left alone or taken over. A pure
// function of page and snapshot; nothing is written here. Everything is converted here, so that no transaction waits for it.
//
//   server          device's row          device's record       plan
//   listed          none                  none                  insert
//   listed          sent, no answer       says the same         the row takes id and etag
//   listed          none                  own, untouched        take over (its etag equal) or update
//   listed          none                  own, user edited it   take over as dirty: the device's change wins
//   etag equal      any                   any                   nothing; a lost record is inserted again, and one
//                                                               that does not know what its row knows is written
//   etag differs    clean                 as the sync left it   update
//   etag differs    dirty, deleted or a change not examined     row takes the etag: the device's change wins
// An instance of a series follows the same rules; one whose series is not there yet waits.
#pragma once

#include <list>
#include <string>
#include <vector>

#include "calendar/CalBookSnapshot.h"
#include "calendar/CalListInfo.h"
#include "platform/calendar.h"

// What becomes of the metadata row once the record is written.
enum class RowWrite { kInsert, kUpdate, kReplaceLost };

// An ordinary event or series to be written.
struct PlannedEvent {
    CalendarRecord record;  // NULL: only the row is written
    CalEventMetaData row;   // as it is to be stored; an insert's event_id comes from the store
    RowWrite rowWrite = RowWrite::kInsert;
    int expectedVersion = kAnyVersion;
    bool ownWrite = true;  // false: taken over with a user's change in it
    CalListInfoPtr
        sent;  // the server's answer that was lost: the record only learns what the server calls it
};

// An instance of a series to be written.
struct PlannedInstance {
    CalendarRecord record;  // NULL for a cancelled instance and when only the row is written
    CalEventMetaData row;
    RowWrite rowWrite = RowWrite::kInsert;
    std::string seriesUri;
    int childId = 0;        // the exception record that the instance has on the device, 0 when none
    bool addDate = false;   // the series' exception dates gain the recurrence id
    bool dropDate = false;  // ... lose it
    bool rowOnly = false;   // the device's change wins: the row takes the etag, nothing else
};

struct CalPagePlan {
    std::vector<PlannedEvent> events;
    std::vector<PlannedInstance> instances;
    CalList waiting;  // instances whose series is not known yet
};

// Whether the plan for the entry takes its content, for lists that come without.
[[nodiscard]] bool needsContent(const CalListInfo& entry, const CalBookSnapshot& snapshot);

// An entry that cannot be converted is logged and left out.
CalPagePlan planPage(const CalList& entries, const CalBookSnapshot& snapshot);
