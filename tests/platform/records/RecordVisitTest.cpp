// Reading records one at a time, through the public functions.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sqlite3.h>

#include <string>
#include <vector>

#include "platform/contacts_read.h"
#include "support/TestRoot.h"

using contacts_read::intOf;
using contacts_read::textOf;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::UnorderedElementsAreArray;

namespace {

class RecordVisit : public testing::Test {
protected:
    RecordVisit() {
        EXPECT_EQ(contacts_connect_with_flags(0), 0);
        book = insert(_contacts_address_book, 0, 0);
        otherBook = insert(_contacts_address_book, 0, 0);
    }
    ~RecordVisit() override { contacts_disconnect(); }

    static int insert(const char* view, unsigned bookProperty, int book, contacts_record_h* child = nullptr) {
        contacts_record_h raw = nullptr;
        EXPECT_EQ(contacts_record_create(view, &raw), 0);
        const ContactsRecord record(raw);
        if (bookProperty != 0) {
            EXPECT_EQ(contacts_record_set_int(raw, bookProperty, book), 0);
        }
        if (child != nullptr) {
            EXPECT_EQ(contacts_record_add_child_record(raw, CONTACTS_CONTACT_NOTES, *child), 0);
        }
        int id = 0;
        EXPECT_EQ(contacts_db_insert_record(raw, &id, {.by_sync = child != nullptr}), 0);
        return id;
    }
    static int contact(int book, const std::string& note) {
        contacts_record_h child = nullptr;
        EXPECT_EQ(contacts_record_create(_contacts_note, &child), 0);
        EXPECT_EQ(contacts_record_set_str(child, CONTACTS_NOTE_NOTE, note.c_str()), 0);
        return insert(_contacts_contact, CONTACTS_CONTACT_ADDRESS_BOOK_ID, book, &child);
    }

    TestRoot root;
    int book = 0;
    int otherBook = 0;
};

}  // namespace

TEST_F(RecordVisit, EachRecordComesOnceWithItsOwnChildren) {
    constexpr int kMoreThanAreReadAtOnce = 300;
    std::vector<std::string> expected;
    ASSERT_EQ(contacts_db_begin_transaction(), 0);
    for (int i = 0; i < kMoreThanAreReadAtOnce; ++i) {
        const std::string note = "note " + std::to_string(i);
        expected.push_back(std::to_string(contact(book, note)) + " " + note);
        contact(otherBook, "of the other book");
    }
    expected.push_back(std::to_string(insert(_contacts_contact, CONTACTS_CONTACT_ADDRESS_BOOK_ID, book)));
    ASSERT_EQ(contacts_db_end_transaction(true), 0);

    std::vector<std::string> found;
    EXPECT_EQ(
        contacts_read::forEachPart(_contacts_contact, CONTACTS_CONTACT_ADDRESS_BOOK_ID, book,
                                   {CONTACTS_CONTACT_ID, CONTACTS_CONTACT_NOTES},
                                   [&found](contacts_record_h record) {
                                       std::string text = std::to_string(intOf(record, CONTACTS_CONTACT_ID));
                                       contacts_read::forEachChild(
                                           record, CONTACTS_CONTACT_NOTES, [&text](contacts_record_h note) {
                                               text += " " + textOf(note, CONTACTS_NOTE_NOTE);
                                           });
                                       found.push_back(text);
                                   }),
        0);
    EXPECT_THAT(found, UnorderedElementsAreArray(expected));
}

