// ContactFields.h: the members of a contact's JSON beside the records that keep them: one table, read in both directions.
#pragma once

#include <span>
#include <string_view>

#include "platform/contact_types.h"
#include "platform/contacts.h"

// A text of which a contact has at most one.
struct ContactText {
    std::string_view name;  // "name.first" stands in the object "name"
    const char* view;
    unsigned children;  // property of the contact
    unsigned property;
    bool isAlone = false;  // nothing else stands in the record, so that it goes with its text
};

struct ContactItemField {
    enum class Kind { kText, kFlag, kDate };
    std::string_view name;
    Kind kind;
    unsigned property;
};

struct ContactTypeField {
    std::string_view name;
    std::span<const contact_type_word_s> words;
    int customCode;  // of a type that only a label names
    unsigned code;
    unsigned label;
};

// A list of objects, each a child record of the contact.
struct ContactItems {
    std::string_view name;
    const char* view;
    unsigned children;  // property of the contact
    std::span<const ContactItemField> fields;
    bool needsFirst = true;  // an object without its first field says nothing
    const ContactTypeField* type = nullptr;
    // A property that tells the list's records from others of the view.
    unsigned markProperty = 0;
    int mark = 0;
};

namespace contact_fields {

using Kind = ContactItemField::Kind;

// In the order of the documentation.
inline constexpr ContactText kTexts[] = {
    {"name.first", _contacts_name, CONTACTS_CONTACT_NAMES, CONTACTS_NAME_FIRST},
    {"name.middle", _contacts_name, CONTACTS_CONTACT_NAMES, CONTACTS_NAME_ADDITION},
    {"name.last", _contacts_name, CONTACTS_CONTACT_NAMES, CONTACTS_NAME_LAST},
    {"name.prefix", _contacts_name, CONTACTS_CONTACT_NAMES, CONTACTS_NAME_PREFIX},
    {"name.suffix", _contacts_name, CONTACTS_CONTACT_NAMES, CONTACTS_NAME_SUFFIX},
    {"name.phoneticFirst", _contacts_name, CONTACTS_CONTACT_NAMES, CONTACTS_NAME_PHONETIC_FIRST},
    {"name.phoneticMiddle", _contacts_name, CONTACTS_CONTACT_NAMES, CONTACTS_NAME_PHONETIC_MIDDLE},
    {"name.phoneticLast", _contacts_name, CONTACTS_CONTACT_NAMES, CONTACTS_NAME_PHONETIC_LAST},
    {"nickname", _contacts_nickname, CONTACTS_CONTACT_NICKNAMES, CONTACTS_NICKNAME_NAME, true},
    {"note", _contacts_note, CONTACTS_CONTACT_NOTES, CONTACTS_NOTE_NOTE, true},
};

inline constexpr contact_type_word_s kEventWords[] = {{2, "birthday"}, {3, "anniversary"}};

inline constexpr ContactTypeField kEmailType{"type", contact_types::kEmail, 1, CONTACTS_EMAIL_TYPE,
                                             CONTACTS_EMAIL_LABEL};
inline constexpr ContactTypeField kPhoneType{"type", contact_types::kPhone, 1, CONTACTS_NUMBER_TYPE,
                                             CONTACTS_NUMBER_LABEL};
inline constexpr ContactTypeField kAddressType{"type", contact_types::kAddress, 0, CONTACTS_ADDRESS_TYPE,
                                               CONTACTS_ADDRESS_LABEL};
inline constexpr ContactTypeField kCompanyType{"type", contact_types::kCompany, 0, CONTACTS_COMPANY_TYPE,
                                               CONTACTS_COMPANY_LABEL};
inline constexpr ContactTypeField kProtocol{"protocol", contact_types::kProtocol, 1, CONTACTS_MESSENGER_TYPE,
                                            CONTACTS_MESSENGER_LABEL};
inline constexpr ContactTypeField kEventType{"type", kEventWords, 1, CONTACTS_EVENT_TYPE,
                                             CONTACTS_EVENT_LABEL};
inline constexpr ContactTypeField kRelationType{"type", contact_types::kRelationship, 1,
                                                CONTACTS_RELATIONSHIP_TYPE, CONTACTS_RELATIONSHIP_LABEL};
inline constexpr ContactTypeField kUrlType{"type", contact_types::kUrl, 0, CONTACTS_URL_TYPE,
                                           CONTACTS_URL_LABEL};

inline constexpr ContactItemField kEmailItem[] = {{"value", Kind::kText, CONTACTS_EMAIL_EMAIL}};
inline constexpr ContactItemField kPhoneItem[] = {{"value", Kind::kText, CONTACTS_NUMBER_NUMBER},
                                                  {"primary", Kind::kFlag, CONTACTS_NUMBER_IS_DEFAULT}};
inline constexpr ContactItemField kAddressItem[] = {{"street", Kind::kText, CONTACTS_ADDRESS_STREET},
                                                    {"pobox", Kind::kText, CONTACTS_ADDRESS_POSTBOX},
                                                    {"extended", Kind::kText, CONTACTS_ADDRESS_EXTENDED},
                                                    {"city", Kind::kText, CONTACTS_ADDRESS_LOCALITY},
                                                    {"region", Kind::kText, CONTACTS_ADDRESS_REGION},
                                                    {"postcode", Kind::kText, CONTACTS_ADDRESS_POSTAL_CODE},
                                                    {"country", Kind::kText, CONTACTS_ADDRESS_COUNTRY},
                                                    {"primary", Kind::kFlag, CONTACTS_ADDRESS_IS_DEFAULT}};
inline constexpr ContactItemField kCompanyItem[] = {
    {"name", Kind::kText, CONTACTS_COMPANY_NAME},
    {"title", Kind::kText, CONTACTS_COMPANY_JOB_TITLE},
    {"department", Kind::kText, CONTACTS_COMPANY_DEPARTMENT},
    {"description", Kind::kText, CONTACTS_COMPANY_DESCRIPTION},
    {"location", Kind::kText, CONTACTS_COMPANY_LOCATION},
    {"symbol", Kind::kText, CONTACTS_COMPANY_LOGO}};
inline constexpr ContactItemField kMessengerItem[] = {{"value", Kind::kText, CONTACTS_MESSENGER_IM_ID}};
inline constexpr ContactItemField kEventItem[] = {{"date", Kind::kDate, CONTACTS_EVENT_DATE}};
inline constexpr ContactItemField kRelationItem[] = {{"name", Kind::kText, CONTACTS_RELATIONSHIP_NAME}};
inline constexpr ContactItemField kUrlItem[] = {{"value", Kind::kText, CONTACTS_URL_URL}};
inline constexpr ContactItemField kOwnItem[] = {{"key", Kind::kText, CONTACTS_EXTENSION_DATA2},
                                                {"value", Kind::kText, CONTACTS_EXTENSION_DATA3}};

// Extension records with fields that users define themselves; others are the sync engine's.
inline constexpr int kOwnFieldMark = 321;

// In the order of the documentation; "groups", "note" and "photo" stand before the last.
inline constexpr ContactItems kLists[] = {
    {"emails", _contacts_email, CONTACTS_CONTACT_EMAILS, kEmailItem, true, &kEmailType},
    {"phones", _contacts_number, CONTACTS_CONTACT_NUMBERS, kPhoneItem, true, &kPhoneType},
    {"addresses", _contacts_address, CONTACTS_CONTACT_ADDRESSES, kAddressItem, false, &kAddressType},
    {"companies", _contacts_company, CONTACTS_CONTACT_COMPANIES, kCompanyItem, false, &kCompanyType},
    {"messengers", _contacts_messenger, CONTACTS_CONTACT_MESSENGERS, kMessengerItem, true, &kProtocol},
    {"events", _contacts_event, CONTACTS_CONTACT_EVENTS, kEventItem, false, &kEventType},
    {"relations", _contacts_relationship, CONTACTS_CONTACT_RELATIONSHIPS, kRelationItem, true,
     &kRelationType},
    {"urls", _contacts_url, CONTACTS_CONTACT_URLS, kUrlItem, true, &kUrlType},
    {"fields", _contacts_extension, CONTACTS_CONTACT_EXTENSIONS, kOwnItem, true, nullptr,
     CONTACTS_EXTENSION_DATA1, kOwnFieldMark},
};

}  // namespace contact_fields
