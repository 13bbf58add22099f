#include <zlib.h>

#include <filesystem>
#include <fstream>
#include <sstream>

#include "ProviderFixture.h"

namespace provider {
namespace {

using Strictness = ProviderFixture;

struct StrictRow {
    const char* method;
    const char* path;
    const char* body;
    const char* type;
    int status;
};

TEST_F(Strictness, MalformedRequestsFailLoudly) {
    const StrictRow rows[] = {
        {"POST", kEvents, "{}", "application/json", 400},
        {"POST", kEvents, "[]", "application/json", 400},
        {"POST", kEvents, "{\"start\":", "application/json", 400},
        {"POST", kEvents, "{\"summary\":\"\xff\"}", "application/json", 400},
        {"POST", kEvents, "{}", "text/plain", 415},
        {"POST", kEvents, "{}", "application/jsonp", 415},
        {"POST", kEvents, "{}", "application/json; charset=latin1", 415},
        {"POST", kEvents, "", "application/json", 400},
        {"PATCH", "/calendar/v3/calendars/a@x.example/events/none", "{}", "application/json", 404},
        {"POST", "/calendar/v3/calendars/read@x.example/events", "{}", "application/json", 403},
        {"POST", "/calendar/v3/calendars/none@x.example/events", "{}", "application/json", 404},
        {"GET", "/calendar/v3/calendars/a@x.example/events?fields=items(", "", "", 400},
        {"GET", "/calendar/v3/calendars/a@x.example/events?fields=item(id)", "", "", 400},
        {"GET", "/calendar/v3/calendars/a@x.example/events?maxResults=0", "", "", 400},
        {"GET", "/calendar/v3/calendars/a@x.example/events?maxResults=ten", "", "", 400},
        {"GET", "/calendar/v3/calendars/a@x.example/events?maxResults=99999999999999999999", "", "", 400},
        {"GET", "/calendar/v3/calendars/a@x.example/events?pageToken=P32-0", "", "", 400},
        {"GET", "/calendar/v3/calendars/a@x.example/events?singleEvents=true", "", "", 400},
        {"GET", "/calendar/v3/calendars/a@x.example/events?showDeleted=1", "", "", 400},
        {"GET", "/calendar/v3/calendars//events", "", "", 404},
        {"GET", "/calendar/v3/users/me", "", "", 404},
        {"DELETE", kEvents, "", "", 405},
        {"GET", "/o/oauth2/token", "", "", 405},
    };
    for (const StrictRow& row : rows) {
        httplib::Headers headers = {{"Authorization", "Bearer " + mToken}};
        if (*row.type != '\0') headers.emplace("Content-Type", row.type);
        const Answer answer = send(row.method, row.path, row.body, headers);
        EXPECT_EQ(answer.status, row.status) << row.method << " " << row.path << " " << row.body;
        EXPECT_EQ(answer.body.value("/error/code"_json_pointer, 0), row.status)
            << row.path << " " << answer.text;
    }
    EXPECT_EQ(get(kEvents).body.at("items").size(), 0U);
}

TEST_F(Strictness, BodiesAreCapped) {
    Json body = {{"summary", std::string(5 << 20, 'x')}};
    EXPECT_EQ(send("POST", kEvents, body.dump()).status, 413);
    body["summary"] = std::string(1 << 20, 'x');
    EXPECT_EQ(insert(body).at("summary").get<std::string>().size(), 1U << 20U);
}

TEST_F(Strictness, LongPathsAndIdsDoNoHarm) {
    EXPECT_EQ(get(event(std::string(7000, 'a'))).status, 404);
    EXPECT_EQ(send("PATCH", event(std::string(3900, 'a')), "{}").status, 404);
    EXPECT_EQ(send("PATCH", event(std::string(7000, 'a')), "{}").status, 414);
}

TEST_F(Strictness, ClientIdsHaveOneForm) {
    EXPECT_EQ(insert({{"id", "abcuv0123"}}).at("id"), "abcuv0123");
    Json body = insert(Json::object());
    for (const char* id : {"abcuv0123", "ABCDE", "abc", "a-b-c-d", "wxyz0"}) {
        body["id"] = id;
        EXPECT_EQ(send("POST", kEvents, body.dump()).status, std::string(id) == "abcuv0123" ? 409 : 400)
            << id;
    }
}

TEST_F(Strictness, EscapedIdsAreTheSameIds) {
    const Json made = insert(Json::object());
    const std::string id = made.at("id");
    EXPECT_EQ(get("/calendar/v3/calendars/a%40x.example/events/" + id).status, 200);
    EXPECT_EQ(get("/calendar/v3/calendars/primary/events/" + id).status, 200);
    EXPECT_EQ(get("/calendar/v3/calendars/a@x.example%2Fevents/" + id).status, 404);
}

TEST_F(Strictness, OnlyClientsThatSayGzipTwiceGetIt) {
    insert({{"description", std::string(5000, 'x')}});
    const httplib::Headers once = {{"Accept-Encoding", "gzip"}, {"User-Agent", "plain"}};
    EXPECT_EQ(send("GET", kEvents, "", once).headers.count("Content-Encoding"), 0U);
    const httplib::Headers twice = {{"Accept-Encoding", "gzip"}, {"User-Agent", "client (gzip)"}};
    const Answer packed = send("GET", kEvents, "", twice);
    ASSERT_EQ(packed.headers.count("Content-Encoding"), 1U);
    EXPECT_LT(packed.text.size(), 1500U);
    std::string out(10000, '\0');
    z_stream stream{};
    ASSERT_EQ(inflateInit2(&stream, 31), Z_OK);
    std::string in = packed.text;
    stream.next_in = reinterpret_cast<Bytef*>(in.data());
    stream.avail_in = static_cast<uInt>(in.size());
    stream.next_out = reinterpret_cast<Bytef*>(out.data());
    stream.avail_out = static_cast<uInt>(out.size());
    EXPECT_EQ(inflate(&stream, Z_FINISH), Z_STREAM_END);
    out.resize(stream.total_out);
    inflateEnd(&stream);
    EXPECT_EQ(Json::parse(out), get(kEvents).body);
}

// Whatever is sent, the answer is an error body or an event, and the next request is answered too.
TEST_F(Strictness, NoJsonTextBringsItDown) {
    const std::filesystem::path folder = std::filesystem::path(VPS_CORPUS_DIR) / "json-suite/test_parsing";
    int files = 0;
    for (const auto& entry : std::filesystem::directory_iterator(folder)) {
        ++files;
        std::ifstream in(entry.path(), std::ios::binary);
        std::stringstream text;
        text << in.rdbuf();
        const std::string name = entry.path().filename();
        const Answer answer = send("POST", kEvents, text.str());
        EXPECT_EQ(answer.status, text.str().empty() ? 415 : 400) << name;
        if (name.starts_with("n_") && !text.str().empty()) {
            EXPECT_EQ(answer.body.at("error").at("errors")[0].at("reason"), "parseError") << name;
        }
    }
    EXPECT_EQ(files, 318);
    EXPECT_EQ(get(kEvents).body.at("items").size(), 0U);
}

TEST_F(Strictness, AnyStringComesBackAsItWent) {
    std::ifstream in(std::filesystem::path(VPS_CORPUS_DIR) / "strings/naughty-strings.json");
    const Json strings = Json::parse(in);
    ASSERT_EQ(strings.size(), 515U);
    for (const Json& text : strings) {
        const Json made = insert({{"summary", text}, {"description", text}});
        EXPECT_EQ(get(event(made) + "?fields=summary,description").body,
                  Json({{"summary", text}, {"description", text}}));
    }
}

}  // namespace
}  // namespace provider
