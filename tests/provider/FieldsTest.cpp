#include "Fields.h"

#include <gtest/gtest.h>

#include "EventText.h"

namespace provider {
namespace {

const char* const kValue =
    R"({"a":1,"b":{"c":2,"d":{"e":3,"f":4}},"items":[{"id":"1","x":{"y":5,"z":6}},{"id":"2"}]})";

struct FieldsRow {
    const char* fields;
    const char* selected;
};

TEST(Fields, SelectPartsOfAValue) {
    const FieldsRow rows[] = {
        {"", kValue},
        {"*", kValue},
        {"a", R"({"a":1})"},
        {"none", "{}"},
        {"a,b/c", R"({"a":1,"b":{"c":2}})"},
        {"b(c,d/e)", R"({"b":{"c":2,"d":{"e":3}}})"},
        {"b/d(e,f)", R"({"b":{"d":{"e":3,"f":4}}})"},
        {"b/c,b/d/f", R"({"b":{"c":2,"d":{"f":4}}})"},
        {"b/c,b", R"({"b":{"c":2,"d":{"e":3,"f":4}}})"},
        {"b,b/c", R"({"b":{"c":2,"d":{"e":3,"f":4}}})"},
        {"b/*/e", R"({"b":{"c":2,"d":{"e":3}}})"},
        {"items(id,x/z)", R"({"items":[{"id":"1","x":{"z":6}},{"id":"2"}]})"},
        {"items/id", R"({"items":[{"id":"1"},{"id":"2"}]})"},
    };
    const Json value = Json::parse(kValue);
    for (const FieldsRow& row : rows) {
        const Fields fields = Fields::parse(row.fields);
        EXPECT_EQ(fields.apply(value), Json::parse(row.selected)) << row.fields;
        std::string text;
        EventText(value).append(text, fields);
        EXPECT_EQ(Json::parse(text), Json::parse(row.selected)) << row.fields << " as text";
    }
}

TEST(Fields, RefuseWhatIsNoSelection) {
    std::string deep = "a";
    for (int i = 0; i < 50; ++i) deep += "/a";
    for (const std::string& text : std::initializer_list<std::string>{
             ",",  "a,",   ",a",  "a,,b",  "a(",  "a)",  "a()", "a(b",    "a(b))", "a/",
             "/a", "a//b", "a b", "a(b)c", "a.b", "(a)", "é",   "a(b)/c", deep,    std::string(5000, '(')}) {
        EXPECT_THROW(Fields::parse(text), ApiError) << text;
    }
}

// Names are compared as they stand in the text, so one that needs escaping must neither match nor break it.
TEST(Fields, AMemberWithAnEscapedNameStaysWhole) {
    const Json value = Json::parse(R"({"a\"b":1,"ü":2,"":3,"a":4})");
    std::string whole;
    EventText(value).append(whole, Fields{});
    EXPECT_EQ(Json::parse(whole), value);
    std::string part;
    EventText(value).append(part, Fields::parse("a"));
    EXPECT_EQ(part, R"({"a":4})");
}

}  // namespace
}  // namespace provider
