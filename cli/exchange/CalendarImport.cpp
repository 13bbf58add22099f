#include "exchange/CalendarImport.h"

#include <algorithm>

#include "CalendarStore.h"
#include "Failure.h"
#include "TimeText.h"
#include "exchange/Identity.h"

namespace exchange {

namespace {

constexpr BulkWriter::Calls kCalendarCalls{
    [](calendar_list_h list, const record_write_options_s& options) {
        return calendar_db_insert_records(list, options);
    },
    [](calendar_record_h record, int* id, const record_write_options_s& options) {
        return calendar_db_insert_record(record, id, options);
    }};

std::string titleOf(const CalendarItem& item) {
    return item.fields.value("summary", "");
}

}  // namespace

CalendarImport::CalendarImport(const ImportOptions& options, ImportReport& report)
    : mOptions(options),
      mReport(report),
      mRecords(options.calendar),
      mZones(options.timeZone),
      mReader(mZones) {}

void CalendarImport::run(ItemReader& reader) {
    read(reader);
    joinInstances();
    KnownItems known = mRecords.known();
    BulkWriter writer(kCalendarCalls, mReport, mOptions.isDryRun);
    for (const CalendarItem& item : mItems) decide(item, known, writer);
    for (const CalendarItem* item : mUndecided)
        settle(*item, known.findByKeys(mRecords.keysOf(mRecords.say(mRecords.make(*item).get()))), writer);
    writer.flush();
}

// --- reading ----------------------------------------------------------------------------------------------------

void CalendarImport::read(ItemReader& reader) {
    std::vector<RawItem> waiting;
    RawItem raw;
    while (reader.next(&raw)) {
        if (raw.name == "VTIMEZONE") {
            mReader.defineZone(raw);
        } else if (!take(raw, /*mayWait=*/true)) {
            waiting.push_back(std::move(raw));
        }
    }
    for (const RawItem& one : waiting) take(one, /*mayWait=*/false);
    if (reader.cutAt() > 0) mReport.noteCut(reader.cutAt());
    std::stable_sort(mItems.begin(), mItems.end(),
                     [](const CalendarItem& a, const CalendarItem& b) { return a.line < b.line; });
}

bool CalendarImport::take(const RawItem& raw, bool mayWait) {
    const bool isTodo = raw.name == "VTODO";
    if (!isTodo && raw.name != "VEVENT") {
        mReport.notHeld().add(content_line::isName(raw.name) ? raw.name : "components");
        return true;
    }
    if (isTodo != mRecords.holdsTodos()) {
        mReport.countRead();
        mReport.skip(Skip::kOther, exchange::titleOf(raw), raw.firstLine,
                     isTodo ? "a to-do; the calendar holds events" : "an event; the calendar holds to-dos");
        return true;
    }
    NotHeld losses;
    try {
        CalendarItem item = mReader.read(raw, losses);
        if (mayWait && mReader.missedZone()) return false;
        // What the fields of an event or to-do may be is known there.
        static_cast<void>(mRecords.make(item));
        mItems.push_back(std::move(item));
    } catch (const Failure& problem) {
        mReport.countRead();
        mReport.skip(Skip::kUnread, exchange::titleOf(raw), raw.firstLine, problem.what());
        return true;
    }
    mReport.notHeld().merge(losses);
    return true;
}

void CalendarImport::join(CalendarItem& series, CalendarItem& instance) {
    Instance joined{std::move(instance.fields), instanceOf(series, *instance.recurrence), instance.line};
    for (const char* ofSeries : {"rrule", "exdates"}) joined.fields.erase(ofSeries);
    const Json cancelled = series.fields.value("exdates", Json::array());
    const std::string name = time_text::composeRfc3339(joined.recurrence);
    if (std::find(cancelled.begin(), cancelled.end(), name) != cancelled.end()) {
        mReport.notHeld().add("changed instances that are cancelled too");
        return;
    }
    const auto same = std::find_if(series.instances.begin(), series.instances.end(),
                                   [&](const Instance& one) { return one.recurrence == joined.recurrence; });
    if (same == series.instances.end()) {
        series.instances.push_back(std::move(joined));
        return;
    }
    mReport.notHeld().add("instances that are changed twice (the later counts)");
    *same = std::move(joined);
}

void CalendarImport::joinInstances() {
    std::map<std::string, size_t> series;
    for (size_t at = 0; at < mItems.size(); ++at) {
        const CalendarItem& item = mItems[at];
        if (!item.recurrence && !item.uid.empty() && item.fields.contains("rrule"))
            series.try_emplace(item.uid, at);
    }
    std::vector<CalendarItem> rest;
    for (size_t at = 0; at < mItems.size(); ++at) {
        CalendarItem& item = mItems[at];
        const auto found = item.recurrence ? series.find(item.uid) : series.end();
        if (found != series.end()) join(mItems[found->second], item);
        if (item.recurrence && found == series.end())
            mReport.notHeld().add("RECURRENCE-ID (without its series; taken as an event of its own)");
    }
    for (CalendarItem& item : mItems) {
        const bool isJoined = item.recurrence && series.contains(item.uid);
        if (!isJoined) rest.push_back(std::move(item));
    }
    mItems = std::move(rest);
}

// --- writing ----------------------------------------------------------------------------------------------------

void CalendarImport::decide(const CalendarItem& item, KnownItems& known, BulkWriter& writer) {
    mReport.countRead();
    const Json said = mRecords.say(mRecords.make(item).get());
    const std::string digest = identity::digestOf(said);
    if (known.isRepeated(item.uid, digest)) {
        mReport.skip(Skip::kSame, titleOf(item), item.line, "it stands in the file twice");
        return;
    }
    const KnownItems::Found found = known.find(item.uid, digest, mRecords.keysOf(said));
    if (found.match == Match::kUndecided) {
        mUndecided.push_back(&item);
    } else {
        settle(item, found, writer);
    }
}

void CalendarImport::settle(const CalendarItem& item, const KnownItems::Found& found, BulkWriter& writer) {
    switch (found.match) {
        case Match::kSame:
            mReport.skip(Skip::kSame, titleOf(item), item.line, "");
            return;
        case Match::kDiffers:
            if (!mOptions.replaces) {
                mReport.skip(Skip::kDiffers, titleOf(item), item.line,
                             "it differs from item " + std::to_string(found.id) +
                                 " there; --replace takes the file's");
                return;
            }
            if (!mOptions.isDryRun) mRecords.replace(found.id, item);
            mReport.countReplaced();
            return;
        case Match::kNew:
        case Match::kUndecided:
            writer.add({mRecords.make(item), titleOf(item), item.line, nullptr, 0});
            return;
    }
}

}  // namespace exchange
