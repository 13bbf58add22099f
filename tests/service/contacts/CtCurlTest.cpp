// The contacts client against a server that answers from a script.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <filesystem>
#include <fstream>
#include <functional>

#include "common/Account.h"
#include "common/SyncResult.h"
#include "contacts/CtCurl.h"
#include "platform/keys.h"
#include "platform/settings.h"
#include "support/ScriptedServer.h"
#include "support/TestRoot.h"

using sync_result::kFailed;
using sync_result::kOk;
using sync_result::kTokenFailed;

namespace {

struct Client {
    Client() : account(record()) {
        EXPECT_EQ(key_storage_set("vantor.tovik.client.id", "id"), 0);
        EXPECT_EQ(key_storage_set("vantor.tovik.client.secret", "secret"), 0);
    }
    vantor_pim_sync_account_s record() {
        url = server.url();
        vantor_pim_sync_account_s fields{};
        fields.account_id = 1;
        fields.ctsync = true;
        fields.ctserver = url.data();
        fields.refresh_token = token.data();
        return fields;
    }
    [[nodiscard]] std::string header(const char* name) const {
        const auto found = server.lastHeaders.find(name);
        return found != server.lastHeaders.end() ? found->second : "";
    }
    TestRoot root;
    ScriptedServer server;
    std::string url;
    std::string token = "refresh";
    Account account;
    CtCurl curl{&account, nullptr, std::make_shared<HttpShare>()};
    std::string reply;
};

}  // namespace

TEST(CtCurl, RenewsTheTokenOnceAndSendsTheServicesHeaders) {
    Client client;
    client.server.status = 201;
    ASSERT_EQ(client.curl.insert(CtItemType::kContact, "<x/>", &client.reply), kOk);
    EXPECT_EQ(client.server.requests, 2);
    EXPECT_EQ(client.server.refreshes, 1);
    EXPECT_EQ(client.server.lastPath, "/m8/feeds/contacts/default/full?alt=json");
    EXPECT_EQ(client.header("XData-Version"), "3.0");
    EXPECT_EQ(client.header("Content-Type"), "application/atom+xml;charset=utf-8");
    EXPECT_EQ(client.header("Expect"), "");
    client.server.status = 200;
    const std::string edit = client.curl.feedBase() + "/contacts/default/full/c1";
    ASSERT_EQ(client.curl.update(edit, "\"e\"", "<x/>", &client.reply), kOk);
    EXPECT_EQ(client.server.lastMethod, "PUT");
    EXPECT_EQ(client.header("If-Match"), "\"e\"");
    EXPECT_EQ(client.server.refreshes, 1);
    const int before = client.server.requests;
    EXPECT_EQ(client.curl.update(edit, "", "<x/>", &client.reply), kFailed);
    EXPECT_EQ(client.curl.remove(edit, "", &client.reply), kFailed);
    EXPECT_EQ(client.server.requests, before) << "without an etag nothing goes out";
    EXPECT_EQ(client.curl.update(edit, "\"e\"\r\nX-Other: 1", "<x/>", &client.reply), kFailed);
    EXPECT_EQ(client.server.requests, before) << "nor with one that would begin a header of its own";
}

TEST(CtCurl, ANewItemThatIsNotAnsweredInTimeGoesOutOnce) {
    Client client;
    client.account.setAccessToken("good");
    client.curl.setTimeout(1);
    client.server.delayMs = 1200;
    int sent = 0;
    for (const CtItemType type : {CtItemType::kContact, CtItemType::kGroup}) {
        EXPECT_EQ(client.curl.insert(type, "<x/>", &client.reply), kFailed);
        EXPECT_EQ(client.server.requests, ++sent);
    }
}

