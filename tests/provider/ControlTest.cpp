#include <future>

#include "ProviderFixture.h"

namespace provider {
namespace {

using Control = ProviderFixture;

TEST_F(Control, TheTokenEndpointKnowsWhoAsks) {
    struct Row {
        const char* body;
        int status;
        const char* error;
    };
    const std::string& refresh = mServer.store().account("a@x.example").refreshToken;
    mServer.store().clientId = "id=with=equals";
    mServer.store().clientSecret = "s/e+c%20";
    const Row rows[] = {
        {"client_id=id=with=equals&client_secret=s/e+c%20&refresh_token=R&grant_type=refresh_token", 200, ""},
        {"client_id=other&client_secret=s/e+c%20&refresh_token=R&grant_type=refresh_token", 401,
         "invalid_client"},
        {"client_id=id=with=equals&client_secret=x&refresh_token=R&grant_type=refresh_token", 401,
         "invalid_client"},
        {"client_id=id=with=equals&client_secret=s/e+c%20&refresh_token=x&grant_type=refresh_token", 400,
         "invalid_grant"},
        {"client_id=id=with=equals&client_secret=s/e+c%20&refresh_token=R&grant_type=password", 400,
         "unsupported_grant_type"},
        {"client_id=id=with=equals&client_secret=s/e+c%20&refresh_token=R", 400, "invalid_request"},
        {"client_id=id=with=equals&client_secret=s/e+c%20&refresh_token=&grant_type=refresh_token", 400,
         "invalid_request"},
        {"client_id=id=with=equals&client_id=a&client_secret=s/"
         "e+c%20&refresh_token=R&grant_type=refresh_token",
         400, "invalid_request"},
        {"nonsense", 400, "invalid_request"},
    };
    for (const Row& row : rows) {
        std::string body = row.body;
        const std::size_t place = body.find("=R");
        if (place != std::string::npos) body.replace(place + 1, 1, refresh);
        const Answer answer =
            send("POST", "/o/oauth2/token", body, {{"Content-Type", "application/x-www-form-urlencoded"}});
        EXPECT_EQ(answer.status, row.status) << row.body;
        EXPECT_EQ(answer.body.value("error", ""), row.error) << row.body;
    }
    EXPECT_EQ(send("POST", "/o/oauth2/token", "{}").status, 400);
}

TEST_F(Control, OnlyAValidTokenOpensTheApi) {
    for (const char* header : {"", "Bearer", "Bearer ", "Bearer x", "Basic x"}) {
        const Answer answer = send("GET", kEvents, "", {{"Authorization", header}});
        EXPECT_EQ(answer.status, 401) << header;
        EXPECT_EQ(answer.body.at("error").at("message"), "Invalid Credentials");
    }
    EXPECT_EQ(get(kEvents).status, 200);
    EXPECT_EQ(send("POST", "/admin/tokens/expire", "{}").status, 200);
    EXPECT_EQ(get(kEvents).status, 401);
}

TEST_F(Control, ARevokedAccountNeedsANewRefreshToken) {
    const std::string old = mServer.store().account("a@x.example").refreshToken;
    EXPECT_EQ(send("POST", "/admin/tokens/revoke", R"({"email":"a@x.example"})").status, 200);
    EXPECT_EQ(get(kEvents).status, 401);
    EXPECT_EQ(token(old).body.at("error"), "invalid_grant");
    const Answer fresh = send("POST", "/admin/tokens/issue", R"({"email":"a@x.example"})");
    EXPECT_EQ(token(old).status, 400);
    EXPECT_EQ(token(fresh.body.at("refreshToken")).status, 200);
}

class ShortTokens : public ProviderFixture {
protected:
    ShortTokens()
        : ProviderFixture(ServerOptions{.isQuiet = true, .tokenLifetime = std::chrono::seconds(0)}) {}
};

TEST_F(ShortTokens, EndWithTheirTime) {
    EXPECT_EQ(get(kEvents).status, 401);
}

TEST_F(Control, FaultsHitWhatTheyNameAndNoMore) {
    send("POST", "/admin/faults",
         R"({"method":"GET","path":"events\\?max","count":2,"kind":"status","status":502})");
    EXPECT_EQ(get(kEvents).status, 200);
    EXPECT_EQ(get(std::string(kEvents) + "?maxResults=5").status, 502);
    EXPECT_EQ(send("GET", "/admin/faults").body.at("faults")[0].at("left"), 1);
    EXPECT_EQ(get(std::string(kEvents) + "?maxResults=5").body.at("error").at("code"), 502);
    EXPECT_EQ(get(std::string(kEvents) + "?maxResults=5").status, 200);
    EXPECT_TRUE(send("GET", "/admin/faults").body.at("faults").empty());
}

TEST_F(Control, FaultsSpoilRepliesInEveryWay) {
    insert({{"description", std::string(3000, 'x')}});
    const auto fault = [&](const char* body) {
        EXPECT_EQ(send("POST", "/admin/faults", body).status, 200) << body;
    };
    fault(R"({"kind":"body","body":{"items":7},"headers":{"X-Test":"1"}})");
    const Answer replaced = get(kEvents);
    EXPECT_EQ(replaced.text, R"({"items":7})");
    EXPECT_EQ(replaced.headers.count("X-Test"), 1U);
    fault(R"({"kind":"reset"})");
    EXPECT_EQ(get(kEvents).status, 0);
    fault(R"({"kind":"cut"})");
    EXPECT_EQ(get(kEvents).status, 0);
    fault(R"({"kind":"corrupt-gzip"})");
    const Answer corrupt = get(kEvents);
    EXPECT_EQ(corrupt.headers.count("Content-Encoding"), 1U);
    EXPECT_EQ(corrupt.text.substr(0, 2), "\x1f\x8b");
    fault(R"({"kind":"short-gzip"})");
    const Answer cutShort = get(kEvents);
    EXPECT_EQ(cutShort.status, 200);
    EXPECT_LT(cutShort.text.size(), corrupt.text.size());
    fault(R"({"kind":"delay","delayMs":60})");
    const auto begin = std::chrono::steady_clock::now();
    EXPECT_EQ(get(kEvents).status, 200);
    EXPECT_GE(std::chrono::steady_clock::now() - begin, std::chrono::milliseconds(60));
    fault(R"({"kind":"rewrite","from":"lunch","to":"dinner"})");
    EXPECT_EQ(insert({{"summary", "lunch"}}).at("summary"), "dinner");
    for (const char* bad : {R"({"kind":"boom"})", R"({"kind":"rewrite"})", R"({"count":0})",
                            R"({"path":"("})", R"({"status":"500"})", R"({"typo":1})", R"({"delayMs":-1})",
                            R"({"headers":[]})", R"({"method":1})"}) {
        EXPECT_EQ(send("POST", "/admin/faults", bad).status, 400) << bad;
    }
}

TEST_F(Control, AFaultAfterHandlingHidesWhatWasDone) {
    const Json made = insert(Json::object());
    send("POST", "/admin/faults", R"({"method":"DELETE","kind":"reset","afterHandling":true})");
    EXPECT_EQ(send("DELETE", event(made)).status, 0);
    EXPECT_EQ(get(event(made)).status, 410);
    send("POST", "/admin/faults", R"({"method":"POST","kind":"status"})");
    EXPECT_EQ(send("POST", kEvents, made.dump()).status, 503);
    EXPECT_EQ(get(kEvents).body.at("items").size(), 0U);
}

TEST_F(Control, HeldRequestsWaitForTheirRelease) {
    send("POST", "/admin/hold", R"({"method":"GET","path":"calendarList"})");
    auto waiting = std::async(std::launch::async, [this] {
        const auto client = connect();
        const auto result =
            client->Get("/calendar/v3/users/me/calendarList", {{"Authorization", "Bearer " + mToken}});
        return result ? result->status : 0;
    });
    EXPECT_EQ(get("/admin/hold?atLeast=1&timeoutMs=10000").body.at("waiting"), 1);
    EXPECT_EQ(get(kEvents).status, 200);
    EXPECT_EQ(get("/admin/hold?atLeast=2&timeoutMs=1").status, 408);
    send("POST", "/admin/release", "{}");
    EXPECT_EQ(waiting.get(), 200);
    EXPECT_EQ(get("/admin/hold").body.at("waiting"), 0);
}

TEST_F(Control, StoppingLetsHeldAndIdleConnectionsGo) {
    send("POST", "/admin/hold", R"({"path":"calendarList"})");
    auto waiting = std::async(std::launch::async, [this] {
        return connect()->Get("/calendar/v3/users/me/calendarList") != nullptr;
    });
    get("/admin/hold?atLeast=1&timeoutMs=10000");
    const auto begin = std::chrono::steady_clock::now();
    mServer.stop();
    EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds(5));
    waiting.get();
}

TEST_F(Control, RequestsAreCountedByKindWithoutSecrets) {
    const Json made = insert(Json::object());
    send("DELETE", "/admin/requests");
    get(event(made));
    get(event("other"));
    get(std::string(kEvents) + "?access_token=hush");
    send("GET", kEvents, "", {{"Authorization", ""}});
    const Answer log = send("GET", "/admin/requests");
    EXPECT_EQ(log.body.at("total"), 4);
    EXPECT_EQ(log.body.at("counts").dump(),
              R"({"GET /calendar/v3/calendars/*/events":2,"GET /calendar/v3/calendars/*/events/*":2})");
    EXPECT_EQ(log.body.at("requests")[1].at("status"), 404);
    EXPECT_EQ(log.body.at("requests")[3].at("authorization"), false);
    EXPECT_EQ(log.text.find("hush"), std::string::npos);
    EXPECT_EQ(log.text.find(mToken), std::string::npos);
}

TEST_F(Control, ContentCanBeChangedFromOutside) {
    const std::string calendars = "/admin/accounts/a@x.example/calendars";
    const Answer made = send("POST", calendars, R"({"summary":"New","backgroundColor":"#123456"})");
    const std::string id = made.body.at("id");
    const std::string etag = made.body.at("etag");
    EXPECT_NE(send("PATCH", calendars + "/" + id, R"({"summary":"Newer"})").body.at("etag"), etag);
    EXPECT_EQ(send("PATCH", calendars + "/" + id, R"({"backgroundColor":"red"})").status, 400);
    send("POST", "/admin/accounts", R"({"email":"b@x.example"})");
    EXPECT_EQ(send("POST", "/admin/accounts/b@x.example/calendars/share",
                   Json({{"id", id}, {"accessRole", "reader"}}).dump())
                  .body.at("accessRole"),
              "reader");
    const std::string events = "/admin/calendars/" + id + "/events";
    EXPECT_EQ(send("POST", events + "?raw=true&id=odd", R"({"start":7})").text, R"({"start":7})");
    EXPECT_EQ(get("/calendar/v3/calendars/" + id + "/events").body.at("items").dump(), R"([{"start":7}])");
    EXPECT_EQ(send("POST", "/admin/seed", Json({{"events", 3}, {"calendarId", id}}).dump()).status, 200);
    EXPECT_EQ(send("GET", events).body.at("items").size(), 4U);
    EXPECT_EQ(send("DELETE", events + "/odd").status, 200);
    EXPECT_EQ(send("DELETE", calendars + "/" + id).status, 200);
    EXPECT_EQ(get("/calendar/v3/calendars/" + id + "/events").status, 404);
    EXPECT_EQ(send("GET", events).body.at("items").size(), 3U);  // the other account still has it
    EXPECT_EQ(send("DELETE", "/admin/accounts/b@x.example").status, 200);
    EXPECT_EQ(send("GET", events).status, 404);
}

class OverTls : public ProviderFixture {
protected:
    OverTls() : ProviderFixture(ServerOptions{.isTls = true, .isQuiet = true}) {}
};

TEST_F(OverTls, EverythingIsTheSame) {
    const Json made = insert({{"summary", "sealed"}});
    EXPECT_EQ(get(event(made)).body, made);
    send("POST", "/admin/faults", R"({"kind":"reset"})");
    EXPECT_EQ(get(kEvents).status, 0);
    EXPECT_EQ(get(kEvents).status, 200);
    EXPECT_NE(mServer.ready().at("certificate").get<std::string>().find("BEGIN CERTIFICATE"),
              std::string::npos);
}

}  // namespace
}  // namespace provider
