// The REST client against a server that answers from a script.
#include <gtest/gtest.h>
#include <zlib.h>

#include "calendar/CalCurl.h"
#include "common/Account.h"
#include "common/ServerAddress.h"
#include "common/SyncResult.h"
#include "common/UrlText.h"
#include "platform/keys.h"
#include "platform/settings.h"
#include "support/ScriptedServer.h"
#include "support/TestRoot.h"

using sync_result::kFailed;
using sync_result::kOk;
using sync_result::kTokenFailed;

namespace {

std::string gzip(const std::string& text) {
    z_stream stream{};
    EXPECT_EQ(deflateInit2(&stream, Z_BEST_SPEED, Z_DEFLATED, 31, 8, Z_DEFAULT_STRATEGY), Z_OK);
    std::string out(text.size() + 1024, '\0');
    std::string input = text;
    stream.next_in = reinterpret_cast<Bytef*>(input.data());
    stream.avail_in = static_cast<uInt>(input.size());
    stream.next_out = reinterpret_cast<Bytef*>(out.data());
    stream.avail_out = static_cast<uInt>(out.size());
    EXPECT_EQ(deflate(&stream, Z_FINISH), Z_STREAM_END);
    out.resize(stream.total_out);
    deflateEnd(&stream);
    return out;
}

struct Client {
    Client() : account(record()) {
        EXPECT_EQ(key_storage_set("vantor.tovik.client.id", "id&=1"), 0);
        EXPECT_EQ(key_storage_set("vantor.tovik.client.secret", "secret"), 0);
    }
    vantor_pim_sync_account_s record() {
        url = server.url();
        vantor_pim_sync_account_s fields{};
        fields.account_id = 1;
        fields.calsync = true;
        fields.calserver = url.data();
        fields.refresh_token = token.data();
        return fields;
    }
    TestRoot root;
    ScriptedServer server;
    std::string url;
    std::string token = "refresh";
    Account account;
    CalCurl curl{&account, nullptr, std::make_shared<HttpShare>()};
    std::string reply;
};

}  // namespace

TEST(CalCurl, AnExpiredTokenIsRenewedAndTheRequestRepeated) {
    Client client;
    ASSERT_EQ(client.curl.get("/calendar/v3/x", &client.reply), kOk);
    EXPECT_EQ(client.reply, "{}");
    EXPECT_EQ(client.server.requests, 2);
    EXPECT_EQ(client.server.lastTokenBody,
              "client_id=id&=1&client_secret=secret&refresh_token=refresh&grant_type=refresh_token");
    ASSERT_EQ(client.curl.insert("c", "{}", &client.reply), kOk);
    EXPECT_EQ(client.server.refreshes, 1);
}

TEST(CalCurl, GivesUpInItsOwnTime) {
    struct Row {
        const char* name;
        const char* tokenReply;
        int result;
        int requests;
    };
    for (const Row& row :
         {Row{"a token that is refused again and again", R"({"access_token":"bad"})", kOk, 5},
          Row{"no token in the reply", R"({"error":"invalid_grant"})", kTokenFailed, 1},
          Row{"a token that would begin a header of its own", R"({"access_token":"good\r\nX-Other: 1"})",
              kTokenFailed, 1},
          Row{"a reply that cannot be read", "{oops", kOk, 5}}) {
        SCOPED_TRACE(row.name);
        Client client;
        client.server.tokenReply = row.tokenReply;
        EXPECT_EQ(client.curl.get("/x", &client.reply), row.result);
        EXPECT_EQ(client.server.requests, row.requests);
        EXPECT_EQ(client.curl.lastHttpStatus(), 401);
    }
}

TEST(CalCurl, AWriteThatIsNotAnsweredInTimeGoesOutOnce) {
    Client client;
    client.account.setAccessToken("good");
    client.curl.setTimeout(1);
    client.server.delayMs = 1200;
    int sent = 0;
    for (int (CalCurl::*insert)(const std::string&, const std::string&, std::string*) :
         {&CalCurl::insert, &CalCurl::insertTodo}) {
        EXPECT_NE((client.curl.*insert)("c", "{}", &client.reply), kOk);
        EXPECT_EQ(client.server.requests, ++sent);
    }
}

TEST(CalCurl, TwoWorkersOfOneAccountRefreshOnce) {
    Client client;
    std::vector<std::thread> workers;
    for (int i = 0; i < 8; ++i) {
        workers.emplace_back([&client] {
            CalCurl own(&client.account, nullptr);
            std::string reply;
            EXPECT_EQ(own.get("/x", &reply), kOk);
            EXPECT_EQ(own.lastHttpStatus(), 200);
        });
    }
    for (std::thread& worker : workers) worker.join();
    EXPECT_EQ(client.server.refreshes, 1);
}

