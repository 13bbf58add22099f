// Every field of a contact between the feed, the device and the Atom entry that goes back.
#include <gtest/gtest.h>

#include <algorithm>
#include <set>
#include <tuple>

#include "contacts/ContactComposer.h"
#include "contacts/CtIdUtil.h"
#include "contacts/GroupComposer.h"
#include "platform/contacts_read.h"
#include "service/contacts/AtomReader.h"
#include "support/TestRoot.h"

using contacts_read::forEachChild;
using contacts_read::intOf;
using contacts_read::textOf;

namespace {

constexpr const char* kBase = "http://127.0.0.1/m8/feeds";
constexpr int kGroup = 17;

std::string kindRel(const std::string& word) {
    return std::string(ct_wire::kKindNamespace) + "#" + word;
}

CtJsonEntryConverter converter() {
    return CtJsonEntryConverter([](const std::string& uri) { return uri == "g1" ? kGroup : 0; });
}

ContactComposer composer() {
    return {kBase, [](const std::string& uri) { return uri == "g1" ? kGroup : 0; },
            [](int id) { return id == kGroup ? std::string("g1") : std::string(); }};
}

ContactsRecord recordOf(const Json& entry) {
    ContactsRecord record;
    EXPECT_EQ(converter().convert(entry.dump(), &record, 1, /*withPhoto=*/true), 0);
    return record;
}

Json sent(contacts_record_h record) {
    return readAtom(composer().compose(record, "\"e1\""));
}

// The same without what is kept of the server's entry: what the tables alone give.
Json sentFromTables(contacts_record_h record) {
    const std::string fields = composer().composeFields(record);
    Json entry = readAtom("<atom:entry>" + fields + "</atom:entry>");
    for (const char* member :
         {"gd$email", "gd$phoneNumber", "gd$im", "gd$organization", "gd$structuredPostalAddress",
          "gContact$event", "gContact$relation", "gContact$website"}) {
        if (entry.contains(member)) std::sort(entry[member].begin(), entry[member].end());
    }
    return entry;
}

Json typed(const Json& element, const std::string& attribute, const std::string& value) {
    Json copy = element;
    copy[attribute] = value;
    return copy;
}

// An entry with every word of every table and every field.
Json fullEntry() {
    Json entry = {
        {"gd$name",
         {{"gd$givenName", {{"$t", "Ada"}, {"yomi", "eida"}}},
          {"gd$additionalName", {{"$t", "King"}, {"yomi", "king"}}},
          {"gd$familyName", {{"$t", "Lovelace"}, {"yomi", "lavleis"}}},
          {"gd$namePrefix", {{"$t", "Countess"}}},
          {"gd$nameSuffix", {{"$t", "PhD"}}}}},
        {"gContact$nickname", {{"$t", "Enchantress"}}},
        {"gContact$birthday", {{"when", "1815-12-10"}}},
        {"content", {{"$t", "first\nsecond line & more"}}},
        {"gContact$groupMembershipInfo", {{{"href", std::string(kBase) + "/groups/default/base/g1"}}}},
        {"gContact$userDefinedField", {{{"key", "colour"}, {"value", "blue"}}}}};
    const auto fill = [&](const char* member, const Json& element, const CtTypeTable& types) {
        for (const CtTypeRow& row : types.rows) {
            const std::string word = types.isFragment ? kindRel(row.word) : row.word;
            entry[member].push_back(typed(element, types.attribute, word));
        }
        entry[member].push_back(typed(element, "label", "of my own"));
    };
    fill("gd$phoneNumber", {{"$t", "+44 20"}, {"primary", "true"}}, ct_mappings::kPhoneTypes);
    fill("gd$email", {{"address", "ada@x.example"}}, ct_mappings::kEmailTypes);
    fill("gd$organization",
         {{"gd$orgName", {{"$t", "Engine"}, {"yomi", "enjin"}}},
          {"gd$orgTitle", {{"$t", "Author"}}},
          {"gd$orgJobDescription", {{"$t", "notes"}}},
          {"gd$orgDepartment", {{"$t", "G"}}},
          {"gd$orgSymbol", {{"$t", "ENG"}}},
          {"gd$where", {{"valueString", "London"}}}},
         ct_mappings::kCompanyTypes);
    fill("gd$structuredPostalAddress",
         {{"primary", "true"},
          {"gd$street", {{"$t", "12 St James's Square"}}},
          {"gd$pobox", {{"$t", "1"}}},
          {"gd$neighborhood", {{"$t", "St James's"}}},
          {"gd$city", {{"$t", "London"}}},
          {"gd$region", {{"$t", "GL"}}},
          {"gd$postcode", {{"$t", "SW1"}}},
          {"gd$country", {{"$t", "UK"}}}},
         ct_mappings::kAddressTypes);
    fill("gContact$event", {{"gd$when", {{"startTime", "1835-07-08"}}}}, ct_mappings::kEventTypes);
    fill("gContact$relation", {{"$t", "William"}}, ct_mappings::kRelationTypes);
    fill("gContact$website", {{"href", "http://ada.example/?a=1&b=2"}}, ct_mappings::kWebsiteTypes);
    for (const CtTypeRow& row : contact_types::kProtocol) {
        entry["gd$im"].push_back(
            {{"address", "ada"}, {"rel", kindRel("other")}, {"protocol", kindRel(row.word)}});
    }
    entry["gd$im"].push_back({{"address", "ada"}, {"label", "pigeon"}});
    return entry;
}

class ContactMapping : public testing::Test {
protected:
    TestRoot mRoot;
};

}  // namespace

