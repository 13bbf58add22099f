#include "ProviderServer.h"

#include <httplib.h>
#include <netinet/in.h>
#include <sys/socket.h>

#include <algorithm>
#include <cstdio>
#include <stdexcept>

#include "Certificate.h"
#include "Guard.h"
#include "Gzip.h"
#include "Sockets.h"

namespace provider {

namespace {

constexpr const char* kHost = "127.0.0.1";
constexpr std::size_t kThreads = 64;  // each open connection keeps one
constexpr int kBacklog = 128;
constexpr time_t kKeepAliveSeconds = 30;
constexpr std::size_t kMaxPayloadBytes = 64 << 20;
constexpr std::size_t kMaxTargetBytes = 4096;

bool takesBody(const std::string& method) {
    return method == "POST" || method == "PUT" || method == "PATCH";
}

// The service compresses only for clients that say so twice.
bool wantsGzip(const Call& call) {
    return call.header("Accept-Encoding").find("gzip") != std::string::npos &&
           call.header("User-Agent").find("gzip") != std::string::npos;
}

// Of the target alone: the library mixes the members of a form body into its own parameters.
std::multimap<std::string, std::string> readQuery(const std::string& target) {
    std::multimap<std::string, std::string> query;
    const std::size_t begin = target.find('?');
    if (begin == std::string::npos) return query;
    for (std::string pair : splitText(std::string_view(target).substr(begin + 1), '&')) {
        if (pair.empty()) continue;
        std::replace(pair.begin(), pair.end(), '+', ' ');
        const std::size_t equals = std::min(pair.find('='), pair.size());
        query.emplace(decodeSegment(pair.substr(0, equals)),
                      decodeSegment(std::string_view(pair).substr(std::min(equals + 1, pair.size()))));
    }
    return query;
}

Reply errorReply(const ApiError& error) {
    Reply reply;
    reply.status = error.status;
    reply.body = errorBody(error);
    if (error.status == 401)
        reply.headers["WWW-Authenticate"] = "Bearer realm=\"provider\", error=invalid_token";
    return reply;
}

}  // namespace

struct ProviderServer::Outcome {
    Reply reply;
    std::string name;  // the route's, for counting
    bool isAdmin = false;
    bool isGzip = false;
    bool isReset = false;
    bool isCut = false;
    bool isCorrupt = false;
    bool isShort = false;
};

ProviderServer::ProviderServer(const ServerOptions& options)
    : mOptions(options), mContext(options.tokenLifetime), mServices(makeServices(mContext)) {
    for (const auto& service : mServices) service->addRoutes(mRouter);
}

ProviderServer::~ProviderServer() {
    stop();
}

void ProviderServer::prepare() {
    if (mOptions.isTls) {
        const Certificate made = Certificate::make();
        mCertificate = made.pem;
        mServer = std::make_unique<httplib::SSLServer>(made.certificate.get(), made.key.get());
    } else {
        mServer = std::make_unique<httplib::Server>();
    }
    if (!mServer->is_valid()) throw std::runtime_error("cannot set up the server");
    mServer->new_task_queue = [] { return new httplib::ThreadPool(kThreads); };
    mServer->set_keep_alive_max_count(1'000'000'000);
    mServer->set_keep_alive_timeout(kKeepAliveSeconds);
    mServer->set_tcp_nodelay(true);
    mServer->set_payload_max_length(kMaxPayloadBytes);
    // The library's own choice would let two providers share a port unnoticed.
    mServer->set_socket_options([this](socket_t fd) {
        const int on = 1;
        setsockopt(fd, SOL_SOCKET, SO_REUSEADDR, &on, sizeof on);
        mListening = fd;
    });
    const auto handle = [this](const httplib::Request& request, httplib::Response& response) {
        serve(request, response);
    };
    // Requests without a body are served before the library would wait for one.
    mServer->set_pre_routing_handler([this](const httplib::Request& request, httplib::Response& response) {
        const bool hasBody = request.has_header("Content-Length") || request.has_header("Transfer-Encoding");
        if (hasBody && request.target.size() <= kMaxTargetBytes)
            return httplib::Server::HandlerResponse::Unhandled;
        if (takesBody(request.method)) {
            response.status = hasBody ? 414 : 411;
            refused(request, response);
        } else {
            serve(request, response);
        }
        return httplib::Server::HandlerResponse::Handled;
    });
    const char* any = "[\\s\\S]*";
    mServer->Get(any, handle).Post(any, handle).Put(any, handle).Patch(any, handle).Delete(any, handle);
    mServer->set_error_handler([this](const httplib::Request& request, httplib::Response& response) {
        if (!response.has_header("Content-Type")) refused(request, response);
    });
}

void ProviderServer::start() {
    prepare();
    mPort = mOptions.port;
    if (mPort == 0) {
        mPort = mServer->bind_to_any_port(kHost);
        if (mPort <= 0) throw std::runtime_error("cannot bind to a port");
    } else if (!mServer->bind_to_port(kHost, mPort)) {
        throw std::runtime_error("cannot bind to port " + std::to_string(mPort));
    }
    // The library's backlog of five makes a burst of connections wait for a second.
    ::listen(mListening, kBacklog);
    mThread = std::thread([this] { mServer->listen_after_bind(); });
    while (!mServer->is_running()) std::this_thread::yield();
}

void ProviderServer::stop() {
    if (!mThread.joinable()) return;
    mContext.faults.stop();
    mServer->stop();
    endConnections(mPort);
    mThread.join();
}

std::string ProviderServer::url() const {
    return std::string(mOptions.isTls ? "https" : "http") + "://" + kHost + ":" + std::to_string(mPort);
}

Json ProviderServer::ready() {
    const auto lock = mContext.store.guard();
    Json body = {{"url", url()},
                 {"clientId", mContext.store.clientId},
                 {"clientSecret", mContext.store.clientSecret},
                 {"accounts", Json::array()}};
    for (const auto& [email, account] : mContext.store.accounts()) {
        Json calendars = Json::array();
        for (const CalendarEntry& entry : account.calendars) calendars.push_back(entry.calendarId);
        body["accounts"].push_back({{"email", email},
                                    {"name", account.name},
                                    {"refreshToken", account.refreshToken},
                                    {"calendars", calendars}});
    }
    body["adminUrl"] = url() + "/admin";
    if (!mCertificate.empty()) body["certificate"] = mCertificate;
    return body;
}

void ProviderServer::serve(const httplib::Request& request, httplib::Response& response) {
    const auto begin = std::chrono::steady_clock::now();
    Call call;
    call.method = request.method;
    call.target = request.target;
    call.path = request.target.substr(0, request.target.find_first_of("?#"));
    call.query = readQuery(request.target);
    call.body = request.body;
    call.header = [&request](const char* name) { return request.get_header_value(name); };
    call.origin = std::string(mOptions.isTls ? "https" : "http") + "://" + call.header("Host");
    Outcome outcome;
    answer(call, outcome);
    if (outcome.isReset) {
        resetConnection(mPort, request.remote_port);
    }
    deliver(outcome, response);
    const std::chrono::duration<double, std::milli> elapsed = std::chrono::steady_clock::now() - begin;
    record(call, outcome, elapsed.count());
}

// What the library itself refuses gets the provider's error body and its line in the log.
void ProviderServer::refused(const httplib::Request& request, httplib::Response& response) {
    const ApiError error{response.status, response.status == 413 ? "uploadTooLarge" : "badRequest",
                         "The request could not be read (" + std::to_string(response.status) + ")", ""};
    Reply reply = errorReply(error);
    response.set_content(reply.body, reply.contentType);
    Call call;
    call.method = request.method;
    call.target = request.target;
    call.header = [&request](const char* name) { return request.get_header_value(name); };
    Outcome outcome;
    outcome.name = request.target.substr(0, request.target.find('?'));
    outcome.reply = std::move(reply);
    record(call, outcome, 0);
}

void ProviderServer::answer(Call& call, Outcome& outcome) {
    const Route* route = nullptr;
    ApiError missing;
    try {
        route = &mRouter.find(call.method, call.path, call.ids);
    } catch (const ApiError& error) {
        missing = error;
    }
    outcome.name = route != nullptr ? route->pattern : call.path;
    const bool isControl = route != nullptr && route->access == Access::kAdmin;
    outcome.isAdmin = isControl || call.path.starts_with("/admin");
    if (outcome.isAdmin) {
        outcome.reply = run(call, route, missing);
        return;
    }
    mContext.faults.pass(call);
    if (mOptions.latency.count() > 0) mContext.faults.pause(mOptions.latency);
    const auto fault = mContext.faults.take(call);
    const bool isDelay = fault && fault->kind == FaultKind::kDelay;
    if (isDelay && !fault->afterHandling) mContext.faults.pause(fault->delay);
    if (fault) fault->rewrite(call);
    if (!fault || isDelay || fault->afterHandling) outcome.reply = run(call, route, missing);
    if (fault) spoil(*fault, outcome);
    outcome.isGzip = wantsGzip(call) && !outcome.reply.body.empty();
}

Reply ProviderServer::run(Call& call, const Route* route, const ApiError& missing) {
    try {
        checkCaller(call);
        if (route == nullptr) throw missing;
        if (route->access == Access::kToken) {
            call.account = owner(call);
            if (call.account.empty())
                throw ApiError{401, "authError", "Invalid Credentials", "Authorization"};
        }
        Reply reply = route->handler(call);
        const bool mayChange = call.method != "GET" && route->access != Access::kOpen;
        if (mayChange && reply.status < 400) ++mContext.changes;
        if (route->access != Access::kToken) protectReply(reply);
        return reply;
    } catch (const ApiError& error) {
        return errorReply(error);
    } catch (const std::exception& error) {
        std::fprintf(stderr, "%s %s failed: %s\n", call.method.c_str(), call.path.c_str(), error.what());
        return errorReply({500, "backendError", "Backend Error", ""});
    }
}

std::string ProviderServer::owner(const Call& call) const {
    constexpr std::string_view kScheme = "Bearer ";
    const std::string header = call.header("Authorization");
    return header.starts_with(kScheme) ? mContext.tokens.owner(header.substr(kScheme.size())) : "";
}

void ProviderServer::spoil(const Fault& fault, Outcome& outcome) {
    Reply& reply = outcome.reply;
    switch (fault.kind) {
        case FaultKind::kDelay:
            if (fault.afterHandling) mContext.faults.pause(fault.delay);
            break;
        case FaultKind::kStatus:
            reply = errorReply({fault.status == 0 ? 503 : fault.status, "backendError", "Backend Error", ""});
            break;
        case FaultKind::kReset:
            outcome.isReset = true;
            break;
        case FaultKind::kCut:
            outcome.isCut = true;
            break;
        case FaultKind::kCorruptGzip:
            outcome.isCorrupt = true;
            break;
        case FaultKind::kShortGzip:
            outcome.isShort = true;
            break;
        case FaultKind::kBody:
            reply.body.clear();
            break;
        case FaultKind::kRewrite:
            break;
    }
    if (fault.body) reply.body = *fault.body;
    if (fault.status != 0) reply.status = fault.status;
    for (const auto& [name, value] : fault.headers) reply.headers[name] = value;
}

void ProviderServer::deliver(Outcome& outcome, httplib::Response& response) {
    Reply& reply = outcome.reply;
    if (outcome.isCorrupt || outcome.isShort) outcome.isGzip = true;
    if (outcome.isGzip) reply.body = gzip(reply.body);
    if (outcome.isCorrupt) {
        // Behind the gzip header, so that it is found only while inflating.
        for (std::size_t i = 10; i < reply.body.size(); i += 7)
            reply.body[i] = static_cast<char>(~reply.body[i]);
    }
    if (outcome.isShort) reply.body.resize(reply.body.size() / 2);
    response.status = reply.status;
    if (outcome.isGzip) response.set_header("Content-Encoding", "gzip");
    if (!outcome.isAdmin) response.set_header("Vary", "Accept-Encoding, User-Agent");
    const auto type = reply.headers.find("Content-Type");
    const std::string contentType = type == reply.headers.end() ? reply.contentType : type->second;
    for (const auto& [name, value] : reply.headers) {
        if (name != "Content-Type") response.set_header(name, value);
    }
    if (outcome.isReset) {
        outcome.reply.status = 0;
        return;
    }
    if (outcome.isCut) {
        const std::string part = reply.body.substr(0, reply.body.size() / 2);
        response.set_content_provider(std::max<std::size_t>(reply.body.size(), 1), contentType,
                                      [part](std::size_t, std::size_t, httplib::DataSink& sink) {
                                          sink.write(part.data(), part.size());
                                          return false;
                                      });
        return;
    }
    if (reply.status != 204) response.set_content(reply.body, contentType);
}

void ProviderServer::record(const Call& call, const Outcome& outcome, double elapsedMs) {
    const std::string target = withoutSecrets(call.target);
    // A page that is open asks for news all the time, which tells nobody anything.
    if (!mOptions.isQuiet && outcome.name != "/admin/news") {
        std::fprintf(stderr, "%s %s %d %zu %.1fms\n", call.method.c_str(), target.c_str(),
                     outcome.reply.status, outcome.reply.body.size(), elapsedMs);
    }
    if (outcome.isAdmin) return;
    mContext.log.add(outcome.name,
                     {call.method, target, outcome.reply.status, outcome.reply.body.size(),
                      !call.header("Authorization").empty(), outcome.isGzip, call.account, elapsedMs});
}

}  // namespace provider
