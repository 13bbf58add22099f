// contacts.h: the device's contacts service: address books, groups, and contacts with all that belongs to one, in one SQLite file
// that all processes share, and their images in a folder beside it.
//
// Records, versions, change feeds, callbacks, threads and errors are those of calendar.h; an address book is what a calendar book is
// there. A child's write is an update of its contact.
//
// Images: the path of an image record is copied into the store's folder when the record is written (a link, or what is no regular
// file, is refused); the record then has the path of the copy, below the root as every path in a record. The copy goes with the
// record. Deleting an address book deletes its contacts, groups and images.
#pragma once

#include "platform/error.h"
#include "platform/record_types.h"

using contacts_record_h = platform::records::Record*;
using contacts_list_h = platform::records::RecordList*;
using contacts_query_h = platform::records::Query*;

// Views.
inline constexpr const char* _contacts_address_book = "contacts.address_book";
inline constexpr const char* _contacts_group = "contacts.group";
inline constexpr const char* _contacts_contact = "contacts.contact";
inline constexpr const char* _contacts_name = "contacts.name";
inline constexpr const char* _contacts_number = "contacts.number";
inline constexpr const char* _contacts_email = "contacts.email";
inline constexpr const char* _contacts_messenger = "contacts.messenger";
inline constexpr const char* _contacts_company = "contacts.company";
inline constexpr const char* _contacts_address = "contacts.address";
inline constexpr const char* _contacts_event = "contacts.event";
inline constexpr const char* _contacts_relationship = "contacts.relationship";
inline constexpr const char* _contacts_url = "contacts.url";
inline constexpr const char* _contacts_nickname = "contacts.nickname";
inline constexpr const char* _contacts_note = "contacts.note";
inline constexpr const char* _contacts_image = "contacts.image";
inline constexpr const char* _contacts_group_relation = "contacts.group_relation";
inline constexpr const char* _contacts_extension = "contacts.extension";
inline constexpr const char* _contacts_contact_updated_info = "contacts.contact_updated_info";
inline constexpr const char* _contacts_group_updated_info = "contacts.group_updated_info";

// Properties, as in calendar.h. A TYPE of 0 is none ("other"), 1 custom: then the LABEL names it.
enum contacts_property_e : unsigned {
    CONTACTS_ADDRESS_BOOK_ID = 0x1100,     // int, ro
    CONTACTS_ADDRESS_BOOK_ACCOUNT_ID,      // int; 0: a book of the device alone
    CONTACTS_ADDRESS_BOOK_NAME,            // str
    CONTACTS_ADDRESS_BOOK_MODE,            // int: 0 writable, 1 read-only
    CONTACTS_ADDRESS_BOOK_VERSION,         // int, ro
    CONTACTS_ADDRESS_BOOK_SYNCED_VERSION,  // int, ro

    CONTACTS_GROUP_ID = 0x1200,      // int, ro
    CONTACTS_GROUP_ADDRESS_BOOK_ID,  // int
    CONTACTS_GROUP_NAME,             // str
    CONTACTS_GROUP_SYSTEM_ID,        // str: of a group that the server defines
    CONTACTS_GROUP_IS_READ_ONLY,     // int
    CONTACTS_GROUP_SYNC_DATA1,       // str: the server's id of the group
    CONTACTS_GROUP_VERSION,          // int, ro
    CONTACTS_GROUP_SYNCED_VERSION,   // int, ro

    CONTACTS_CONTACT_ID = 0x1300,      // int, ro
    CONTACTS_CONTACT_ADDRESS_BOOK_ID,  // int
    CONTACTS_CONTACT_VERSION,  // int, ro: version of the last write of the contact or one of its children
    CONTACTS_CONTACT_SYNCED_VERSION,  // int, ro
    CONTACTS_CONTACT_IMAGE_VERSION,   // int, ro: version of the last write that changed an image
    CONTACTS_CONTACT_NAMES,           // children of _contacts_name
    CONTACTS_CONTACT_NUMBERS,
    CONTACTS_CONTACT_EMAILS,
    CONTACTS_CONTACT_MESSENGERS,
    CONTACTS_CONTACT_COMPANIES,
    CONTACTS_CONTACT_ADDRESSES,
    CONTACTS_CONTACT_EVENTS,
    CONTACTS_CONTACT_RELATIONSHIPS,
    CONTACTS_CONTACT_URLS,
    CONTACTS_CONTACT_NICKNAMES,
    CONTACTS_CONTACT_NOTES,
    CONTACTS_CONTACT_IMAGES,
    CONTACTS_CONTACT_GROUP_RELATIONS,
    CONTACTS_CONTACT_EXTENSIONS,

    CONTACTS_NAME_FIRST = 0x1400,  // str, as all of the name
    CONTACTS_NAME_LAST,
    CONTACTS_NAME_ADDITION,  // middle
    CONTACTS_NAME_PREFIX,
    CONTACTS_NAME_SUFFIX,
    CONTACTS_NAME_PHONETIC_FIRST,
    CONTACTS_NAME_PHONETIC_MIDDLE,
    CONTACTS_NAME_PHONETIC_LAST,

