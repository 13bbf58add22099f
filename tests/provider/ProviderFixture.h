// ProviderFixture: a provider in this process on a free port, and a client that has a token.
#pragma once

#include <gtest/gtest.h>
#include <httplib.h>

#include <memory>
#include <string>

#include "ProviderServer.h"

namespace provider {

struct Answer {
    int status = 0;  // 0: no reply
    Json body;
    std::string text;
    httplib::Headers headers;
};

class ProviderFixture : public testing::Test {
protected:
    static constexpr const char* kEvents = "/calendar/v3/calendars/a@x.example/events";

    ProviderFixture() : ProviderFixture(ServerOptions{.isQuiet = true}) {}
    explicit ProviderFixture(const ServerOptions& options) : mServer(options) {
        Account& account = mServer.store().addAccount("a@x.example", "A");
        Json members;
        members["id"] = account.email;
        members["summary"] = "Main";
        mServer.store().addCalendar(account, members);
        members["id"] = "read@x.example";
        members["accessRole"] = "reader";
        mServer.store().addCalendar(account, members);
        mServer.start();
        mClient = connect();
        mToken = token(account.refreshToken).body.value("access_token", "");
    }

    std::unique_ptr<httplib::Client> connect() {
        auto client = std::make_unique<httplib::Client>(mServer.url());
        client->enable_server_certificate_verification(false);
        client->set_keep_alive(true);
        client->set_tcp_nodelay(true);
        client->set_decompress(false);
        client->set_read_timeout(20);
        return client;
    }

    Answer token(const std::string& refreshToken) {
        return send("POST", "/o/oauth2/token",
                    "client_id=" + mServer.store().clientId +
                        "&client_secret=" + mServer.store().clientSecret + "&refresh_token=" + refreshToken +
                        "&grant_type=refresh_token",
                    {{"Content-Type", "application/x-www-form-urlencoded"}});
    }

    // The token goes with it unless headers have an Authorization of their own.
    Answer send(const std::string& method, const std::string& path, const std::string& body = "",
                httplib::Headers headers = {}) {
        httplib::Request request;
        request.method = method;
        request.path = path;
        request.body = body;
        if (!body.empty() && headers.count("Content-Type") == 0) {
            headers.emplace("Content-Type", "application/json");
        }
        if (headers.count("Authorization") == 0) headers.emplace("Authorization", "Bearer " + mToken);
        request.headers = headers;
        const auto result = mClient->send(request);
        if (!result) return {};
        return {result->status, Json::parse(result->body, nullptr, false), result->body, result->headers};
    }

    Answer get(const std::string& path) { return send("GET", path); }

    // Adds an event from a body without times, which it gets.
    Json insert(Json body) {
        if (!body.contains("start")) {
            body["start"]["dateTime"] = "2026-03-02T10:00:00+01:00";
            body["end"]["dateTime"] = "2026-03-02T11:00:00+01:00";
            for (const char* name : {"start", "end"}) body[name]["timeZone"] = "Europe/Berlin";
        }
        const Answer answer = send("POST", kEvents, body.dump());
        EXPECT_EQ(answer.status, 200) << answer.text;
        return answer.body;
    }

    // The address of an event, by its id or its body.
    static std::string event(const Json& which) {
        const Json& eventId = which.is_object() ? which.at("id") : which;
        return std::string(kEvents) + "/" + eventId.get<std::string>();
    }

    ProviderServer mServer;
    std::unique_ptr<httplib::Client> mClient;
    std::string mToken;
};

}  // namespace provider
