#include "ContactsViews.h"

#include "platform/contacts.h"

namespace platform::records {

namespace {

constexpr Property readOnly(unsigned id, const char* column) {
    return {id, Type::kInt, column, 0, true};
}
constexpr Property children(unsigned id, const char* view) {
    return {id, Type::kChildren, nullptr, 0, false, view};
}
constexpr Property text(unsigned id, const char* column) {
    return {id, Type::kText, column};
}
constexpr Property number(unsigned id, const char* column) {
    return {id, Type::kInt, column};
}

constexpr Property kBookProperties[] = {
    readOnly(CONTACTS_ADDRESS_BOOK_ID, "id"),
    number(CONTACTS_ADDRESS_BOOK_ACCOUNT_ID, "account_id"),
    text(CONTACTS_ADDRESS_BOOK_NAME, "name"),
    number(CONTACTS_ADDRESS_BOOK_MODE, "mode"),
    readOnly(CONTACTS_ADDRESS_BOOK_VERSION, "version"),
    readOnly(CONTACTS_ADDRESS_BOOK_SYNCED_VERSION, "synced_version"),
};

constexpr Property kGroupProperties[] = {
    readOnly(CONTACTS_GROUP_ID, "id"),
    number(CONTACTS_GROUP_ADDRESS_BOOK_ID, "address_book_id"),
    text(CONTACTS_GROUP_NAME, "name"),
    text(CONTACTS_GROUP_SYSTEM_ID, "system_id"),
    number(CONTACTS_GROUP_IS_READ_ONLY, "is_read_only"),
    text(CONTACTS_GROUP_SYNC_DATA1, "sync_data1"),
    readOnly(CONTACTS_GROUP_VERSION, "version"),
    readOnly(CONTACTS_GROUP_SYNCED_VERSION, "synced_version"),
};

constexpr Property kContactProperties[] = {
    readOnly(CONTACTS_CONTACT_ID, "id"),
    number(CONTACTS_CONTACT_ADDRESS_BOOK_ID, "address_book_id"),
    readOnly(CONTACTS_CONTACT_VERSION, "version"),
    readOnly(CONTACTS_CONTACT_SYNCED_VERSION, "synced_version"),
    readOnly(CONTACTS_CONTACT_IMAGE_VERSION, "files_version"),
    children(CONTACTS_CONTACT_NAMES, _contacts_name),
    children(CONTACTS_CONTACT_NUMBERS, _contacts_number),
    children(CONTACTS_CONTACT_EMAILS, _contacts_email),
    children(CONTACTS_CONTACT_MESSENGERS, _contacts_messenger),
    children(CONTACTS_CONTACT_COMPANIES, _contacts_company),
    children(CONTACTS_CONTACT_ADDRESSES, _contacts_address),
    children(CONTACTS_CONTACT_EVENTS, _contacts_event),
    children(CONTACTS_CONTACT_RELATIONSHIPS, _contacts_relationship),
    children(CONTACTS_CONTACT_URLS, _contacts_url),
    children(CONTACTS_CONTACT_NICKNAMES, _contacts_nickname),
    children(CONTACTS_CONTACT_NOTES, _contacts_note),
    children(CONTACTS_CONTACT_IMAGES, _contacts_image),
    children(CONTACTS_CONTACT_GROUP_RELATIONS, _contacts_group_relation),
    children(CONTACTS_CONTACT_EXTENSIONS, _contacts_extension),
};

constexpr Property kNameProperties[] = {text(CONTACTS_NAME_FIRST, "first"),
                                        text(CONTACTS_NAME_LAST, "last"),
                                        text(CONTACTS_NAME_ADDITION, "addition"),
                                        text(CONTACTS_NAME_PREFIX, "prefix"),
                                        text(CONTACTS_NAME_SUFFIX, "suffix"),
                                        text(CONTACTS_NAME_PHONETIC_FIRST, "phonetic_first"),
                                        text(CONTACTS_NAME_PHONETIC_MIDDLE, "phonetic_middle"),
                                        text(CONTACTS_NAME_PHONETIC_LAST, "phonetic_last")};
constexpr Property kNumberProperties[] = {
    text(CONTACTS_NUMBER_NUMBER, "number"), number(CONTACTS_NUMBER_TYPE, "type"),
    text(CONTACTS_NUMBER_LABEL, "label"), number(CONTACTS_NUMBER_IS_DEFAULT, "is_default")};
constexpr Property kEmailProperties[] = {text(CONTACTS_EMAIL_EMAIL, "email"),
                                         number(CONTACTS_EMAIL_TYPE, "type"),
                                         text(CONTACTS_EMAIL_LABEL, "label")};
constexpr Property kMessengerProperties[] = {text(CONTACTS_MESSENGER_IM_ID, "im_id"),
                                             number(CONTACTS_MESSENGER_TYPE, "type"),
                                             text(CONTACTS_MESSENGER_LABEL, "label")};
constexpr Property kCompanyProperties[] = {text(CONTACTS_COMPANY_NAME, "name"),
                                           text(CONTACTS_COMPANY_PHONETIC_NAME, "phonetic_name"),
                                           text(CONTACTS_COMPANY_JOB_TITLE, "job_title"),
                                           text(CONTACTS_COMPANY_DEPARTMENT, "department"),
                                           text(CONTACTS_COMPANY_DESCRIPTION, "description"),
                                           text(CONTACTS_COMPANY_LOCATION, "location"),
                                           text(CONTACTS_COMPANY_LOGO, "logo"),
                                           number(CONTACTS_COMPANY_TYPE, "type"),
                                           text(CONTACTS_COMPANY_LABEL, "label")};
constexpr Property kAddressProperties[] = {
    text(CONTACTS_ADDRESS_POSTBOX, "postbox"), text(CONTACTS_ADDRESS_EXTENDED, "extended"),
    text(CONTACTS_ADDRESS_STREET, "street"),   text(CONTACTS_ADDRESS_LOCALITY, "locality"),
    text(CONTACTS_ADDRESS_REGION, "region"),   text(CONTACTS_ADDRESS_POSTAL_CODE, "postal_code"),
    text(CONTACTS_ADDRESS_COUNTRY, "country"), number(CONTACTS_ADDRESS_TYPE, "type"),
    text(CONTACTS_ADDRESS_LABEL, "label"),     number(CONTACTS_ADDRESS_IS_DEFAULT, "is_default")};
constexpr Property kEventProperties[] = {number(CONTACTS_EVENT_DATE, "date"),
                                         number(CONTACTS_EVENT_TYPE, "type"),
                                         text(CONTACTS_EVENT_LABEL, "label")};
constexpr Property kRelationshipProperties[] = {text(CONTACTS_RELATIONSHIP_NAME, "name"),
                                                number(CONTACTS_RELATIONSHIP_TYPE, "type"),
                                                text(CONTACTS_RELATIONSHIP_LABEL, "label")};
constexpr Property kUrlProperties[] = {text(CONTACTS_URL_URL, "url"), number(CONTACTS_URL_TYPE, "type"),
                                       text(CONTACTS_URL_LABEL, "label")};
constexpr Property kNicknameProperties[] = {text(CONTACTS_NICKNAME_NAME, "name")};
constexpr Property kNoteProperties[] = {text(CONTACTS_NOTE_NOTE, "note")};
constexpr Property kImageProperties[] = {text(CONTACTS_IMAGE_PATH, "path")};
constexpr Property kGroupRelationProperties[] = {number(CONTACTS_GROUP_RELATION_GROUP_ID, "group_id")};
constexpr Property kExtensionProperties[] = {number(CONTACTS_EXTENSION_DATA1, "data1"),
                                             text(CONTACTS_EXTENSION_DATA2, "data2"),
                                             text(CONTACTS_EXTENSION_DATA3, "data3")};

constexpr Property kContactInfoProperties[] = {
    {CONTACTS_UPDATED_INFO_ID, Type::kInt, nullptr},
    {CONTACTS_UPDATED_INFO_ADDRESS_BOOK_ID, Type::kInt, nullptr},
    {CONTACTS_UPDATED_INFO_TYPE, Type::kInt, nullptr},
    {CONTACTS_UPDATED_INFO_VERSION, Type::kInt, nullptr},
    {CONTACTS_UPDATED_INFO_SYNCED_VERSION, Type::kInt, nullptr},
    {CONTACTS_UPDATED_INFO_IMAGE_CHANGED, Type::kInt, nullptr},
};

constexpr View kContactInfo{
    .uri = _contacts_contact_updated_info, .role = Role::kInfo, .properties = kContactInfoProperties};
constexpr View kGroupInfo{
    .uri = _contacts_group_updated_info, .role = Role::kInfo, .properties = kContactInfoProperties};

constexpr FeedShape feedOf(const View& info, unsigned imageChanged) {
    return {.view = &info,
            .id = CONTACTS_UPDATED_INFO_ID,
            .book = CONTACTS_UPDATED_INFO_ADDRESS_BOOK_ID,
            .change = CONTACTS_UPDATED_INFO_TYPE,
            .version = CONTACTS_UPDATED_INFO_VERSION,
            .syncedVersion = CONTACTS_UPDATED_INFO_SYNCED_VERSION,
            .filesChanged = imageChanged};
}
constexpr FeedShape kContactFeed = feedOf(kContactInfo, CONTACTS_UPDATED_INFO_IMAGE_CHANGED);
constexpr FeedShape kGroupFeed = feedOf(kGroupInfo, 0);

constexpr View kBook{.uri = _contacts_address_book,
                     .role = Role::kBook,
                     .table = "address_books",
                     .properties = kBookProperties,
                     .idProperty = CONTACTS_ADDRESS_BOOK_ID};

// A membership goes with its group.
constexpr View kGroup{.uri = _contacts_group,
                      .role = Role::kItem,
                      .table = "groups",
                      .properties = kGroupProperties,
                      .idProperty = CONTACTS_GROUP_ID,
                      .bookProperty = CONTACTS_GROUP_ADDRESS_BOOK_ID,
                      .bookView = _contacts_address_book,
                      .feed = &kGroupFeed,
                      .onDelete = "DELETE FROM group_relations WHERE group_id = old.id"};

constexpr View kContact{.uri = _contacts_contact,
                        .role = Role::kItem,
                        .table = "contacts",
                        .properties = kContactProperties,
                        .idProperty = CONTACTS_CONTACT_ID,
                        .bookProperty = CONTACTS_CONTACT_ADDRESS_BOOK_ID,
                        .bookView = _contacts_address_book,
                        .feed = &kContactFeed,
                        .filesProperty = CONTACTS_CONTACT_IMAGES};

constexpr View kName{
    .uri = _contacts_name, .role = Role::kChild, .table = "names", .properties = kNameProperties};
constexpr View kNumber{
    .uri = _contacts_number, .role = Role::kChild, .table = "numbers", .properties = kNumberProperties};
constexpr View kEmail{
    .uri = _contacts_email, .role = Role::kChild, .table = "emails", .properties = kEmailProperties};
constexpr View kMessenger{.uri = _contacts_messenger,
                          .role = Role::kChild,
                          .table = "messengers",
                          .properties = kMessengerProperties};
constexpr View kCompany{
    .uri = _contacts_company, .role = Role::kChild, .table = "companies", .properties = kCompanyProperties};
constexpr View kAddress{
    .uri = _contacts_address, .role = Role::kChild, .table = "addresses", .properties = kAddressProperties};
constexpr View kEvent{
    .uri = _contacts_event, .role = Role::kChild, .table = "events", .properties = kEventProperties};
constexpr View kRelationship{.uri = _contacts_relationship,
                             .role = Role::kChild,
                             .table = "relationships",
                             .properties = kRelationshipProperties};
constexpr View kUrl{
    .uri = _contacts_url, .role = Role::kChild, .table = "urls", .properties = kUrlProperties};
constexpr View kNickname{
    .uri = _contacts_nickname, .role = Role::kChild, .table = "nicknames", .properties = kNicknameProperties};
constexpr View kNote{
    .uri = _contacts_note, .role = Role::kChild, .table = "notes", .properties = kNoteProperties};
constexpr View kImage{
    .uri = _contacts_image, .role = Role::kChild, .table = "images", .properties = kImageProperties};
constexpr View kGroupRelation{.uri = _contacts_group_relation,
                              .role = Role::kChild,
                              .table = "group_relations",
                              .properties = kGroupRelationProperties};
constexpr View kExtension{.uri = _contacts_extension,
                          .role = Role::kChild,
                          .table = "extensions",
                          .properties = kExtensionProperties};

// The position of a view is its bit in the notes of who wrote what: add at the end only.
constexpr const View* kViews[] = {&kBook,          &kGroup,     &kContact,     &kName,     &kNumber,
                                  &kEmail,         &kMessenger, &kCompany,     &kAddress,  &kEvent,
                                  &kRelationship,  &kUrl,       &kNickname,    &kNote,     &kImage,
                                  &kGroupRelation, &kExtension, &kContactInfo, &kGroupInfo};

}  // namespace

Store& contactsStore() {
    static Store* const store =
        new Store("/opt/usr/data/records/contacts.db", kViews, "/opt/usr/data/records/contacts-images");
    return *store;
}

const View* itemsOfFeed(const char* infoView) {
    for (const View* view : kViews) {
        if (view->feed != nullptr && infoView != nullptr && isSame(view->feed->view->uri, infoView))
            return view;
    }
    return nullptr;
}

}  // namespace platform::records