TEST(CalCurl, RepliesInflatedOrNot) {
    const std::string text = std::string(50'000, 'a') + R"({"items":[]})";
    const std::string zipped = gzip(text);
    struct Row {
        const char* name;
        std::string body;
        int result;
        std::string reply;
    };
    const Row rows[] = {
        {"far larger than its compressed size", zipped, kOk, text},
        {"not compressed", text, kOk, text},
        {"empty", "", kOk, ""},
        {"cut short", zipped.substr(0, zipped.size() / 2), kFailed, ""},
        {"without its check sum", zipped.substr(0, zipped.size() - 4), kFailed, ""},
        {"zero bytes at the end", gzip(std::string("ab\0\0", 4)), kOk, "ab"},
        {"nothing but a zero byte", gzip(std::string(1, '\0')), kOk, ""},
        {"an empty list and junk after a zero byte", gzip(std::string("{\"items\":[]}\0junk", 17)), kFailed,
         ""},
    };
    for (const Row& row : rows) {
        SCOPED_TRACE(row.name);
        std::string out;
        EXPECT_EQ(inflateGzip(row.body, &out, 1'000'000), row.result);
        EXPECT_EQ(out, row.reply);
    }
    std::string out;
    EXPECT_EQ(inflateGzip(gzip(std::string(100'000, 'a')), &out, 50'000), kFailed) << "over the limit";
}

TEST(CalCurl, AsksForWhatItSays) {
    Client client;
    client.account.setAccessToken("good");
    struct Row {
        std::function<int(CalCurl&, std::string*)> call;
        const char* method;
        const char* path;
    };
    const Row rows[] = {
        {[](CalCurl& c, std::string* r) { return c.insert("c@x", "{}", r); }, "POST",
         "/calendar/v3/calendars/c@x/events"},
        {[](CalCurl& c, std::string* r) { return c.update("c#1", "e", "{}", r); }, "PATCH",
         "/calendar/v3/calendars/c%231/events/e"},
        {[](CalCurl& c, std::string* r) { return c.remove("c", "e", r); }, "DELETE",
         "/calendar/v3/calendars/c/events/e"},
        {[](CalCurl& c, std::string* r) { return c.getEtagUri("c", "e", r); }, "GET",
         "/calendar/v3/calendars/c/events/e?fields=etag%2Cid"},
        {[](CalCurl& c, std::string* r) { return c.insertTodo("l", "{}", r); }, "POST",
         "/tasks/v1/lists/l/tasks"},
        {[](CalCurl& c, std::string* r) { return c.updateTodo("l", "t", "{}", r); }, "PATCH",
         "/tasks/v3/list/l/tasks/t"},
        {[](CalCurl& c, std::string* r) { return c.removeTodo("l", "t", r); }, "DELETE",
         "/tasks/v1/lists/l/tasks/t"},
        {[](CalCurl& c, std::string* r) { return c.getTodoEtagUri("l", "t", r); }, "GET",
         "/tasks/v1/lists/l/tasks/t?fields=etag%2Cid"},
    };
    for (const Row& row : rows) {
        EXPECT_EQ(row.call(client.curl, &client.reply), kOk);
        EXPECT_EQ(client.server.lastMethod, row.method);
        EXPECT_EQ(client.server.lastPath, row.path);
    }
    for (const int status : {302, 404, 500}) {
        client.server.status = status;
        EXPECT_EQ(client.curl.get("/x", &client.reply), kOk) << "a status is the caller's to judge";
        EXPECT_EQ(client.curl.lastHttpStatus(), status);
        EXPECT_EQ(client.server.lastPath, "/x") << "redirects are not followed";
    }
}

TEST(CalCurl, AnObserverEndsATransferAndADeadServerIsAFailure) {
    struct Stopper : IProgressObserver {
        int onProgress(double, double, double, double) override { return 1; }
    };
    Client client;
    Stopper stopper;
    SyncCurl transport(&client.account, &stopper);
    long status = 0;
    EXPECT_EQ(transport.performCurl(client.url, HttpMethod::kGet, nullptr, nullptr, {}, &status),
              sync_result::kAborted);
    SyncCurl dead(&client.account, nullptr);
    EXPECT_EQ(dead.performCurl("http://127.0.0.1:1/", HttpMethod::kGet, nullptr, nullptr, {}, &status),
              kFailed);
    EXPECT_EQ(dead.performCurl("file:///etc/hostname", HttpMethod::kGet, nullptr, nullptr, {}, &status),
              kFailed);
}

TEST(ServerAddress, BareHostsAndUrls) {
    struct Row {
        const char* server;
        int port;
        bool ssl;
        const char* base;
    };
    for (const Row& row :
         {Row{"host", 0, true, "https://host"}, Row{"host", 8080, false, "http://host:8080"},
          Row{"host:81", 8080, false, "http://host:81"}, Row{"https://host/", 443, false, "https://host:443"},
          Row{"http://host/base/", 0, true, "http://host/base"}, Row{"::1", 80, false, "http://[::1]:80"},
          Row{"[::1]:5", 80, true, "https://[::1]:5"}, Row{"", 80, true, ""}}) {
        EXPECT_EQ(server_address::compose(row.server, row.port, row.ssl), row.base);
    }
    Client client;
    EXPECT_EQ(server_address::tokenBase(client.account), client.url);
    ASSERT_EQ(vconf_set_str("db/vantor-pim-sync/token_server", "http://tokens"), 0);
    EXPECT_EQ(server_address::tokenBase(client.account), "http://tokens");
}
