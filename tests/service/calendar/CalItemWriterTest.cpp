// What a page of server events does to the device, crash recovery and conflicts included.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "service/calendar/CalendarFixture.h"

using testing::ElementsAre;
using testing::IsEmpty;

namespace {

constexpr unsigned kSummary = CALENDAR_EVENT_SUMMARY;

// The row of an instance of the series "s".
CalEventMetaData instanceRow(CalendarFixture& device, int day) {
    CalEventMetaData row;
    EXPECT_EQ(device.manager.metaData()->getEvent(CalInstanceKey{device.row("s").event_id, recurrenceId(day)},
                                                  &row),
              0);
    return row;
}

std::string instanceUid(int day) {
    return "s_" + recurrenceId(day);
}

}  // namespace

TEST(CalItemWriter, ASecondListWithTheSameEtagsChangesNoStore) {
    CalendarFixture device;
    const std::vector<std::vector<Json>> list = {{event("a", "1"), series("s", "1")},
                                                 {instance("s", 3, "1"), cancelled("s", 4, "1")}};
    device.download(list);
    EXPECT_EQ(device.rowCount(), 4U);
    const int version = device.storeVersion();

    const CalItemWriter::Counts counts = device.download(list);

    EXPECT_EQ(counts.inserted + counts.updated + counts.deleted, 0);
    EXPECT_EQ(device.storeVersion(), version);
}

TEST(CalItemWriter, AChangedEtagReplacesTheRecordAndKeepsItsId) {
    CalendarFixture device;
    device.download({{event("a", "1", {{"location", "room"}})}});
    const int id = device.number("a", CALENDAR_EVENT_ID);

    device.download({{event("a", "2")}});

    EXPECT_EQ(device.number("a", CALENDAR_EVENT_ID), id);
    EXPECT_EQ(device.text("a", kSummary), "a 2");
    EXPECT_EQ(device.text("a", CALENDAR_EVENT_LOCATION), "");
    EXPECT_EQ(device.row("a").etag, "2");
    EXPECT_EQ(device.row("a").version, device.number("a", CALENDAR_EVENT_VERSION));
}

TEST(CalItemWriter, AnEditThatTheSyncHasNotSeenWinsAndTheRowTakesTheEtag) {
    CalendarFixture device;
    device.download({{event("a", "1")}});
    device.userSets("a", kSummary, "mine");

    device.download({{event("a", "2")}});

    EXPECT_EQ(device.text("a", kSummary), "mine");
    EXPECT_EQ(device.row("a").etag, "2");
    ASSERT_EQ(device.manager.setCalendarbookChanged(device.book.calendar_id), 0);
    EXPECT_EQ(device.row("a").dirty, 1) << "the edit must still be found";
}

TEST(CalItemWriter, ASeriesWaitsUntilTheEditOfItsInstanceWasSeen) {
    CalendarFixture device;
    device.download({{series("s", "1"), instance("s", 3, "1")}});
    ASSERT_EQ(device.manager.setCalendarbookChanged(device.book.calendar_id), 0);
    device.userSets(instanceUid(3), kSummary, "mine");

    device.download({{series("s", "2"), instance("s", 3, "1")}});

    EXPECT_THAT(device.summaries(), ElementsAre("mine", "s 1"));
    ASSERT_EQ(device.manager.setCalendarbookChanged(device.book.calendar_id), 0);
    EXPECT_EQ(instanceRow(device, 3).dirty, 1) << "the edit must still be found";
    device.download({{series("s", "2"), instance("s", 3, "1")}});
    EXPECT_THAT(device.summaries(), ElementsAre("mine", "s 2"));
}

TEST(CalItemWriter, AChangeThatCannotBeMarkedIsSeenAgain) {
    CalendarFixture device;
    device.download({{event("a", "1"), event("b", "1"), event("c", "1")}});
    const int calendar = device.book.calendar_id;
    ASSERT_EQ(device.manager.setCalendarbookChanged(calendar), 0);
    device.userSets("b", kSummary, "mine");
    device.userSets("a", kSummary, "mine");
    device.userDeletes("c");
    (void)device.userAdds("new");
    SyncDatabase& database = device.manager.metaData()->database();
    const std::string when[] = {"UPDATE ON eventsync_table WHEN new.uri = 'a'",
                                "UPDATE ON eventsync_table WHEN new.deleted = 1",
                                "INSERT ON eventsync_table"};
    for (const std::string& refused : when) {
        ASSERT_EQ(
            database.write(
                "CREATE TRIGGER refuse BEFORE " + refused + " BEGIN SELECT RAISE(ABORT, 'refused'); END", {}),
            0);
        EXPECT_EQ(device.manager.setCalendarbookChanged(calendar), -1) << refused;
        EXPECT_EQ(device.row("b").dirty, 0) << "all or nothing";
        ASSERT_EQ(database.write("DROP TRIGGER refuse", {}), 0);
    }
    ASSERT_EQ(device.manager.setCalendarbookChanged(calendar), 0);
    EXPECT_EQ(device.row("a").dirty + device.row("b").dirty + device.row("c").deleted, 3);
    EXPECT_EQ(device.rowCount(), 4U);
}