TEST(CtCurl, WhatAnAnswerMeans) {
    struct Case {
        int status;
        const char* tokenReply;
        int result;
    };
    const Case cases[] = {{200, R"({"access_token":"good"})", kOk},
                          {404, R"({"access_token":"good"})", kFailed},
                          {409, R"({"access_token":"good"})", kFailed},
                          {302, R"({"access_token":"good"})", kFailed},
                          {200, R"({"error":"invalid_grant"})", kTokenFailed},
                          {200, "<html>busy</html>", kFailed},
                          {200, R"({"access_token":"bad"})", kFailed}};
    for (const Case& row : cases) {
        Client client;
        client.server.status = row.status;
        client.server.tokenReply = row.tokenReply;
        EXPECT_EQ(client.curl.get(client.curl.feedBase() + "/x", &client.reply), row.result)
            << row.status << row.tokenReply;
        EXPECT_LE(client.server.requests, 3);
    }
}

TEST(CtCurl, TheTokenGoesToTheAccountsServerOnly) {
    Client client;
    const std::string port = client.url.substr(client.url.rfind(':'));
    const std::pair<std::string, std::string> asked[] = {
        {client.url + "/anything?x=1", client.url + "/anything?x=1"},
        {"http://localhost" + port + "/m8/feeds/x", client.url + "/m8/feeds/x"},
        {"https://other.example/m8/feeds/x?a=b%20c&d", client.url + "/m8/feeds/x?a=b%20c&d"},
        {"http://127.0.0.1" + port + "@localhost" + port + "/", ""},
        {"file:///etc/passwd", ""},
        {"", ""}};
    for (const auto& [url, own] : asked) EXPECT_EQ(client.curl.atOwnServer(url), own) << url;
    EXPECT_EQ(client.curl.get("file:///etc/passwd", &client.reply), kFailed);
    EXPECT_EQ(client.server.requests, 0);
    client.server.status = 401;
    EXPECT_EQ(client.curl.getOrbit("p1", &client.reply), kFailed);
    EXPECT_EQ(client.header("Authorization"), "");
    EXPECT_EQ(client.server.refreshes, 0);
    EXPECT_EQ(client.curl.getOrbit("", &client.reply), kFailed);
}

TEST(CtCurl, AnAccountThatMovesTakesItsClientAlong) {
    Client client;
    client.account.setAccessToken("good");
    const std::string oldFeed = client.curl.feedBase() + "/x";
    ASSERT_EQ(client.curl.get(oldFeed, &client.reply), kOk);
    ScriptedServer next;
    const int requests = client.server.requests;
    std::string nextUrl = next.url();
    vantor_pim_sync_account_s change = client.record();
    change.ctserver = nextUrl.data();
    client.account.update(&change);
    EXPECT_EQ(client.curl.insert(CtItemType::kContact, "<x/>", &client.reply), kOk);
    EXPECT_EQ(client.curl.get(oldFeed, &client.reply), kFailed);
    EXPECT_EQ(client.curl.get(client.curl.feedBase() + "/x", &client.reply), kOk);
    EXPECT_EQ(client.server.requests, requests) << "nothing goes to the old server";
    EXPECT_EQ(next.requests, 2);
    (void)client.curl.getOrbit("p1", &client.reply);
    EXPECT_EQ(next.requests, 3) << "people live at the account's server";
    ASSERT_EQ(vconf_set_str("db/vantor-pim-sync/people_server", client.url.c_str()), 0);
    (void)client.curl.getOrbit("p1", &client.reply);
    EXPECT_EQ(client.server.requests, requests + 1) << "until a setting names another";
    // Port and scheme are the account's as well.
    std::string host = "127.0.0.1";
    change.ctserver = host.data();
    change.ctserverport = 8443;
    change.ssl = true;
    client.account.update(&change);
    EXPECT_EQ(client.curl.feedBase(), "https://127.0.0.1:8443/m8/feeds");
}