TEST_F(ContactMapping, EveryFieldComesBackByTheTables) {
    const Json entry = fullEntry();
    const ContactsRecord record = recordOf(entry);
    Json expected = entry;
    for (auto& [member, value] : expected.items()) {
        if (value.is_array()) std::sort(value.begin(), value.end());
    }
    const Json back = sentFromTables(record.get());
    for (const auto& [member, value] : expected.items())
        EXPECT_EQ(back.value(member, Json()), value) << member;
    EXPECT_EQ(back.size(), expected.size()) << back.dump();
}

TEST_F(ContactMapping, WhatTheDeviceDoesNotKnowGoesBackAsItWas) {
    Json entry = fullEntry();
    entry["id"] = {{"$t", "http://s/m8/feeds/contacts/a%40x.com/base/c1"}};
    entry["gd$name"]["gd$fullName"] = {{"$t", "Ada, Countess"}};
    entry["gd$email"].push_back({{"address", "b@x.example"}, {"rel", kindRel("main")}, {"displayName", "B"}});
    entry["gd$email"].push_back({{"rel", kindRel("home")}});
    entry["gd$structuredPostalAddress"].push_back(
        {{"rel", kindRel("home")}, {"gd$formattedAddress", {{"$t", "Somewhere\n1"}}}});
    entry["gContact$birthday"]["when"] = "--12-10";
    entry["gContact$groupMembershipInfo"].push_back(
        {{"href", "http://s/groups/a%40x.com/base/unknown"}, {"deleted", "false"}});
    entry["gContact$website"].push_back({{"rel", "home"}});
    entry["gContact$gender"] = {{"value", "female"}};
    entry["gContact$externalId"] = {{{"rel", "account"}, {"value", "42"}}};
    entry["gd$extendedProperty"] = {{"name", "x"}, {"value", "<y>"}};
    const ContactsRecord record = recordOf(entry);
    Json back = sent(record.get());
    EXPECT_EQ(back["category"]["term"], ct_wire::kContactTerm);
    EXPECT_EQ(back["gd$etag"], "\"e1\"");
    for (const auto& [member, value] : entry.items()) EXPECT_EQ(back.value(member, Json()), value) << member;

    // An edit of one element leaves the others as they were.
    forEachChild(record.get(), CONTACTS_CONTACT_EMAILS, [](contacts_record_h email) {
        if (textOf(email, CONTACTS_EMAIL_EMAIL) != "b@x.example") return;
        EXPECT_EQ(contacts_record_set_str(email, CONTACTS_EMAIL_EMAIL, "c@x.example"), 0);
    });
    back = sent(record.get());
    const Json edited = {{"address", "c@x.example"}, {"rel", kindRel("other")}};
    EXPECT_NE(std::find(back["gd$email"].begin(), back["gd$email"].end(), edited), back["gd$email"].end());
    EXPECT_EQ(back["gd$email"].size(), entry["gd$email"].size());
    EXPECT_EQ(back["gd$structuredPostalAddress"], entry["gd$structuredPostalAddress"]);
}