TEST_F(RecordVisit, WhatIsNotReadHasItsDefault) {
    const int id = contact(book, "kept");
    int read = 0;
    const auto look = [&read](contacts_record_h record) {
        EXPECT_EQ(intOf(record, CONTACTS_CONTACT_ADDRESS_BOOK_ID), 0);
        contacts_record_h copy = nullptr;
        EXPECT_EQ(contacts_record_clone(record, &copy), 0);
        const ContactsRecord owned(copy);
        EXPECT_EQ(intOf(copy, CONTACTS_CONTACT_ID), intOf(record, CONTACTS_CONTACT_ID));
        ++read;
    };
    EXPECT_EQ(
        contacts_read::forEachPart(_contacts_contact, CONTACTS_CONTACT_ID, id, {CONTACTS_CONTACT_ID}, look),
        0);
    EXPECT_EQ(read, 1);

    contacts_query_h rawQuery = nullptr;
    ASSERT_EQ(contacts_query_create(_contacts_contact, &rawQuery), 0);
    const ContactsQuery sorted(rawQuery);
    ASSERT_EQ(contacts_query_set_sort(rawQuery, CONTACTS_CONTACT_ID, true), 0);
    EXPECT_EQ(contacts_db_for_each_record(
                  rawQuery, [](contacts_record_h, void*) {}, nullptr),
              PLATFORM_ERROR_INVALID_PARAMETER);
    EXPECT_EQ(contacts_db_for_each_record(
                  nullptr, [](contacts_record_h, void*) {}, nullptr),
              PLATFORM_ERROR_INVALID_PARAMETER);
}

TEST_F(RecordVisit, TheFeedTellsTheSameInTheSameOrder) {
    const int first = contact(book, "a");
    const int second = insert(_contacts_contact, CONTACTS_CONTACT_ADDRESS_BOOK_ID, book);
    const int third = contact(book, "b");
    contact(otherBook, "c");
    EXPECT_EQ(contacts_db_delete_record(_contacts_contact, first), 0);
    int current = 0;
    std::vector<std::string> entries;
    const auto note = [&entries](contacts_record_h change) {
        entries.push_back(std::to_string(intOf(change, CONTACTS_UPDATED_INFO_ID)) + " " +
                          "iud"[intOf(change, CONTACTS_UPDATED_INFO_TYPE)]);
    };
    EXPECT_EQ(contacts_read::forEachChange(_contacts_contact_updated_info, book, 0, &current, note), 0);
    EXPECT_THAT(entries, ElementsAre(std::to_string(second) + " i", std::to_string(third) + " i",
                                     std::to_string(first) + " d"));
    int version = 0;
    EXPECT_EQ(contacts_db_get_current_version(&version), 0);
    EXPECT_EQ(current, version);
    entries.clear();
    EXPECT_EQ(contacts_read::forEachChange(_contacts_contact_updated_info, book, version, &current, note), 0);
    EXPECT_THAT(entries, IsEmpty());
    EXPECT_NE(contacts_read::forEachChange(_contacts_contact, book, 0, &current, note), 0) << "no feed";
}

TEST_F(RecordVisit, TheFeedForgetsTheOldestOfVeryManyDeletions) {
    const int first = contact(book, "a");
    const int second = contact(book, "b");
    EXPECT_EQ(contacts_db_delete_record(_contacts_contact, first), 0);
    sqlite3* other = nullptr;
    ASSERT_EQ(sqlite3_open(root.at("/opt/usr/data/records/contacts.db").c_str(), &other), SQLITE_OK);
    EXPECT_EQ(sqlite3_exec(other,
                           "WITH RECURSIVE n(x) AS (SELECT 1 UNION ALL SELECT x + 1 FROM n WHERE x < 262143) "
                           "INSERT INTO tombstones SELECT 'gone', x, 1, 1, 1, 1 FROM n",
                           nullptr, nullptr, nullptr),
              SQLITE_OK);
    sqlite3_close(other);
    const auto listed = [this] {
        std::vector<int> ids;
        int current = 0;
        EXPECT_EQ(contacts_read::forEachChange(_contacts_contact_updated_info, book, 0, &current,
                                               [&ids](contacts_record_h change) {
                                                   ids.push_back(intOf(change, CONTACTS_UPDATED_INFO_ID));
                                               }),
                  0);
        return ids;
    };
    EXPECT_THAT(listed(), testing::Contains(first)) << "the most that is kept";
    EXPECT_EQ(contacts_db_delete_record(_contacts_contact, second), 0);
    EXPECT_THAT(listed(), ElementsAre(second));
}