TEST(CalItemWriter, InstancesOfASeriesFollowTheServer) {
    struct Step {
        const char* name;
        std::vector<std::vector<Json>> list;
        std::vector<std::string> summaries;
        std::string dates;
    };
    const std::string day3 = "s_" + recurrenceId(3);
    const std::vector<Step> steps = {
        {"listed before its series, on another page",
         {{instance("s", 3, "1")}, {series("s", "1")}},
         {"s 1", day3 + " 1"},
         ""},
        {"changed again", {{series("s", "1"), instance("s", 3, "2")}}, {"s 1", day3 + " 2"}, ""},
        {"then cancelled", {{series("s", "1"), cancelled("s", 3, "3")}}, {"s 1"}, recurrenceId(3)},
        {"another one as well",
         {{series("s", "1"), cancelled("s", 3, "3"), cancelled("s", 4, "1")}},
         {"s 1"},
         recurrenceId(3) + ", " + recurrenceId(4)},
        {"the series changed: its dates stay",
         {{series("s", "2"), cancelled("s", 3, "3"), cancelled("s", 4, "1")}},
         {"s 2"},
         recurrenceId(3) + ", " + recurrenceId(4)},
        {"brought back, changed",
         {{series("s", "2"), instance("s", 3, "4"), cancelled("s", 4, "1")}},
         {"s 2", day3 + " 4"},
         recurrenceId(4)},
        {"the series changed: its exceptions stay",
         {{series("s", "3"), instance("s", 3, "4"), cancelled("s", 4, "1")}},
         {"s 3", day3 + " 4"},
         recurrenceId(4)},
        {"no longer listed", {{series("s", "3")}}, {"s 3"}, ""},
        {"the series is gone", {{}}, {}, "(no record)"},
    };
    CalendarFixture device;
    for (const Step& step : steps) {
        SCOPED_TRACE(step.name);
        device.download(step.list);
        EXPECT_EQ(device.summaries(), step.summaries);
        EXPECT_EQ(device.text("s", CALENDAR_EVENT_EXDATE), step.dates);
        ASSERT_EQ(device.manager.setCalendarbookChanged(device.book.calendar_id), 0);
        EXPECT_FALSE(device.manager.hasSomethingToSend(kAccount))
            << "the sync's own writes are no local changes";
    }
    EXPECT_EQ(device.rowCount(), 0U);
}

TEST(CalItemWriter, ACancelledInstanceHasARowThatNoTriggerTakes) {
    CalendarFixture device;
    device.download({{event("a", "1"), series("s", "1"), cancelled("s", 4, "1")}});
    EXPECT_EQ(instanceRow(device, 4).event_id, -device.row("s").event_id);

    device.download({{series("s", "1"), cancelled("s", 4, "1")}});  // "a" goes

    EXPECT_EQ(device.rowCount(), 2U);
}

TEST(CalItemWriter, RecordsWhoseRowsWereLostAreTakenOver) {
    CalendarFixture device;
    const std::vector<std::vector<Json>> list = {
        {event("a", "1"), event("b", "1"), series("s", "1"), instance("s", 3, "1")}};
    device.download(list);
    // The rows are gone, as after a kill between the two transactions; "b" was edited since.
    for (const char* uri : {"a", "b", "s"}) {
        ASSERT_EQ(device.manager.metaData()->deleteEvent(device.book.calendar_id, uri), 0);
    }
    ASSERT_EQ(device.rowCount(), 0U);
    device.userSets("b", kSummary, "mine");
    ASSERT_EQ(device.manager.setCalendarbookChanged(device.book.calendar_id), 0);
    EXPECT_EQ(device.rowCount(), 0U) << "own records without a row are the download's business";

    device.download(list);

    EXPECT_THAT(device.summaries(), ElementsAre("a 1", "mine", "s 1", instanceUid(3) + " 1"));
    EXPECT_EQ(device.rowCount(), 4U);
    EXPECT_EQ(device.row("a").dirty, 0);
    EXPECT_EQ(device.row("b").dirty, 1);
    EXPECT_EQ(instanceRow(device, 3).event_id, device.number(instanceUid(3), CALENDAR_EVENT_ID));
}