TEST_F(ContactMapping, WhatIsLostOnTheWayUpIsExactlyWhatIsListed) {
    using Row = std::tuple<std::string, int, std::string, int, std::string>;
    std::set<Row> lost;
    for (const CtSection* section : ct_mappings::kReadOrder) {
        if (section->types == nullptr) continue;
        std::set<int> codes = {0, 1};
        for (const CtTypeRow& row : section->types->rows) codes.insert(row.code);
        for (const CtTypeRow& row : section->types->labels) codes.insert(row.code);
        for (const int code : codes) {
            for (const char* label : {"", "L"}) {
                if (code > 1 && *label != '\0') continue;  // beside a word a label says nothing
                contacts_record_h raw = nullptr;
                ASSERT_EQ(contacts_record_create(_contacts_contact, &raw), 0);
                const ContactsRecord contact(raw);
                contacts_record_h child = nullptr;
                ASSERT_EQ(contacts_record_create(section->view, &child), 0);
                const unsigned field = section->fields.back().property;
                const bool isDate = section == &ct_mappings::kEvent;
                ASSERT_EQ(isDate
                              ? contacts_record_set_int(child, field, 20260301)
                              : contacts_record_set_str(
                                    child,
                                    section->fields[section == &ct_mappings::kAddress ? 1 : 0].property, "x"),
                          0);
                ASSERT_EQ(contacts_record_set_int(child, section->typeProperty, code), 0);
                ASSERT_EQ(contacts_record_set_str(child, section->labelProperty, label), 0);
                ASSERT_EQ(contacts_record_add_child_record(raw, section->children, child), 0);
                const ContactsRecord back = recordOf(sentFromTables(raw));
                int count = 0;
                forEachChild(back.get(), section->children, [&](contacts_record_h found) {
                    ++count;
                    const int codeBack = intOf(found, section->typeProperty);
                    const std::string labelBack = textOf(found, section->labelProperty);
                    if (codeBack != code || labelBack != label)
                        lost.emplace(section->member, code, label, codeBack, labelBack);
                });
                EXPECT_EQ(count, 1) << section->member << " " << code << " '" << label << "'";
            }
        }
    }
    std::set<Row> listed;
    for (const ct_mappings::CtLossyRow& row : ct_mappings::kLossyRows)
        listed.emplace(row.section->member, row.code, row.label, row.codeBack, row.labelBack);
    EXPECT_EQ(lost, listed);
}

TEST_F(ContactMapping, AnyTextIsWellFormedAndTheSame) {
    const std::string texts[] = {"a & b < c > d \" e ' f ]]> <![CDATA[x]]>",
                                 "\xD7\x90\xD7\x91\xE2\x80\x8F",
                                 "\xF0\x9F\x8E\x89",
                                 std::string(5000, 'x'),
                                 " tab\tline\nreturn\rend ",
                                 "</atom:entry>",
                                 "&amp;#1;"};
    for (const std::string& text : texts) {
        const Json entry = {{"gd$name", {{"gd$givenName", {{"$t", text}, {"yomi", text}}}}},
                            {"gd$email", {{{"address", text}, {"label", text}}}},
                            {"gContact$userDefinedField", {{{"key", text}, {"value", text}}}}};
        const Json back = sentFromTables(recordOf(entry).get());
        for (const auto& [member, value] : entry.items())
            EXPECT_EQ(back.value(member, Json()), value) << text;
    }
    const Json bare = {{"gContact$userDefinedField", {{{"key", "size"}}}}};
    const Json wanted = {{{"key", "size"}, {"value", ""}}};
    EXPECT_EQ(sentFromTables(recordOf(bare).get())["gContact$userDefinedField"], wanted)
        << "the wire wants a value";
    EXPECT_EQ(ctXmlEscape("a\x01\x1F\xEF\xBF\xBE\x08z"), "az") << "what XML cannot carry is left out";
    EXPECT_FALSE(readAtom("<atom:entry>" + ctXmlEscape("\xC3\x28 broken \xFF") + "</atom:entry>").is_null());
}

TEST_F(ContactMapping, AnElementThatNoNameCanBeMadeOfIsLeftOut) {
    for (const char* member : {"gd$em/il", "gd$", "gContact$a b", "gd$1x", "gd$a$b", "gd$a><b"}) {
        const Json entry = {{"gd$name", {{"gd$givenName", {{"$t", "Ada"}}}}},
                            {member, {{"$t", "x"}}},
                            {"gContact$hobby", {{"$t", "sums"}}}};
        const Json back = sent(recordOf(entry).get());
        ASSERT_FALSE(back.is_null()) << member;
        EXPECT_EQ(back["gContact$hobby"]["$t"], "sums");
        EXPECT_FALSE(back.contains(member));
    }
}

