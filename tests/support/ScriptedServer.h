// ScriptedServer: a server on the loopback interface that answers every request with what the test says.
#pragma once

#include <httplib.h>

#include <atomic>
#include <chrono>
#include <mutex>
#include <string>
#include <thread>

// Accepts one token; the token endpoint hands it out.
class ScriptedServer {
public:
    ScriptedServer() {
        mServer.Post("/o/oauth2/token", [this](const httplib::Request& request, httplib::Response& response) {
            ++refreshes;
            lastTokenBody = request.body;
            response.set_content(tokenReply, "application/json");
        });
        mServer.set_pre_routing_handler([this](const httplib::Request& request, httplib::Response& response) {
            if (request.path == "/o/oauth2/token") return httplib::Server::HandlerResponse::Unhandled;
            ++requests;
            std::this_thread::sleep_for(std::chrono::milliseconds(delayMs));
            {
                const std::lock_guard lock(mMutex);  // several connections are served at once
                lastPath = request.target;
                lastMethod = request.method;
                lastHeaders = request.headers;
            }
            if (request.get_header_value("Authorization") != "Bearer good") {
                response.status = 401;
                response.set_content(R"({"error":{"code":401}})", "application/json");
            } else {
                response.status = status;
                if (status == 302) response.set_header("Location", "/elsewhere");
                response.set_content(body, contentType);
            }
            return httplib::Server::HandlerResponse::Handled;
        });
        mPort = mServer.bind_to_any_port("127.0.0.1");
        mThread = std::thread([this] { mServer.listen_after_bind(); });
        // A stop that comes before the server runs is lost.
        while (!mServer.is_running()) std::this_thread::yield();
    }
    ~ScriptedServer() {
        mServer.stop();
        mThread.join();
    }
    [[nodiscard]] std::string url() const { return "http://127.0.0.1:" + std::to_string(mPort); }

    std::atomic<int> requests{0};
    std::atomic<int> refreshes{0};
    std::atomic<int> delayMs{0};
    int status = 200;
    std::string body = "{}";
    std::string contentType = "application/json";
    std::string tokenReply = R"({"access_token":"good"})";
    std::string lastPath, lastMethod, lastTokenBody;
    httplib::Headers lastHeaders;

private:
    std::mutex mMutex;
    httplib::Server mServer;
    int mPort = 0;
    std::thread mThread;
};