TEST(CalItemWriter, ARecordThatWasUpdatedBeforeItsRowIsNoLocalChange) {
    CalendarFixture device;
    device.download({{event("a", "1")}});
    const CalEventMetaData before = device.row("a");
    device.download({{event("a", "2")}});
    ASSERT_EQ(device.manager.metaData()->updateEvent(before), 0);  // as if killed before the row was written

    ASSERT_EQ(device.manager.setCalendarbookChanged(device.book.calendar_id), 0);
    EXPECT_EQ(device.row("a").dirty, 0);
    device.download({{event("a", "3")}});

    EXPECT_EQ(device.text("a", kSummary), "a 3");
}

TEST(CalItemWriter, ARecordThatDoesNotKnowWhatItsRowKnowsIsWritten) {
    CalendarFixture device;
    device.download({{event("a", "1"), event("b", "1"), series("s", "1"), instance("s", 3, "1")}});
    // As if killed after the upload's rows and before its records.
    for (const char* uri : {"a", "b", "s"}) {
        CalEventMetaData row = device.row(uri);
        row.etag = "2";
        ASSERT_EQ(device.manager.metaData()->updateItem(row), 0);
    }
    CalEventMetaData exception = instanceRow(device, 3);
    exception.etag = "2";
    ASSERT_EQ(device.manager.metaData()->updateItem(exception), 0);
    device.userSets("b", kSummary, "mine");
    const std::vector<std::vector<Json>> list = {
        {event("a", "2"), event("b", "2"), series("s", "2"), instance("s", 3, "2")}};

    device.download(list);

    EXPECT_THAT(device.summaries(), ElementsAre("a 2", "mine", "s 2", instanceUid(3) + " 2"));
    const int version = device.storeVersion();
    device.download(list);
    EXPECT_EQ(device.storeVersion(), version);
}

TEST(CalItemWriter, OnlyProofDeletes) {
    struct Case {
        const char* name;
        std::vector<Json> list;
        std::vector<std::string> left;
    };
    const std::vector<Case> cases = {
        {"listed with its id alone", {event("a", "1"), Json{{"id", "b"}}}, {"a 1", "b 1"}},
        {"an item without an id", {event("a", "1"), Json{{"etag", "1"}}}, {"a 1", "b 1"}},
        {"an item that cannot be converted",
         {event("a", "1"), event("b", "2", {{"start", "soon"}})},
         {"a 1", "b 1"}},
        {"listed twice", {event("a", "1"), event("a", "1"), event("b", "1")}, {"a 1", "b 1"}},
        {"not listed", {event("a", "1")}, {"a 1"}},
    };
    for (const Case& test : cases) {
        SCOPED_TRACE(test.name);
        CalendarFixture device;
        device.download({{event("a", "1"), event("b", "1")}});
        device.download({test.list});
        EXPECT_EQ(device.summaries(), test.left);
    }
}

TEST(CalItemWriter, AnEditBetweenTheListAndTheDeletionKeepsItsEvent) {
    CalendarFixture device;
    device.download({{event("a", "1"), event("b", "1")}});
    CalItemStore* store = device.manager.prepared();
    CalBookSnapshot snapshot(device.manager.kind());
    ASSERT_EQ(snapshot.load(*store, device.book), 0);
    CalItemWriter writer(store, &snapshot);
    device.userSets("a", kSummary, "mine");
    EXPECT_EQ(writer.deleteUnlisted(), 0);
    EXPECT_THAT(device.summaries(), ElementsAre("mine"));
}

TEST(CalItemWriter, AnUnlistedEventWithALocalChangeStaysUntilItWasSent) {
    CalendarFixture device;
    device.download({{event("a", "1"), event("b", "1")}});
    device.userSets("b", kSummary, "mine");

    device.download({{event("a", "1")}});
    EXPECT_THAT(device.summaries(), ElementsAre("a 1", "mine"));

    ASSERT_EQ(device.manager.setCalendarbookChanged(device.book.calendar_id), 0);
    device.download({{event("a", "1")}});
    EXPECT_THAT(device.summaries(), ElementsAre("a 1", "mine"));
}

TEST(CalItemWriter, AnEventThatWasNeverSentIsOnNoListOfKnownOnes) {
    CalendarFixture device;
    device.userAdds("mine");
    ASSERT_EQ(device.manager.setCalendarbookChanged(device.book.calendar_id), 0);

    device.download({{event("a", "1")}});

    EXPECT_THAT(device.summaries(), ElementsAre("a 1", "mine"));
    EXPECT_TRUE(device.manager.hasSomethingToSend(kAccount));
}

TEST(CalItemWriter, ADeletionThatTheSyncHasNotSeenIsNotUndone) {
    CalendarFixture device;
    device.download({{event("a", "1"), event("b", "1")}});
    device.userDeletes("b");

    device.download({{event("a", "1"), event("b", "2")}});

    EXPECT_THAT(device.summaries(), ElementsAre("a 1"));
    ASSERT_EQ(device.manager.setCalendarbookChanged(device.book.calendar_id), 0);
    EXPECT_EQ(device.row("b").deleted, 1);
}

