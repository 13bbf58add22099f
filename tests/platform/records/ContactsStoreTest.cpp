// The contacts service through its public functions: what it has beyond the calendar's, above all the images.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <fstream>

#include "../../../platform/records/ContactsViews.h"
#include "platform/contacts.h"
#include "support/TestRoot.h"

using testing::ElementsAre;
using testing::IsEmpty;

namespace {

constexpr const char* kImages = "/opt/usr/data/records/contacts-images";

class Contacts : public testing::Test {
protected:
    Contacts() {
        EXPECT_EQ(contacts_connect_with_flags(0), 0);
        book = insert(make(_contacts_address_book));
    }
    ~Contacts() override { contacts_disconnect(); }

    static ContactsRecord make(const char* view) {
        contacts_record_h raw = nullptr;
        EXPECT_EQ(contacts_record_create(view, &raw), 0);
        return ContactsRecord(raw);
    }
    static int insert(const ContactsRecord& record) {
        int id = 0;
        EXPECT_EQ(contacts_db_insert_record(record.get(), &id), 0);
        return id;
    }
    ContactsRecord contact() const {
        ContactsRecord record = make(_contacts_contact);
        EXPECT_EQ(contacts_record_set_int(record.get(), CONTACTS_CONTACT_ADDRESS_BOOK_ID, book), 0);
        return record;
    }
    static void add(const ContactsRecord& record, unsigned property, ContactsRecord child) {
        EXPECT_EQ(contacts_record_add_child_record(record.get(), property, child.release()), 0);
    }
    static ContactsRecord image(const std::string& path) {
        ContactsRecord record = make(_contacts_image);
        EXPECT_EQ(contacts_record_set_str(record.get(), CONTACTS_IMAGE_PATH, path.c_str()), 0);
        return record;
    }
    static ContactsRecord get(int id) {
        contacts_record_h raw = nullptr;
        EXPECT_EQ(contacts_db_get_record(_contacts_contact, id, &raw), 0) << id;
        return ContactsRecord(raw);
    }
    static std::string imagePath(int id) {
        const ContactsRecord record = get(id);
        contacts_record_h child = nullptr;
        const char* path = nullptr;
        if (contacts_record_get_child_record_at_p(record.get(), CONTACTS_CONTACT_IMAGES, 0, &child) != 0)
            return "none";
        EXPECT_EQ(contacts_record_get_str_p(child, CONTACTS_IMAGE_PATH, &path), 0);
        return path;
    }
    // A photo in the device's temporary folder.
    std::string photo(const std::string& name, const std::string& content) const {
        std::filesystem::create_directories(root.at("/tmp"));
        std::ofstream(root.at("/tmp/" + name)) << content;
        return "/tmp/" + name;
    }
    std::string contentOf(const std::string& path) const {
        std::ifstream file(root.at(path));
        return {std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>()};
    }
    size_t imageCount() const {
        std::error_code error;
        const std::filesystem::directory_iterator files(root.at(kImages), error);
        return static_cast<size_t>(std::distance(begin(files), end(files)));
    }
    // The contacts' feed as "ID change[*]", * for a changed image.
    std::vector<std::string> feed(int since) const {
        contacts_list_h raw = nullptr;
        int current = 0;
        EXPECT_EQ(
            contacts_db_get_changes_by_version(_contacts_contact_updated_info, book, since, &raw, &current),
            0);
        const ContactsList list(raw);
        std::vector<std::string> entries;
        for (int code = contacts_list_first(raw); code == 0; code = contacts_list_next(raw)) {
            contacts_record_h record = nullptr;
            int id = 0, type = 0, isChanged = 0;
            EXPECT_EQ(contacts_list_get_current_record_p(raw, &record), 0);
            EXPECT_EQ(contacts_record_get_int(record, CONTACTS_UPDATED_INFO_ID, &id), 0);
            EXPECT_EQ(contacts_record_get_int(record, CONTACTS_UPDATED_INFO_TYPE, &type), 0);
            EXPECT_EQ(contacts_record_get_int(record, CONTACTS_UPDATED_INFO_IMAGE_CHANGED, &isChanged), 0);
            entries.push_back(std::to_string(id) + " " + "iud"[type] + (isChanged != 0 ? "*" : ""));
        }
        return entries;
    }
    static int version() {
        int value = 0;
        EXPECT_EQ(contacts_db_get_current_version(&value), 0);
        return value;
    }

    TestRoot root;
    int book = 0;
};

}  // namespace

TEST_F(Contacts, EveryFieldOfEveryChildComesBack) {
    using platform::records::Property;
    using platform::records::Type;
    const platform::records::View& view = *platform::records::contactsStore().viewOf(_contacts_contact);
    const ContactsRecord record = contact();
    int value = 0;
    const auto fill = [&](const ContactsRecord& child, const Property& property) {
        ++value;
        const std::string text = "it's \"" + std::to_string(value) + "\"";
        EXPECT_EQ(property.type == Type::kText
                      ? contacts_record_set_str(child.get(), property.id, text.c_str())
                      : contacts_record_set_int(child.get(), property.id, value),
                  0);
    };
    std::vector<unsigned> filled;
    for (const Property& property : view.properties) {
        if (property.childView == nullptr || property.id == view.filesProperty) continue;
        ContactsRecord child = make(property.childView);
        const auto* childView = platform::records::contactsStore().viewOf(property.childView);
        for (const Property& field : childView->properties) fill(child, field);
        add(record, property.id, std::move(child));
        filled.push_back(property.id);
    }
    EXPECT_EQ(filled.size(), 13U);
    const ContactsRecord back = get(insert(record));
    value = 0;
    for (const unsigned property : filled) {
        contacts_record_h child = nullptr;
        ASSERT_EQ(contacts_record_get_child_record_at_p(back.get(), property, 0, &child), 0);
        for (const Property& field : child->view().properties) {
            ++value;
            const char* text = nullptr;
            int number = 0;
            if (field.type == Type::kText) {
                EXPECT_EQ(contacts_record_get_str_p(child, field.id, &text), 0);
                EXPECT_EQ(text, "it's \"" + std::to_string(value) + "\"") << field.column;
            } else {
                EXPECT_EQ(contacts_record_get_int(child, field.id, &number), 0);
                EXPECT_EQ(number, value) << field.column;
            }
        }
    }
}

