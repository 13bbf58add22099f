#include "e2e/Provider.h"

#include <gtest/gtest.h>
#include <httplib.h>

using nlohmann::json;

Provider::Provider(const std::vector<std::string>& arguments) {
    std::vector<std::string> command = {std::string(VPS_BIN_DIR) + "/vantor-pim-provider", "--port", "0"};
    command.insert(command.end(), arguments.begin(), arguments.end());
    mProcess = std::make_unique<Process>(command, Environment{});
    const json ready =
        json::parse(mProcess->readLine(20'000).value_or(""), nullptr, /*allow_exceptions=*/false);
    if (ready.is_discarded()) {
        ADD_FAILURE() << "the provider did not start";
        return;
    }
    mUrl = ready["url"];
    mClientId = ready["clientId"];
    mClientSecret = ready["clientSecret"];
    for (const json& account : ready["accounts"])
        mAccounts.push_back({account["email"], account["refreshToken"]});
}

json Provider::admin(const std::string& method, const std::string& path, const json& body) {
    return attempt(method, path, body, [](int, const std::string&) { return false; });
}

json Provider::attempt(const std::string& method, const std::string& path, const json& body,
                       bool (*mayFail)(int status, const std::string& answer)) {
    httplib::Client client(mUrl);
    client.enable_server_certificate_verification(false);
    client.set_read_timeout(60);
    httplib::Request request;
    request.method = method;
    request.path = "/admin" + path;
    if (!body.is_null()) {
        request.body = body.dump();
        request.set_header("Content-Type", "application/json");
    }
    const httplib::Result result = client.send(request);
    if (result && result->status >= 300 && mayFail(result->status, result->body)) return nullptr;
    if (!result || result->status >= 300) {
        ADD_FAILURE() << method << ' ' << path << ": " << (result ? result->body : to_string(result.error()));
        return nullptr;
    }
    return json::parse(result->body, nullptr, /*allow_exceptions=*/false);
}

json Provider::read(const std::string& path) {
    httplib::Client client(mUrl);
    const httplib::Params grant = {{"client_id", mClientId},
                                   {"client_secret", mClientSecret},
                                   {"refresh_token", mAccounts.at(0).refreshToken},
                                   {"grant_type", "refresh_token"}};
    const httplib::Result token = client.Post("/o/oauth2/token", grant);
    if (!token) return nullptr;
    const std::string bearer = "Bearer " + json::parse(token->body).value("access_token", "");
    const httplib::Result result = client.Get(path, {{"Authorization", bearer}, {"XData-Version", "3.0"}});
    EXPECT_TRUE(result && result->status == 200) << path << ": " << (result ? result->body : "no answer");
    return result ? json::parse(result->body, nullptr, /*allow_exceptions=*/false) : json();
}

std::string Provider::bytes(const std::string& path) {
    httplib::Client client(mUrl);
    const httplib::Result result = client.Get(path);
    EXPECT_TRUE(result && result->status == 200) << path;
    return result ? result->body : std::string();
}

void Provider::putBytes(const std::string& path, const std::string& content, const std::string& type) {
    httplib::Client client(mUrl);
    const httplib::Result result = client.Put(path, content, type);
    EXPECT_TRUE(result && (result->status < 300 || result->status == 404)) << path;  // it may have gone
}