TEST(CalItemWriter, APartialListLeavesEverythingElse) {
    CalendarFixture device;
    device.download({{event("a", "1"), event("b", "1")}});
    device.downloadPart({{event("a", "2")}});
    EXPECT_THAT(device.summaries(), ElementsAre("a 2", "b 1"));
}

TEST(CalLocalChanges, AreFoundOnceAndTheSyncsOwnNever) {
    CalendarFixture device;
    device.download({{event("a", "1"), event("b", "1"), series("s", "1"), instance("s", 3, "1")}});
    EXPECT_FALSE(device.manager.setChanged(device.book.calendar_id));
    const int added = device.userAdds("mine");
    device.userSets("a", kSummary, "edited");
    device.userDeletes("b");
    device.userSets(instanceUid(3), kSummary, "instance edited");
    EXPECT_TRUE(device.manager.setChanged(device.book.calendar_id));

    for (int walk = 0; walk < 2; ++walk) {
        ASSERT_EQ(device.manager.setCalendarbookChanged(device.book.calendar_id), 0);
        std::list<int> dirty;
        std::list<int> deleted;
        ASSERT_EQ(device.manager.getAllDirtyEventIds(kCalendarUri, &dirty), 0);
        ASSERT_EQ(device.manager.getAllDeletedEventIds(kCalendarUri, &deleted), 0);
        EXPECT_THAT(dirty, testing::UnorderedElementsAre(added, device.row("a").event_id,
                                                         instanceRow(device, 3).event_id))
            << "a series is not changed by its instance";
        EXPECT_THAT(deleted, ElementsAre(device.row("b").event_id));
        EXPECT_EQ(device.rowCount(), 5U);
    }
    EXPECT_FALSE(device.manager.setChanged(device.book.calendar_id));
}

TEST(CalDataManager, BooksFollowTheDeviceAndInterruptedSyncs) {
    CalendarFixture device;
    std::list<std::string> uris;
    // A book that the user deleted loses its rows, so that the download makes it again.
    ASSERT_EQ(calendar_db_delete_record(_calendar_book, device.book.calendar_id), PLATFORM_ERROR_NONE);
    ASSERT_EQ(device.manager.reconcileBooks(kAccount), 0);
    ASSERT_EQ(device.manager.getAllCalendarbookUri(kAccount, &uris), 0);
    EXPECT_THAT(uris, IsEmpty());

    // A book whose row was not written gets it.
    CalListInfo entry;
    entry.id = "second";
    entry.summary = "Second";
    ASSERT_EQ(device.manager.insertCalendarbook(kAccount, entry), 0);
    ASSERT_EQ(device.manager.metaData()->deleteCalendarbook(kAccount, "second"), 0);
    ASSERT_EQ(device.manager.reconcileBooks(kAccount), 0);
    ASSERT_EQ(device.manager.getAllCalendarbookUri(kAccount, &uris), 0);
    EXPECT_THAT(uris, ElementsAre("second"));
    // Another account's rows are not touched by it.
    ASSERT_EQ(device.manager.reconcileBooks(kAccount + 1), 0);
    ASSERT_EQ(device.manager.deleteAccount(kAccount + 1), 0);
    EXPECT_EQ(device.manager.getCalendarbookEtag(kAccount, "second", &uris.front()), 0);
}

TEST(CalDataManager, ABookShowsNameColourAndAccessRole) {
    CalendarFixture device;
    CalListInfo info;
    info.id = kCalendarUri;
    info.etag = "book-2";
    info.summary = "It's \"quoted\"";
    info.backgroundColor = "#0a141e";
    info.accessRole = "reader";
    ASSERT_EQ(device.manager.updateCalendarbooks(kAccount, {std::make_shared<CalListInfo>(std::move(info))}),
              0);
    calendar_record_h raw = nullptr;
    ASSERT_EQ(calendar_db_get_record(_calendar_book, device.book.calendar_id, &raw), PLATFORM_ERROR_NONE);
    const CalendarRecord book(raw);
    const char* text = nullptr;
    int mode = 0;
    ASSERT_EQ(calendar_record_get_str_p(raw, CALENDAR_BOOK_COLOR, &text), PLATFORM_ERROR_NONE);
    EXPECT_STREQ(text, "10.20.30.255");
    ASSERT_EQ(calendar_record_get_str_p(raw, CALENDAR_BOOK_NAME, &text), PLATFORM_ERROR_NONE);
    EXPECT_STREQ(text, "It's \"quoted\"");
    ASSERT_EQ(calendar_record_get_int(raw, CALENDAR_BOOK_MODE, &mode), PLATFORM_ERROR_NONE);
    EXPECT_EQ(mode, 1);
}
