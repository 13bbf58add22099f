// CtMappings: the contact's fields between the feed's entries and the device's records: one table, read in both directions.
#pragma once

#include <span>

#include "contacts/CtWire.h"
#include "platform/contact_types.h"
#include "platform/contacts.h"

// A type code and its word on the wire: the fragment of a rel, or a plain word.
using CtTypeRow = contact_type_word_s;

struct CtTypeTable {
    std::span<const CtTypeRow> rows;
    bool isFragment = true;  // of the kind namespace
    int unknownCode = 0;     // of a word that is not in the table
    int labelCode = 1;       // of a type that only a label names
    const char* attribute = "rel";
    // Codes that go up as a label because the wire has no word for them.
    std::span<const CtTypeRow> labels = {};
    bool mustBeThere = false;  // an element with neither word nor label makes the entry unreadable
};

// What a code that is in no table goes up as.
inline constexpr const char* kCtOtherWord = "other";

// Where a field stands in its element.
enum class CtAt {
    kText,            // the element's own text
    kAttribute,       // an attribute of it
    kFlag,            // an attribute that is "true" or not there
    kDate,            // an attribute with a date
    kChildText,       // the text of a child element
    kChildAttribute,  // an attribute of a child element
    kChildDate,       // likewise, with a date
    kGroup,           // an attribute with the href of a group
};

struct CtField {
    CtAt at;
    const char* name;  // of the attribute, or of the child element
    unsigned property;
    const char* attribute = nullptr;  // of the child element
    bool readsText = false;           // a child's attribute that may also be listed as the child's text
};

// One kind of element and the child records that stand for it.
struct CtSection {
    const char* member;  // in the feed's JSON; with a colon for the "$" it is the element's name
    const char* view;
    unsigned children;  // property of the contact
    std::span<const CtField> fields;
    bool isList = true;
    const CtTypeTable* types = nullptr;
    unsigned typeProperty = 0;
    unsigned labelProperty = 0;
    // A property that tells the section's records from others of the view.
    unsigned markProperty = 0;
    int mark = 0;
    // The first field must be there: what is logged when it is not, and whether the whole entry is then unreadable.
    const char* missingText = nullptr;
    bool missingIsFatal = false;
    bool typeComesLast = false;     // of the attributes
    const char* restRel = nullptr;  // a rel for elements whose type is another attribute
};

