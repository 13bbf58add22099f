// VCardMapping.h: the properties of cards beside the members of a contact's JSON, for both directions.
#pragma once

#include <span>
#include <string_view>

namespace exchange {

// --- texts: one property each ---------------------------------------------------------------------------------------
struct CardText {
    std::string_view property;
    std::string_view object;  // "name" or ""
    std::string_view member;
    std::string_view joint;  // between several in a card, of which a contact has one
};
inline constexpr CardText kCardTexts[] = {{"NICKNAME", "", "nickname", ", "},
                                          {"NOTE", "", "note", "\n\n"},
                                          {"X-PHONETIC-FIRST-NAME", "name", "phoneticFirst", " "},
                                          {"X-PHONETIC-MIDDLE-NAME", "name", "phoneticMiddle", " "},
                                          {"X-PHONETIC-LAST-NAME", "name", "phoneticLast", " "}};

// The parts of N and ADR, in the order of the value.
inline constexpr std::string_view kNameParts[] = {"last", "first", "middle", "prefix", "suffix"};
inline constexpr std::string_view kAddressParts[] = {"pobox",  "extended", "street", "city",
                                                     "region", "postcode", "country"};

// --- types: the words of TYPE, in capitals, joined with "," ----------------------------------------------------------
struct CardType {
    std::string_view types;
    std::string_view word;
    bool isOnlyRead = false;
};
inline constexpr CardType kPlainTypes[] = {{"HOME", "home"}, {"WORK", "work"}};
inline constexpr CardType kEmailTypes[] = {{"HOME", "home"},
                                           {"WORK", "work"},
                                           {"X-MOBILE", "mobile"},
                                           {"CELL", "mobile", true},
                                           {"MOBILE", "mobile", true}};
// The longer ones first: a row counts when all its words are there.
inline constexpr CardType kPhoneTypes[] = {{"WORK,FAX", "work_fax"},
                                           {"HOME,FAX", "home_fax"},
                                           {"WORK,CELL", "work_mobile"},
                                           {"WORK,PAGER", "work_pager"},
                                           {"CELL", "mobile"},
                                           {"MOBILE", "mobile", true},
                                           {"IPHONE", "mobile", true},
                                           {"FAX", "fax"},
                                           {"PAGER", "pager"},
                                           {"CAR", "car"},
                                           {"ISDN", "isdn"},
                                           {"X-ASSISTANT", "assistant"},
                                           {"HOME", "home"},
                                           {"WORK", "work"}};
inline constexpr CardType kCompanyTypes[] = {{"WORK", "work"}};
inline constexpr CardType kRelationTypes[] = {{"X-ASSISTANT", "assistant"},
                                              {"ASSISTANT", "assistant", true},
                                              {"X-BROTHER", "brother"},
                                              {"BROTHER", "brother", true},
                                              {"CHILD", "child"},
                                              {"X-DOMESTIC-PARTNER", "domestic-partner"},
                                              {"X-FATHER", "father"},
                                              {"FATHER", "father", true},
                                              {"FRIEND", "friend"},
                                              {"X-MANAGER", "manager"},
                                              {"MANAGER", "manager", true},
                                              {"X-MOTHER", "mother"},
                                              {"MOTHER", "mother", true},
                                              {"PARENT", "parent"},
                                              {"X-PARTNER", "partner"},
                                              {"PARTNER", "partner", true},
                                              {"X-REFERRED-BY", "referred-by"},
                                              {"KIN", "relative"},
                                              {"X-SISTER", "sister"},
                                              {"SISTER", "sister", true},
                                              {"SPOUSE", "spouse"}};
inline constexpr CardType kEventTypes[] = {
    {"X-BIRTHDAY", "birthday"}, {"X-ANNIVERSARY", "anniversary"}, {"ANNIVERSARY", "anniversary", true}};
// What older cards say of every address, and what nobody tells apart.
inline constexpr std::string_view kNoTypes[] = {"VOICE", "INTERNET", "PREF",   "MSG",  "TEXT",
                                                "OTHER", "POSTAL",   "PARCEL", "INTL", "DOM"};

// --- lists: one property for each object of a member -----------------------------------------------------------------
struct CardList {
    std::string_view property;
    std::string_view member;
    std::string_view value;  // member of the object
    std::span<const CardType> types;
    bool hasPrimary = false;
    bool isText = true;  // written escaped
};
inline constexpr CardList kCardLists[] = {{"EMAIL", "emails", "value", kEmailTypes},
                                          {"TEL", "phones", "value", kPhoneTypes, true},
                                          {"URL", "urls", "value", kPlainTypes, false, false}};

// --- companies: ORG and what belongs to it by its group --------------------------------------------------------------
struct CompanyText {
    std::string_view property;
    std::string_view member;
};
inline constexpr CompanyText kCompanyTexts[] = {{"TITLE", "title"},
                                                {"ROLE", "description"},
                                                {"X-VANTOR-ORG-LOCATION", "location"},
                                                {"X-VANTOR-ORG-SYMBOL", "symbol"}};

// --- messengers: the scheme of IMPP, and the properties that older cards have ----------------------------------------
struct CardMessenger {
    std::string_view scheme;
    std::string_view protocol;
    std::string_view property;
    bool isOnlyRead = false;
};
inline constexpr CardMessenger kMessengers[] = {{"x-vantor-talk", "VANTOR_TALK", ""},
                                                {"xmpp", "JABBER", "X-JABBER"},
                                                {"jabber", "JABBER", "", true},
                                                {"msnim", "MSN", "X-MSN"},
                                                {"msn", "MSN", "", true},
                                                {"ymsgr", "YAHOO", "X-YAHOO"},
                                                {"yahoo", "YAHOO", "", true},
                                                {"icq", "ICQ", "X-ICQ"},
                                                {"aim", "AIM", "X-AIM"},
                                                {"qq", "QQ", "X-QQ"},
                                                {"skype", "SKYPE", "X-SKYPE"},
                                                {"skype", "SKYPE", "X-SKYPE-USERNAME", true},
                                                {"x-im", "other", ""},
                                                {"im", "other", "", true}};

// --- properties of their own ------------------------------------------------------------------------------------

// Of the property in the same group.
inline constexpr std::string_view kLabelProperty = "X-ABLABEL";
// Any date but the first birthday and anniversary.
inline constexpr std::string_view kDateProperty = "X-ABDATE";
inline constexpr std::string_view kNamesProperty = "X-ABRELATEDNAMES";
// A field of the user's own; its label is the key.
inline constexpr std::string_view kFieldProperty = "X-VANTOR-FIELD";

// Bookkeeping of whoever wrote the card; nobody misses it. FN is made of the name.
inline constexpr std::string_view kSilentCardProperties[] = {
    "VERSION", "PRODID", "REV", "UID", "FN", "N", "X-ABUID", "X-ABSHOWAS", "KIND", "PROFILE"};

}  // namespace exchange