TEST_F(ContactMapping, UnreadableEntries) {
    struct Case {
        const char* entry;
        bool isReadable;
        unsigned children;
        unsigned property = CONTACTS_CONTACT_NUMBERS;
    };
    const Case cases[] = {
        {R"({"gd$phoneNumber":[{"rel":"x#home"}]})", false, 0},
        {R"({"gd$phoneNumber":[{"$t":"1"}]})", false, 0},
        {R"({"gd$phoneNumber":"1"})", false, 0},
        {R"({"gd$phoneNumber":[1]})", false, 0},
        {R"({"gd$phoneNumber":{"$t":"1","label":""}})", true, 1},
        {R"({"gd$phoneNumber":[{"$t":"1","rel":"#nobody knows"}]})", true, 1},
        {R"({"gContact$groupMembershipInfo":[{}]})", false, 0},
        {R"({"gContact$groupMembershipInfo":[{"href":"x/base/y"}]})", true, 1,
         CONTACTS_CONTACT_GROUP_RELATIONS},
        {R"({"gContact$event":[{"rel":"anniversary"}]})", true, 0, CONTACTS_CONTACT_EVENTS},
        {R"({"gContact$birthday":{"when":"--03-07"}})", true, 1, CONTACTS_CONTACT_EVENTS},
        {R"({"gContact$website":[{"rel":"home"}]})", true, 0, CONTACTS_CONTACT_URLS},
        {R"({"link":[{"rel":"x/rel#photo","gd$etag":"e"}]})", false, 0},
        {R"({"link":[{"rel":"x/rel#photo","href":"h/a.com/p"}]})", true, 0, CONTACTS_CONTACT_IMAGES},
        {R"({"link":[{"rel":"x/rel#photo","href":"h/a.com/p","gd$etag":"e"}]})", true, 1,
         CONTACTS_CONTACT_IMAGES},
        {R"({"link":[{"rel":"x/rel#photo","href":"h/a.com/../etc/passwd","gd$etag":"e"}]})", true, 0,
         CONTACTS_CONTACT_IMAGES},
        {"[]", false, 0},
        {"{", false, 0},
        {"{} trailing", false, 0},
    };
    for (const Case& row : cases) {
        ContactsRecord record;
        try {
            EXPECT_EQ(converter().convert(row.entry, &record, 1, true), 0);
            EXPECT_TRUE(row.isReadable) << row.entry;
            unsigned count = 0;
            EXPECT_EQ(contacts_record_get_child_record_count(record.get(), row.property, &count), 0);
            EXPECT_EQ(count, row.children) << row.entry;
        } catch (const JsonException&) {
            EXPECT_FALSE(row.isReadable) << row.entry;
        }
    }
}

TEST_F(ContactMapping, IdsAndDates) {
    struct Case {
        std::string (*take)(const std::string&);
        const char* href;
        const char* id;
    };
    const Case cases[] = {{CtIdUtil::idAfterBase, "http://s/contacts/a%40x.com/base/c1", "c1"},
                          {CtIdUtil::idAfterBase, "http://s/a.com/base/b.com/base/c2", "c2"},
                          {CtIdUtil::idAfterBase, "http://s/contacts/a%40x.org/base/c3", "c3"},
                          {CtIdUtil::idAfterFull, "http://s/contacts/a%40x.com/full/c4", "c4"},
                          {CtIdUtil::idAfterCom, "http://s/photos/media/a%40x.com/c5", "c5"},
                          {CtIdUtil::idAfterCom, "c6", "c6"}};
    for (const Case& row : cases) EXPECT_EQ(row.take(row.href), row.id) << row.href;
    const char* const segments[][2] = {{"6", "6"},         {"a/b?c", "a%2Fb%3Fc"}, {"a%3Ab%2f", "a%3Ab%2f"},
                                       {"100%", "100%25"}, {"%zz%4", "%25zz%254"}, {"a:b @\"", "a:b%20@%22"}};
    for (const auto& row : segments) {
        EXPECT_EQ(CtIdUtil::makeEditHref("B", CtItemType::kContact, row[0]),
                  std::string("B/contacts/default/full/") + row[1]);
    }
    EXPECT_EQ(CtIdUtil::makeEditHref("B", CtItemType::kGroup, "6"), "B/groups/default/full/6");
    EXPECT_EQ(CtIdUtil::makeEditHref("B", CtItemType::kPhoto, "6"), "");
    for (const std::string& bad :
         {std::string(), std::string("a/b"), std::string(".x"), std::string(201, 'x')})
        EXPECT_FALSE(CtIdUtil::isFileName(bad)) << bad;
    EXPECT_EQ(convertDateString("1985-03-07"), 19850307);
    for (const char* bad : {"--03-07", "", "1985-13-01", "soon"}) EXPECT_EQ(convertDateString(bad), 0) << bad;
    EXPECT_EQ(GroupComposer::compose("", "e"), "");
    const Json group = readAtom(GroupComposer::compose("A & B", "\"g\""));
    EXPECT_EQ(group["title"], (Json{{"$t", "A & B"}, {"type", "text"}}));
    EXPECT_EQ(group["category"]["term"], ct_wire::kGroupTerm);
}