namespace ct_mappings {

inline constexpr CtTypeRow kProtocolLabels[] = {{0, "Other"}, {11, "IRC"}, {5, "FACEBOOK"}};
inline constexpr CtTypeRow kEventRows[] = {{3, "anniversary"}};

inline constexpr CtTypeTable kPhoneTypes{.rows = contact_types::kPhone, .mustBeThere = true};
inline constexpr CtTypeTable kEmailTypes{.rows = contact_types::kEmail};
inline constexpr CtTypeTable kAddressTypes{.rows = contact_types::kAddress, .labelCode = 0};
inline constexpr CtTypeTable kCompanyTypes{.rows = contact_types::kCompany, .labelCode = 0};
inline constexpr CtTypeTable kProtocols{
    .rows = contact_types::kProtocol, .attribute = "protocol", .labels = kProtocolLabels};
inline constexpr CtTypeTable kRelationTypes{.rows = contact_types::kRelationship, .isFragment = false};
inline constexpr CtTypeTable kWebsiteTypes{
    .rows = contact_types::kUrl, .isFragment = false, .unknownCode = 1, .labelCode = 0};
inline constexpr CtTypeTable kEventTypes{.rows = kEventRows, .isFragment = false};

inline constexpr CtField kNameFields[] = {
    {CtAt::kChildText, "gd$givenName", CONTACTS_NAME_FIRST},
    {CtAt::kChildAttribute, "gd$givenName", CONTACTS_NAME_PHONETIC_FIRST, "yomi"},
    {CtAt::kChildText, "gd$additionalName", CONTACTS_NAME_ADDITION},
    {CtAt::kChildAttribute, "gd$additionalName", CONTACTS_NAME_PHONETIC_MIDDLE, "yomi"},
    {CtAt::kChildText, "gd$familyName", CONTACTS_NAME_LAST},
    {CtAt::kChildAttribute, "gd$familyName", CONTACTS_NAME_PHONETIC_LAST, "yomi"},
    {CtAt::kChildText, "gd$namePrefix", CONTACTS_NAME_PREFIX},
    {CtAt::kChildText, "gd$nameSuffix", CONTACTS_NAME_SUFFIX}};
inline constexpr CtField kNicknameFields[] = {{CtAt::kText, nullptr, CONTACTS_NICKNAME_NAME}};
inline constexpr CtField kBirthdayFields[] = {{CtAt::kDate, "when", CONTACTS_EVENT_DATE}};
inline constexpr CtField kNoteFields[] = {{CtAt::kText, nullptr, CONTACTS_NOTE_NOTE}};
inline constexpr CtField kPhoneFields[] = {{CtAt::kText, nullptr, CONTACTS_NUMBER_NUMBER},
                                           {CtAt::kFlag, "primary", CONTACTS_NUMBER_IS_DEFAULT}};
inline constexpr CtField kEmailFields[] = {{CtAt::kAttribute, "address", CONTACTS_EMAIL_EMAIL}};
inline constexpr CtField kImFields[] = {{CtAt::kAttribute, "address", CONTACTS_MESSENGER_IM_ID}};
// The symbol is kept where the device has room for a logo.
inline constexpr CtField kCompanyFields[] = {
    {CtAt::kChildText, "gd$orgName", CONTACTS_COMPANY_NAME},
    {CtAt::kChildAttribute, "gd$orgName", CONTACTS_COMPANY_PHONETIC_NAME, "yomi"},
    {CtAt::kChildText, "gd$orgTitle", CONTACTS_COMPANY_JOB_TITLE},
    {CtAt::kChildText, "gd$orgJobDescription", CONTACTS_COMPANY_DESCRIPTION},
    {CtAt::kChildText, "gd$orgDepartment", CONTACTS_COMPANY_DEPARTMENT},
    {CtAt::kChildText, "gd$orgSymbol", CONTACTS_COMPANY_LOGO},
    {CtAt::kChildAttribute, "gd$where", CONTACTS_COMPANY_LOCATION, "valueString", true}};
inline constexpr CtField kAddressFields[] = {{CtAt::kFlag, "primary", CONTACTS_ADDRESS_IS_DEFAULT},
                                             {CtAt::kChildText, "gd$street", CONTACTS_ADDRESS_STREET},
                                             {CtAt::kChildText, "gd$pobox", CONTACTS_ADDRESS_POSTBOX},
                                             {CtAt::kChildText, "gd$neighborhood", CONTACTS_ADDRESS_EXTENDED},
                                             {CtAt::kChildText, "gd$city", CONTACTS_ADDRESS_LOCALITY},
                                             {CtAt::kChildText, "gd$region", CONTACTS_ADDRESS_REGION},
                                             {CtAt::kChildText, "gd$postcode", CONTACTS_ADDRESS_POSTAL_CODE},
                                             {CtAt::kChildText, "gd$country", CONTACTS_ADDRESS_COUNTRY}};
inline constexpr CtField kEventFields[] = {{CtAt::kChildDate, "gd$when", CONTACTS_EVENT_DATE, "startTime"}};
inline constexpr CtField kRelationFields[] = {{CtAt::kText, nullptr, CONTACTS_RELATIONSHIP_NAME}};
inline constexpr CtField kWebsiteFields[] = {{CtAt::kAttribute, "href", CONTACTS_URL_URL}};
inline constexpr CtField kMembershipFields[] = {{CtAt::kGroup, "href", CONTACTS_GROUP_RELATION_GROUP_ID}};
inline constexpr CtField kUserDefinedFields[] = {{CtAt::kAttribute, "key", CONTACTS_EXTENSION_DATA2},
                                                 {CtAt::kAttribute, "value", CONTACTS_EXTENSION_DATA3}};

inline constexpr CtSection kName{.member = "gd$name",
                                 .view = _contacts_name,
                                 .children = CONTACTS_CONTACT_NAMES,
                                 .fields = kNameFields,
                                 .isList = false};
inline constexpr CtSection kNickname{.member = "gContact$nickname",
                                     .view = _contacts_nickname,
                                     .children = CONTACTS_CONTACT_NICKNAMES,
                                     .fields = kNicknameFields,
                                     .isList = false};
inline constexpr CtSection kBirthday{.member = "gContact$birthday",
                                     .view = _contacts_event,
                                     .children = CONTACTS_CONTACT_EVENTS,
                                     .fields = kBirthdayFields,
                                     .isList = false,
                                     .markProperty = CONTACTS_EVENT_TYPE,
                                     .mark = ct_wire::kBirthday};
inline constexpr CtSection kNote{.member = "content",
                                 .view = _contacts_note,
                                 .children = CONTACTS_CONTACT_NOTES,
                                 .fields = kNoteFields,
                                 .isList = false};
inline constexpr CtSection kEmail{.member = "gd$email",
                                  .view = _contacts_email,
                                  .children = CONTACTS_CONTACT_EMAILS,
                                  .fields = kEmailFields,
                                  .types = &kEmailTypes,
                                  .typeProperty = CONTACTS_EMAIL_TYPE,
                                  .labelProperty = CONTACTS_EMAIL_LABEL};
inline constexpr CtSection kPhone{.member = "gd$phoneNumber",
                                  .view = _contacts_number,
                                  .children = CONTACTS_CONTACT_NUMBERS,
                                  .fields = kPhoneFields,
                                  .types = &kPhoneTypes,
                                  .typeProperty = CONTACTS_NUMBER_TYPE,
                                  .labelProperty = CONTACTS_NUMBER_LABEL,
                                  .missingText = "Spec[phoneNumber.$t] out!",
                                  .missingIsFatal = true};
inline constexpr CtSection kIm{.member = "gd$im",
                               .view = _contacts_messenger,
                               .children = CONTACTS_CONTACT_MESSENGERS,
                               .fields = kImFields,
                               .types = &kProtocols,
                               .typeProperty = CONTACTS_MESSENGER_TYPE,
                               .labelProperty = CONTACTS_MESSENGER_LABEL,
                               .typeComesLast = true,
                               .restRel = kCtOtherWord};
inline constexpr CtSection kOrganization{.member = "gd$organization",
                                         .view = _contacts_company,
                                         .children = CONTACTS_CONTACT_COMPANIES,
                                         .fields = kCompanyFields,
                                         .types = &kCompanyTypes,
                                         .typeProperty = CONTACTS_COMPANY_TYPE,
                                         .labelProperty = CONTACTS_COMPANY_LABEL};
inline constexpr CtSection kAddress{.member = "gd$structuredPostalAddress",
                                    .view = _contacts_address,
                                    .children = CONTACTS_CONTACT_ADDRESSES,
                                    .fields = kAddressFields,
                                    .types = &kAddressTypes,
                                    .typeProperty = CONTACTS_ADDRESS_TYPE,
                                    .labelProperty = CONTACTS_ADDRESS_LABEL};
inline constexpr CtSection kEvent{.member = "gContact$event",
                                  .view = _contacts_event,
                                  .children = CONTACTS_CONTACT_EVENTS,
                                  .fields = kEventFields,
                                  .types = &kEventTypes,
                                  .typeProperty = CONTACTS_EVENT_TYPE,
                                  .labelProperty = CONTACTS_EVENT_LABEL,
                                  .missingText = "Spec[gd$when] out!"};
inline constexpr CtSection kRelation{.member = "gContact$relation",
                                     .view = _contacts_relationship,
                                     .children = CONTACTS_CONTACT_RELATIONSHIPS,
                                     .fields = kRelationFields,
                                     .types = &kRelationTypes,
                                     .typeProperty = CONTACTS_RELATIONSHIP_TYPE,
                                     .labelProperty = CONTACTS_RELATIONSHIP_LABEL};
inline constexpr CtSection kWebsite{.member = "gContact$website",
                                    .view = _contacts_url,
                                    .children = CONTACTS_CONTACT_URLS,
                                    .fields = kWebsiteFields,
                                    .types = &kWebsiteTypes,
                                    .typeProperty = CONTACTS_URL_TYPE,
                                    .labelProperty = CONTACTS_URL_LABEL,
                                    .missingText = "Spec[website.href] out!",
                                    .typeComesLast = true};
inline constexpr CtSection kMembership{.member = "gContact$groupMembershipInfo",
                                       .view = _contacts_group_relation,
                                       .children = CONTACTS_CONTACT_GROUP_RELATIONS,
                                       .fields = kMembershipFields,
                                       .missingText = "Spec[website.href] out!",
                                       .missingIsFatal = true};
inline constexpr CtSection kUserDefined{.member = "gContact$userDefinedField",
                                        .view = _contacts_extension,
                                        .children = CONTACTS_CONTACT_EXTENSIONS,
                                        .fields = kUserDefinedFields,
                                        .markProperty = CONTACTS_EXTENSION_DATA1,
                                        .mark = ct_wire::kUserDefinedExtension};

// The order in which an entry is read, and the order in which one is written.
inline constexpr const CtSection* kReadOrder[] = {
    &kName,         &kNickname, &kBirthday, &kNote,     &kEmail,   &kPhone,      &kIm,
    &kOrganization, &kAddress,  &kEvent,    &kRelation, &kWebsite, &kMembership, &kUserDefined};
inline constexpr const CtSection* kWriteOrder[] = {
    &kName, &kNickname,     &kPhone,      &kEmail,       &kIm,    &kRelation, &kWebsite,
    &kNote, &kOrganization, &kMembership, &kUserDefined, &kEvent, &kBirthday, &kAddress};

// Elements that only the server knows; they are carried over from the kept entry. Others that it may hold follow them.
inline constexpr const char* kExtensionElements[] = {"gContact:billingInformation",
                                                     "gContact:calendarLink",
                                                     "gContact:directoryServer",
                                                     "gContact:externalId",
                                                     "gContact:gender",
                                                     "gContact:hobby",
                                                     "gContact:initials",
                                                     "gContact:jot",
                                                     "gContact:language",
                                                     "gContact:maidenName",
                                                     "gContact:mileage",
                                                     "gContact:occupation",
                                                     "gContact:priority",
                                                     "gContact:sensitivity",
                                                     "gContact:shortName",
                                                     "gContact:subject",
                                                     "gContact:userDefinedField"};

// Types of the device that come back as another one after an upload, because the wire has no word for them.
struct CtLossyRow {
    const CtSection* section;
    int code;
    const char* label;
    int codeBack;
    const char* labelBack;
};
// The label "L" stands for any.
inline constexpr CtLossyRow kLossyRows[] = {
    {&kPhone, 1, "", 0, ""},        {&kPhone, 0, "L", 1, "L"},        {&kEmail, 1, "", 0, ""},
    {&kEmail, 0, "L", 1, "L"},      {&kIm, 0, "", 1, "Other"},        {&kIm, 1, "", 1, "Other"},
    {&kIm, 11, "", 1, "IRC"},       {&kIm, 5, "", 1, "FACEBOOK"},     {&kIm, 0, "L", 1, "L"},
    {&kOrganization, 1, "", 0, ""}, {&kOrganization, 1, "L", 0, "L"}, {&kAddress, 1, "", 0, ""},
    {&kAddress, 1, "L", 0, "L"},    {&kEvent, 1, "", 0, ""},          {&kEvent, 0, "L", 1, "L"},
    {&kRelation, 0, "L", 1, "L"},   {&kWebsite, 1, "", 0, ""},        {&kWebsite, 1, "L", 0, "L"},
};

}  // namespace ct_mappings