    CONTACTS_NUMBER_NUMBER = 0x1500,  // str
    CONTACTS_NUMBER_TYPE,  // int: 2 home, 4 work, 16 fax, 64 cell, 128 pager, 1024 car, 2048 ISDN, added up; 1 << 30 assistant
    CONTACTS_NUMBER_LABEL,       // str
    CONTACTS_NUMBER_IS_DEFAULT,  // int

    CONTACTS_EMAIL_EMAIL = 0x1600,  // str
    CONTACTS_EMAIL_TYPE,            // int: 2 home, 4 work, 8 mobile
    CONTACTS_EMAIL_LABEL,           // str

    CONTACTS_MESSENGER_IM_ID = 0x1700,  // str
    CONTACTS_MESSENGER_TYPE,            // int: the protocol
    CONTACTS_MESSENGER_LABEL,           // str

    CONTACTS_COMPANY_NAME = 0x1800,  // str
    CONTACTS_COMPANY_PHONETIC_NAME,  // str
    CONTACTS_COMPANY_JOB_TITLE,      // str
    CONTACTS_COMPANY_DEPARTMENT,     // str
    CONTACTS_COMPANY_DESCRIPTION,    // str
    CONTACTS_COMPANY_LOCATION,       // str
    CONTACTS_COMPANY_LOGO,           // str
    CONTACTS_COMPANY_TYPE,           // int: 2 work
    CONTACTS_COMPANY_LABEL,          // str

    CONTACTS_ADDRESS_POSTBOX = 0x1900,  // str
    CONTACTS_ADDRESS_EXTENDED,          // str
    CONTACTS_ADDRESS_STREET,            // str
    CONTACTS_ADDRESS_LOCALITY,          // str
    CONTACTS_ADDRESS_REGION,            // str
    CONTACTS_ADDRESS_POSTAL_CODE,       // str
    CONTACTS_ADDRESS_COUNTRY,           // str
    CONTACTS_ADDRESS_TYPE,              // int: 2 home, 4 work
    CONTACTS_ADDRESS_LABEL,             // str
    CONTACTS_ADDRESS_IS_DEFAULT,        // int

    CONTACTS_EVENT_DATE = 0x1a00,  // int: year * 10000 + month * 100 + day
    CONTACTS_EVENT_TYPE,           // int: 2 birthday, 3 anniversary
    CONTACTS_EVENT_LABEL,          // str

    CONTACTS_RELATIONSHIP_NAME = 0x1b00,  // str
    CONTACTS_RELATIONSHIP_TYPE,           // int
    CONTACTS_RELATIONSHIP_LABEL,          // str

    CONTACTS_URL_URL = 0x1c00,  // str
    CONTACTS_URL_TYPE,          // int: 2 home, 3 work
    CONTACTS_URL_LABEL,         // str

    CONTACTS_NICKNAME_NAME = 0x1d00,            // str
    CONTACTS_NOTE_NOTE = 0x1e00,                // str
    CONTACTS_IMAGE_PATH = 0x1f00,               // str
    CONTACTS_GROUP_RELATION_GROUP_ID = 0x2000,  // int

    CONTACTS_EXTENSION_DATA1 = 0x2100,  // int
    CONTACTS_EXTENSION_DATA2,           // str
    CONTACTS_EXTENSION_DATA3,           // str

    CONTACTS_UPDATED_INFO_ID = 0x2200,      // int: the changed contact or group
    CONTACTS_UPDATED_INFO_ADDRESS_BOOK_ID,  // int
    CONTACTS_UPDATED_INFO_TYPE,             // int: record_change_e
    CONTACTS_UPDATED_INFO_VERSION,          // int
    CONTACTS_UPDATED_INFO_SYNCED_VERSION,   // int
    CONTACTS_UPDATED_INFO_IMAGE_CHANGED,  // int: contacts only; 1 when an image was written after the version asked for
};

// The functions are those of calendar.h under names of their own.
[[nodiscard]] int contacts_connect_with_flags(unsigned flags);
int contacts_disconnect();

[[nodiscard]] int contacts_record_create(const char* view, contacts_record_h* out);
int contacts_record_destroy(contacts_record_h record, bool with_children);
[[nodiscard]] int contacts_record_clone(contacts_record_h record, contacts_record_h* out);
[[nodiscard]] int contacts_record_get_view(contacts_record_h record, const char** view);
[[nodiscard]] int contacts_record_get_int(contacts_record_h record, unsigned property, int* out);
[[nodiscard]] int contacts_record_get_str_p(contacts_record_h record, unsigned property, const char** out);
[[nodiscard]] int contacts_record_set_int(contacts_record_h record, unsigned property, int value);
[[nodiscard]] int contacts_record_set_str(contacts_record_h record, unsigned property, const char* value);
[[nodiscard]] int contacts_record_add_child_record(contacts_record_h record, unsigned property,
                                                   contacts_record_h child);
