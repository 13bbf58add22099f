#include "PageServer.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include <array>
#include <mutex>
#include <stdexcept>
#include <thread>

#include "Certificate.h"

namespace bench {

namespace {

constexpr const char* kJson = "application/json; charset=UTF-8";
constexpr int kBacklog = 128;
// Behind an address in the map of pages: the answer is compressed.
constexpr char kGzipMark = '\n';

std::shared_ptr<const std::string> shared(std::string text) {
    return std::make_shared<const std::string>(std::move(text));
}

std::unique_ptr<SSL_CTX, FreeTls> makeTls() {
    std::unique_ptr<SSL_CTX, FreeTls> context(SSL_CTX_new(TLS_server_method()));
    const provider::Certificate own = provider::Certificate::make();
    if (!context || SSL_CTX_use_certificate(context.get(), own.certificate.get()) != 1 ||
        SSL_CTX_use_PrivateKey(context.get(), own.key.get()) != 1) {
        throw std::runtime_error("TLS cannot be set up");
    }
    return context;
}

}  // namespace

PageServer::PageServer(const ItemCounts& counts, bool isTls)
    : mIsTls(isTls),
      mSource(counts, isTls),
      mDav(counts),
      mTls(isTls ? makeTls() : nullptr),
      mListening(socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)),
      mAuthorization("Bearer " + mSource.token()),
      mTokenReply(shared(mSource.tokenReply())),
      mUnauthorized(
          shared(makeReply(401, kJson, R"({"error":{"code":401,"message":"Invalid Credentials"}})"))),
      mRefused(shared(makeReply(405, kJson, R"({"error":{"code":405}})"))) {
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    socklen_t size = sizeof address;
    auto* plain = reinterpret_cast<sockaddr*>(&address);
    if (mListening == -1 || bind(mListening, plain, size) != 0 || listen(mListening, kBacklog) != 0 ||
        getsockname(mListening, plain, &size) != 0) {
        throw std::runtime_error("cannot listen on the loopback address");
    }
    mPort = ntohs(address.sin_port);
    mSource.setHost("127.0.0.1:" + std::to_string(mPort));
}

PageServer::~PageServer() {
    close(mListening);
}

provider::Json PageServer::ready() {
    provider::Json body = mSource.ready();
    body["url"] = std::string(mIsTls ? "https" : "http") + "://127.0.0.1:" + std::to_string(mPort);
    body.erase("adminUrl");
    return body;
}

void PageServer::run() {
    for (;;) {
        const int fd = accept4(mListening, nullptr, nullptr, SOCK_CLOEXEC);
        if (fd == -1) continue;
        std::thread([this, fd] { serve(fd); }).detach();
    }
}

void PageServer::serve(int fd) {
    Stream stream(fd, mTls.get());
    Request request;
    bool isCounted = false;
    while (stream.read(&request)) {
        Reply reply;
        if (request.target.starts_with("/bench/")) {
            reply = control(request);
        } else {
            if (!isCounted) ++mConnections;
            isCounted = true;
            ++mRequests;
            reply = answer(request);
            mBytes += static_cast<long>(reply->size());
        }
        if (!stream.write(*reply)) return;
    }
}

PageServer::Reply PageServer::answer(const Request& request) {
    if (request.target == "/o/oauth2/token") return mTokenReply;
    if (DavPages::isDav(request.target))
        return Reply(Reply(), &mDav.answer(request.method, request.target, request.body));
    if (request.authorization != mAuthorization) return mUnauthorized;
    if (request.method == "GET") return page(request.target, request.wantsGzip);
    if (request.method == "POST" && request.body.size() > 2) return uploaded(request);
    return mRefused;
}

PageServer::Reply PageServer::page(const std::string& target, bool isGzip) {
    std::string key = target;
    if (isGzip) key += kGzipMark;
    {
        const std::shared_lock lock(mMutex);
        if (const auto known = mPages.find(key); known != mPages.end()) return known->second;
    }
    ++mMade;
    Reply made = shared(mSource.get(target, isGzip));
    const std::unique_lock lock(mMutex);
    return mPages.insert_or_assign(std::move(key), std::move(made)).first->second;
}

// The item comes back as it was sent, with an id and an etag before it.
PageServer::Reply PageServer::uploaded(const Request& request) {
    const std::string number = std::to_string(++mUploads);
    return shared(makeReply(200, kJson,
                            R"({"kind":"calendar#event","etag":"\"u)" + number + R"(\"","id":"up)" + number +
                                "\"," + request.body.substr(1)));
}

PageServer::Reply PageServer::control(const Request& request) {
    constexpr std::string_view kTouch = "/bench/touch?kind=";
    int status = 200;
    provider::Json body = provider::Json::object();
    if (request.target == "/bench/counters") {
        body = {{"requests", mRequests.load()},
                {"connections", mConnections.load()},
                {"uploads", mUploads.load()},
                {"bytes", mBytes.load()},
                {"pagesMade", mMade.load()}};
    } else if (request.target == "/bench/reset") {
        for (std::atomic<long>* counter : {&mRequests, &mConnections, &mUploads, &mBytes, &mMade})
            *counter = 0;
    } else if (request.target.starts_with(kTouch)) {
        try {
            touch(request.target.substr(kTouch.size()));
        } catch (const provider::ApiError& error) {
            status = error.status;
            body["message"] = error.message;
        }
    } else {
        status = 404;
    }
    return shared(makeReply(status, kJson, body.dump()));
}

// Every page that was made is made again, so that the next reader finds all of them ready.
void PageServer::touch(const std::string& kind) {
    mSource.touch(kind);
    const std::unique_lock lock(mMutex);
    for (auto& [key, reply] : mPages) {
        const bool isGzip = key.back() == kGzipMark;
        reply = shared(mSource.get(isGzip ? key.substr(0, key.size() - 1) : key, isGzip));
    }
}

}  // namespace bench