TEST(CtCurl, PhotosAreStagedSafely) {
    Client client;
    std::string reply;
    client.account.setAccessToken("good");
    const std::string photoUrl = client.curl.feedBase() + "/photos/media/default/p1";
    struct Case {
        const char* contentType;
        std::string body;
        int result;
    };
    const Case cases[] = {{"image/jpeg", "\xFF\xD8\xFF jpeg", kOk},
                          {"image/jpeg", "", kFailed},
                          {"text/html", "<html>no</html>", kFailed},
                          {"image/jpeg", " \n<html>no</html>", kFailed},
                          {"image/png", std::string(17U << 20, 'x'), kFailed}};
    std::ofstream(client.root.path() / "victim") << "precious";
    for (const Case& row : cases) {
        std::filesystem::create_symlink(client.root.path() / "victim", client.root.at("/tmp/p1"));
        client.server.contentType = row.contentType;
        client.server.body = row.body;
        {
            const std::unique_ptr<CtStagedPhoto> photo = CtStagedPhoto::create("p1");
            ASSERT_NE(photo, nullptr);
            EXPECT_EQ(photo->path(), "/tmp/p1");
            EXPECT_EQ(client.curl.getImage(photoUrl, "\"p\"", photo.get()), row.result) << row.contentType;
            EXPECT_EQ(client.header("If-Match"), "\"p\"");
            const std::unique_ptr<CtStagedPhoto> other = CtStagedPhoto::create("p1");
            ASSERT_NE(other, nullptr);
            EXPECT_NE(other->path(), photo->path()) << "another account's photo of the same id";
        }
        EXPECT_FALSE(std::filesystem::exists(client.root.at("/tmp/p1")));
        EXPECT_EQ(std::filesystem::file_size(client.root.path() / "victim"), 8U) << "a link is not followed";
    }
    for (const char* bad : {"", "../x", ".x", "a/b"}) EXPECT_EQ(CtStagedPhoto::create(bad), nullptr) << bad;
    std::ofstream(client.root.at("/tmp/mine")) << "image";
    client.server.body.clear();
    EXPECT_EQ(client.curl.upsertImage(photoUrl, "", "/tmp/mine", &reply), kOk);
    EXPECT_EQ(client.header("If-Match"), "") << "there was no photo before";
    EXPECT_EQ(client.curl.upsertImage(photoUrl, "", "/tmp/none", &reply), kFailed);
}

TEST(CtCurl, WhatLiesWhereAPhotoIsStagedIsNeitherUsedNorWaitedFor) {
    Client client;
    std::string reply;
    client.account.setAccessToken("good");
    const auto path = client.root.at("/tmp/p1");
    const auto victim = client.root.path() / "victim";
    std::ofstream(victim) << "precious";
    const std::function<void()> planted[] = {
        [&] { ASSERT_EQ(mkfifo(path.c_str(), 0666), 0); },
        [&] { std::filesystem::create_hard_link(victim, path); },
        [&] { std::filesystem::create_symlink(victim, path); },
    };
    for (const auto& plant : planted) {
        plant();
        const std::unique_ptr<CtStagedPhoto> photo = CtStagedPhoto::create("p1");
        ASSERT_NE(photo, nullptr);
        EXPECT_TRUE(std::filesystem::is_regular_file(std::filesystem::symlink_status(path)));
        EXPECT_EQ(std::filesystem::hard_link_count(path), 1U);
        EXPECT_EQ(std::filesystem::status(path).permissions(),
                  std::filesystem::perms::owner_read | std::filesystem::perms::owner_write);
    }
    EXPECT_EQ(std::filesystem::file_size(victim), 8U);
    std::filesystem::create_directory(path);
    EXPECT_EQ(CtStagedPhoto::create("p1"), nullptr);
    std::filesystem::remove(path);
    for (const auto& plant : {planted[0], planted[2]}) {
        plant();
        EXPECT_EQ(client.curl.upsertImage(client.url + "/photo", "", "/tmp/p1", &reply), kFailed);
        std::filesystem::remove(path);
    }
    EXPECT_EQ(client.server.requests, 0) << "what is no plain file is not sent";
}

TEST(CtCurl, TheSizeOfAProfileImage) {
    const char* const cases[][2] = {{"http://x/i", "http://x/i?sz=720"},
                                    {"http://x/i?sz=50", "http://x/i?sz=720"},
                                    {"http://x/i?a=1&sz=50&b=2", "http://x/i?a=1&sz=720&b=2"},
                                    {"http://x/i?a=1", "http://x/i?a=1&sz=720"},
                                    {"http://x/sz=5", "http://x/sz=5?sz=720"}};
    for (const auto& row : cases) EXPECT_EQ(withPhotoSize(row[0]), row[1]);
}
