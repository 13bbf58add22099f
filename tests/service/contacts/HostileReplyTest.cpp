// Replies of the contacts service that nobody sends in good faith, and texts that few think of.
#include <gtest/gtest.h>

#include "common/SyncResult.h"
#include "contacts/ContactComposer.h"
#include "contacts/CtFeedParsers.h"
#include "contacts/CtJsonOrbitPeopleConverter.h"
#include "contacts/GroupComposer.h"
#include "service/contacts/AtomReader.h"
#include "support/Hostile.h"

using sync_result::kFailed;
using sync_result::kOk;

namespace {

CtJsonEntryConverter hostileConverter() {
    return CtJsonEntryConverter([](const std::string&) { return 0; });
}

struct Reader {
    const char* name;
    int (*read)(const std::string& text);
    const char* good;  // what it takes
};
constexpr Reader kReaders[] = {
    {"contacts",
     [](const std::string& text) {
         CtContactPage page;
         return CtContactListJsonParser::parse(text, &page);
     },
     R"({"feed":{"entry":[]}})"},
    {"groups",
     [](const std::string& text) {
         CtGroupPage page;
         return CtGroupListJsonParser::parse(text, &page);
     },
     R"({"feed":{"entry":[]}})"},
    {"the answer to a write",
     [](const std::string& text) {
         CtEntryMetaData meta;
         return CtEntryMetaDataParser::getMetaData(text, &meta);
     },
     R"({"entry":{"gd$etag":"e","id":{"$t":"i"}}})"},
    {"token",
     [](const std::string& text) {
         std::string token;
         return CtAccessTokenParser::getAccessToken(text, &token);
     },
     R"({"access_token":"t"})"},
};

int readProfile(const std::string& text) {
    std::string url;
    ContactsRecord record;
    EXPECT_EQ(hostileConverter().convert("{}", &record, 1, false), kOk);
    const int result = CtJsonOrbitPeopleConverter::convert(text, record.get());
    EXPECT_EQ(CtJsonOrbitPeopleConverter::getPhotoUrl(text, "http://h", &url), result);
    return result;
}

// As XML can carry it.
std::string carried(std::string text) {
    std::erase_if(text, [](unsigned char c) { return c < 0x20 && c != '\t' && c != '\n' && c != '\r'; });
    for (size_t at = 0; (at = text.find("\xEF\xBF\xBE")) != std::string::npos;) text.erase(at, 3);
    return text;
}

}  // namespace

TEST(CtHostileReply, WhatIsNoReplyIsRefused) {
    for (const Reader& reader : kReaders) {
        SCOPED_TRACE(reader.name);
        EXPECT_EQ(reader.read(reader.good), kOk);
        for (const hostile::Body& body : hostile::badBodies(reader.good))
            EXPECT_EQ(reader.read(body.text), kFailed) << body.name;
    }
    for (const hostile::Body& body : hostile::badBodies("{}")) EXPECT_EQ(readProfile(body.text), kFailed);
}

TEST(CtHostileReply, NoFileOfTheSuiteIsTakenForAReply) {
    for (const hostile::Body& body : hostile::jsonSuite()) {
        for (const Reader& reader : kReaders)
            EXPECT_EQ(reader.read(body.text), kFailed) << reader.name << ", " << body.name;
        // A profile, and a contact, may be any object.
        const bool isObject = readProfile(body.text) == kOk;
        EXPECT_FALSE(isObject && body.name[0] == 'n') << body.name;
        ContactsRecord record;
        try {
            EXPECT_EQ(hostileConverter().convert(body.text, &record, 1, true), kOk);
            EXPECT_TRUE(isObject) << body.name;
        } catch (const JsonException&) {
            EXPECT_FALSE(isObject) << body.name;
        }
    }
}

TEST(CtHostileReply, AnyTextComesBackAsItWent) {
    const ContactComposer composer(
        "http://h", [](const std::string&) { return 0; }, [](int) { return std::string(); });
    for (const std::string& text : hostile::naughtyStrings()) {
        const Json entry = {{"gd$name", {{"gd$givenName", {{"$t", "g" + text}, {"yomi", "y" + text}}}}},
                            {"gContact$nickname", {{"$t", "n" + text}}},
                            {"content", {{"$t", "c" + text}}},
                            {"gd$email", {{{"address", "a" + text}, {"label", "l" + text}}}},
                            {"gd$phoneNumber", {{{"$t", "p" + text}, {"label", "l" + text}}}},
                            {"gContact$website", {{{"href", "h" + text}, {"rel", "home"}}}},
                            {"gContact$userDefinedField", {{{"key", "k" + text}, {"value", "v" + text}}}}};
        Json listed = entry;
        listed["id"]["$t"] = "http://h/base/" + text;
        listed["gd$etag"] = "e" + text;
        listed["title"]["$t"] = text;
        CtContactPage page;
        ASSERT_EQ(CtContactListJsonParser::parse(R"({"feed":{"entry":[)" + listed.dump() + "]}}", &page),
                  kOk);
        EXPECT_EQ(page.entries.size() + page.unreadable, 1U) << "one without an id is counted";
        if (!page.entries.empty()) {
            EXPECT_EQ(page.entries[0]->etag, "e" + text);
            EXPECT_EQ(page.entries[0]->title, text);
            EXPECT_EQ(Json::parse(page.entries[0]->jsonText()), listed);
        }
        ContactsRecord record;
        ASSERT_EQ(hostileConverter().convert(entry.dump(), &record, 1, false), kOk);
        const Json sent = readAtom("<atom:entry>" + composer.composeFields(record.get()) + "</atom:entry>");
        EXPECT_EQ(sent["gd$name"]["gd$givenName"]["$t"], "g" + carried(text));
        EXPECT_EQ(sent["gd$name"]["gd$givenName"]["yomi"], "y" + carried(text));
        EXPECT_EQ(sent["gContact$nickname"]["$t"], "n" + carried(text));
        EXPECT_EQ(sent["content"]["$t"], "c" + carried(text));
        EXPECT_EQ(sent["gd$email"][0]["address"], "a" + carried(text));
        EXPECT_EQ(sent["gd$email"][0]["label"], "l" + carried(text));
        EXPECT_EQ(sent["gd$phoneNumber"][0]["$t"], "p" + carried(text));
        EXPECT_EQ(sent["gContact$website"][0]["href"], "h" + carried(text));
        EXPECT_EQ(sent["gContact$userDefinedField"][0]["key"], "k" + carried(text));
        EXPECT_EQ(sent["gContact$userDefinedField"][0]["value"], "v" + carried(text));
        EXPECT_EQ(readAtom(GroupComposer::compose("t" + text, ""))["title"]["$t"], "t" + carried(text));
    }
}