TEST_F(Contacts, ImagesAreCopiedAndGoWithTheirRecord) {
    const ContactsRecord record = contact();
    add(record, CONTACTS_CONTACT_IMAGES, image(photo("a", "first")));
    const int id = insert(record);
    std::filesystem::remove(root.at("/tmp/a"));
    const std::string first = imagePath(id);
    EXPECT_TRUE(first.starts_with(kImages)) << first;
    EXPECT_EQ(contentOf(first), "first");

    // A change of something else leaves the image alone; a copy of the contact has an image of its own.
    const int before = version();
    ContactsRecord changed = get(id);
    add(changed, CONTACTS_CONTACT_NOTES, make(_contacts_note));
    ASSERT_EQ(contacts_db_update_record(changed.get()), 0);
    EXPECT_EQ(imagePath(id), first);
    EXPECT_THAT(feed(before), ElementsAre(std::to_string(id) + " u"));
    const int copy = insert(get(id));
    EXPECT_NE(imagePath(copy), first);
    ASSERT_EQ(contacts_db_delete_record(_contacts_contact, copy), 0);
    EXPECT_EQ(contentOf(first), "first");
    EXPECT_EQ(imageCount(), 1U);

    const ContactsRecord replacement = contact();
    add(replacement, CONTACTS_CONTACT_IMAGES, image(photo("b", "second")));
    ASSERT_EQ(contacts_db_replace_record(replacement.get(), id), 0);
    EXPECT_EQ(contentOf(imagePath(id)), "second");
    EXPECT_EQ(imageCount(), 1U) << "the former image is gone";
    EXPECT_THAT(feed(before), ElementsAre(std::to_string(id) + " u*"));
    ASSERT_EQ(contacts_db_replace_record(contact().get(), id), 0);
    EXPECT_EQ(imagePath(id), "none");
    EXPECT_EQ(imageCount(), 0U);
}

TEST_F(Contacts, WhatIsUndoneOrRefusedLeavesTheImagesAsTheyWere) {
    const ContactsRecord record = contact();
    add(record, CONTACTS_CONTACT_IMAGES, image(photo("a", "kept")));
    const int id = insert(record);
    ASSERT_EQ(contacts_db_begin_transaction(), 0);
    const ContactsRecord other = contact();
    add(other, CONTACTS_CONTACT_IMAGES, image(photo("b", "undone")));
    insert(other);
    ASSERT_EQ(contacts_db_delete_record(_contacts_contact, id), 0);
    ASSERT_EQ(contacts_db_end_transaction(false), 0);
    EXPECT_EQ(contentOf(imagePath(id)), "kept");
    EXPECT_EQ(imageCount(), 1U);

    ASSERT_EQ(symlink("/etc/passwd", root.at("/tmp/link").c_str()), 0);
    std::filesystem::create_directory(root.at("/tmp/folder"));
    for (const char* path : {"/tmp/link", "/tmp/folder", "/tmp/missing", ""}) {
        const ContactsRecord bad = contact();
        add(bad, CONTACTS_CONTACT_IMAGES, image(path));
        EXPECT_NE(contacts_db_insert_record(bad.get(), nullptr), 0) << path;
    }
    EXPECT_EQ(imageCount(), 1U);
    EXPECT_EQ(feed(0).size(), 1U);
}

TEST_F(Contacts, AGroupTakesItsMembershipsAndABookEverything) {
    ContactsRecord group = make(_contacts_group);
    ASSERT_EQ(contacts_record_set_int(group.get(), CONTACTS_GROUP_ADDRESS_BOOK_ID, book), 0);
    const int groupId = insert(group);
    const ContactsRecord record = contact();
    ContactsRecord relation = make(_contacts_group_relation);
    ASSERT_EQ(contacts_record_set_int(relation.get(), CONTACTS_GROUP_RELATION_GROUP_ID, groupId), 0);
    add(record, CONTACTS_CONTACT_GROUP_RELATIONS, std::move(relation));
    add(record, CONTACTS_CONTACT_IMAGES, image(photo("a", "image")));
    const int id = insert(record);

    contacts_list_h raw = nullptr;
    int current = 0;
    ASSERT_EQ(contacts_db_get_changes_by_version(_contacts_group_updated_info, book, 0, &raw, &current), 0);
    const ContactsList groups(raw);
    int count = 0;
    EXPECT_EQ(contacts_list_get_count(raw, &count), 0);
    EXPECT_EQ(count, 1) << "contacts are in a feed of their own";
    ASSERT_EQ(contacts_db_delete_record(_contacts_group, groupId), 0);
    unsigned memberships = 9;
    ASSERT_EQ(
        contacts_record_get_child_record_count(get(id).get(), CONTACTS_CONTACT_GROUP_RELATIONS, &memberships),
        0);
    EXPECT_EQ(memberships, 0U);
    ASSERT_EQ(contacts_db_delete_record(_contacts_address_book, book), 0);
    EXPECT_EQ(imageCount(), 0U);
    EXPECT_THAT(feed(0), IsEmpty());
}
