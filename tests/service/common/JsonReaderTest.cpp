// The document that is read, beside the one that the library's own parser makes of the same text.
#include "common/JsonReader.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>

namespace {

std::string written(JsonNode* node) {
    const JsonGeneratorPtr generator(json_generator_new());
    json_generator_set_root(generator.get(), node);
    const GChars text(json_generator_to_data(generator.get(), nullptr));
    return text.get();
}

JsonNodePtr parsedByLibrary(const std::string& text) {
    const JsonParserPtr parser(json_parser_new());
    if (json_parser_load_from_data(parser.get(), text.data(), static_cast<gssize>(text.size()), nullptr) ==
        FALSE)
        return nullptr;
    return JsonNodePtr(json_parser_steal_root(parser.get()));
}

std::string nested(int depth) {
    return std::string(static_cast<size_t>(depth), '[') + std::string(static_cast<size_t>(depth), ']');
}

}  // namespace

TEST(JsonReader, ReadsWhatTheLibraryReads) {
    int compared = 0;
    for (const auto& entry : std::filesystem::directory_iterator(VPS_CORPUS_DIR "/json-suite/test_parsing")) {
        std::ifstream file(entry.path(), std::ios::binary);
        const std::string text{std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>()};
        const JsonNodePtr mine = json_reader::read(text);
        if (!mine) continue;
        const JsonNodePtr other = parsedByLibrary(text);
        // It refuses a few that are JSON, and makes broken UTF-8 of half a surrogate pair.
        if (!other || g_utf8_validate(written(other.get()).c_str(), -1, nullptr) == FALSE) continue;
        const std::string name = entry.path().filename();
        if (name.find("surrogate") == std::string::npos && name.find("UTF-16") == std::string::npos) {
            EXPECT_EQ(written(mine.get()), written(other.get())) << name;
        }
        ++compared;
    }
    EXPECT_GT(compared, 85);
}

TEST(JsonReader, KeepsTypesOrderAndTheLastOfAName) {
    const std::string text =
        R"( { "a" : 1, "b":-0.5e1,"a":"\"\\\/\b\f\n\r\t\u00e9","c":[true,false,null,{},[ ]],"":"é" } )";
    const JsonNodePtr root = json_reader::read(text);
    ASSERT_NE(root, nullptr);
    JsonObject* object = json_node_get_object(root.get());
    EXPECT_STREQ(json_object_get_string_member(object, "a"), "\"\\/\b\f\n\r\t\xC3\xA9");
    EXPECT_EQ(json_node_get_value_type(json_object_get_member(object, "b")), G_TYPE_DOUBLE);
    EXPECT_EQ(json_object_get_double_member(object, "b"), -5);
    EXPECT_EQ(written(json_object_get_member(object, "c")), "[true,false,null,{},[]]");
    EXPECT_STREQ(json_object_get_string_member(object, ""), "\xC3\xA9");
    EXPECT_EQ(json_object_get_size(object), 4U);
}

TEST(JsonReader, ItsLimits) {
    struct Row {
        std::string text;
        bool isRead;
    };
    const Row rows[] = {
        {"9223372036854775807", true},
        {"-9223372036854775808", true},
        {"9223372036854775808", false},
        {"1e308", true},
        {"1e309", false},
        {nested(json_reader::kMaxDepth), true},
        {nested(json_reader::kMaxDepth + 2), false},
        {nested(100'000), false},
        {std::string(100'000, '['), false},
        {"\"\xC3\"", false},
        {"\"\xED\xA0\x80\"", false},
        {"{\"\xFF\":1}", false},
        {std::string("\"a\0b\"", 5), false},
        {std::string("[]\0x", 4), false},
        {"\"\\u12\"", false},
        {"\"\\u-123\"", false},
        {"\"\\uD83D\\u", false},
        {"", false},
    };
    for (const Row& row : rows)
        EXPECT_EQ(json_reader::read(row.text) != nullptr, row.isRead) << row.text.substr(0, 40);
}