[[nodiscard]] int contacts_record_remove_child_record(contacts_record_h record, unsigned property,
                                                      contacts_record_h child);
[[nodiscard]] int contacts_record_get_child_record_count(contacts_record_h record, unsigned property,
                                                         unsigned* count);
[[nodiscard]] int contacts_record_get_child_record_at_p(contacts_record_h record, unsigned property,
                                                        unsigned index, contacts_record_h* child);

[[nodiscard]] int contacts_list_create(contacts_list_h* out);
int contacts_list_destroy(contacts_list_h list, bool with_records);
[[nodiscard]] int contacts_list_add(contacts_list_h list, contacts_record_h record);
[[nodiscard]] int contacts_list_get_count(contacts_list_h list, int* count);
[[nodiscard]] int contacts_list_first(contacts_list_h list);
[[nodiscard]] int contacts_list_next(contacts_list_h list);
[[nodiscard]] int contacts_list_get_current_record_p(contacts_list_h list, contacts_record_h* record);

[[nodiscard]] int contacts_query_create(const char* view, contacts_query_h* out);
int contacts_query_destroy(contacts_query_h query);
[[nodiscard]] int contacts_query_add_filter_int(contacts_query_h query, unsigned property, int value);
[[nodiscard]] int contacts_query_add_filter_str(contacts_query_h query, unsigned property, const char* value);
[[nodiscard]] int contacts_query_set_projection(contacts_query_h query, const unsigned* properties,
                                                size_t count);
[[nodiscard]] int contacts_query_set_sort(contacts_query_h query, unsigned property, bool ascending);

[[nodiscard]] int contacts_db_get_record(const char* view, int id, contacts_record_h* out);
[[nodiscard]] int contacts_db_get_records_by_id(const char* view, const int* ids, size_t count,
                                                contacts_record_h* out);
[[nodiscard]] int contacts_db_get_all_records(const char* view, int offset, int limit, contacts_list_h* out);
[[nodiscard]] int contacts_db_get_records_with_query(contacts_query_h query, int offset, int limit,
                                                     contacts_list_h* out);
using contacts_record_cb = void (*)(contacts_record_h record, void* user_data);
[[nodiscard]] int contacts_db_for_each_record(contacts_query_h query, contacts_record_cb use,
                                              void* user_data);
// `view` is _contacts_contact_updated_info or _contacts_group_updated_info.
[[nodiscard]] int contacts_db_get_changes_by_version(const char* view, int address_book_id, int version,
                                                     contacts_list_h* out, int* current_version);
[[nodiscard]] int contacts_db_for_each_change(const char* view, int address_book_id, int version,
                                              contacts_record_cb use, void* user_data, int* current_version);
[[nodiscard]] int contacts_db_get_current_version(int* version);
[[nodiscard]] int contacts_db_get_write_mark(uint64_t* mark);
[[nodiscard]] int contacts_db_get_last_change_version(int* version);

[[nodiscard]] int contacts_db_insert_record(contacts_record_h record, int* id,
                                            const record_write_options_s& options = {});
[[nodiscard]] int contacts_db_insert_records(contacts_list_h list,
                                             const record_write_options_s& options = {});
[[nodiscard]] int contacts_db_update_record(contacts_record_h record,
                                            const record_write_options_s& options = {});
[[nodiscard]] int contacts_db_update_records(contacts_list_h list,
                                             const record_write_options_s& options = {});
[[nodiscard]] int contacts_db_replace_record(contacts_record_h record, int id,
                                             const record_write_options_s& options = {});
[[nodiscard]] int contacts_db_replace_records(contacts_list_h list, const int* ids, size_t count,
                                              const record_write_options_s& options = {});
[[nodiscard]] int contacts_db_delete_record(const char* view, int id,
                                            const record_write_options_s& options = {});
[[nodiscard]] int contacts_db_delete_records(const char* view, const int* ids, size_t count,
                                             const record_write_options_s& options = {});
[[nodiscard]] int contacts_db_begin_transaction();
[[nodiscard]] int contacts_db_end_transaction(bool commit);

using contacts_db_changed_cb = void (*)(const char* view, void* user_data);
[[nodiscard]] int contacts_db_add_changed_cb(const char* view, contacts_db_changed_cb callback,
                                             void* user_data);
int contacts_db_remove_changed_cb(const char* view, contacts_db_changed_cb callback, void* user_data);

struct contacts_handle_deleter {
    void operator()(contacts_record_h record) const noexcept { contacts_record_destroy(record, true); }
    void operator()(contacts_list_h list) const noexcept { contacts_list_destroy(list, true); }
    void operator()(contacts_query_h query) const noexcept { contacts_query_destroy(query); }
};
using ContactsRecord = std::unique_ptr<platform::records::Record, contacts_handle_deleter>;
using ContactsList = std::unique_ptr<platform::records::RecordList, contacts_handle_deleter>;
using ContactsQuery = std::unique_ptr<platform::records::Query, contacts_handle_deleter>;
