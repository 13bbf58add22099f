// ProviderServer: the provider as an HTTP or HTTPS server on the loopback address.
// Threads: start, stop and the store's filling by the owner; requests on a pool of its own.
#pragma once

#include <chrono>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "Context.h"
#include "Services.h"

namespace httplib {
class Server;
struct Request;
struct Response;
}  // namespace httplib

namespace provider {

struct ServerOptions {
    int port = 0;  // 0: any free one
    bool isTls = false;
    bool isQuiet = false;  // no line per request on standard error
    std::chrono::milliseconds latency{0};
    std::chrono::seconds tokenLifetime{3600};
};

class ProviderServer {
public:
    explicit ProviderServer(const ServerOptions& options);
    ~ProviderServer();
    ProviderServer(const ProviderServer&) = delete;
    ProviderServer& operator=(const ProviderServer&) = delete;

    // Returns when connections are accepted. Throws std::runtime_error when the port cannot be had.
    void start();
    // Requests in progress end, waiting ones are let go. May be called again.
    void stop();

    [[nodiscard]] Store& store() { return mContext.store; }
    [[nodiscard]] int port() const { return mPort; }
    [[nodiscard]] std::string url() const;
    // What a client needs to know: address, credentials, accounts, with TLS the certificate.
    [[nodiscard]] Json ready();

private:
    struct Outcome;
    void prepare();
    void serve(const httplib::Request& request, httplib::Response& response);
    void refused(const httplib::Request& request, httplib::Response& response);
    void answer(Call& call, Outcome& outcome);
    Reply run(Call& call, const Route* route, const ApiError& missing);
    void spoil(const Fault& fault, Outcome& outcome);
    void deliver(Outcome& outcome, httplib::Response& response);
    [[nodiscard]] std::string owner(const Call& call) const;
    void record(const Call& call, const Outcome& outcome, double elapsedMs);

    const ServerOptions mOptions;
    Context mContext;
    Router mRouter;
    std::vector<std::unique_ptr<Service>> mServices;
    std::unique_ptr<httplib::Server> mServer;
    std::string mCertificate;
    int mListening = -1;
    int mPort = 0;
    std::thread mThread;
};

}  // namespace provider
