// PageServer: ready-made answers over HTTP or HTTPS on the loopback address. The first request for an address asks the source, every
// later one costs a look-up and a send. Takes uploads of new items with an answer made from the upload.
// Threads: one a connection; start and stop by the owner. TLS with a certificate made at start.
//
// Control, neither counted nor authorised: GET /bench/counters, POST /bench/reset (counters), POST /bench/touch?kind=event|contact|task.
#pragma once

#include <atomic>
#include <memory>
#include <shared_mutex>
#include <string>
#include <unordered_map>

#include "DavPages.h"
#include "PageSource.h"
#include "Stream.h"

namespace bench {

class PageServer {
public:
    PageServer(const ItemCounts& counts, bool isTls);
    ~PageServer();
    PageServer(const PageServer&) = delete;
    PageServer& operator=(const PageServer&) = delete;

    // Listens on a free port and serves until the process ends.
    void run();
    [[nodiscard]] provider::Json ready();

private:
    using Reply = std::shared_ptr<const std::string>;

    void serve(int fd);
    Reply answer(const Request& request);
    Reply page(const std::string& target, bool isGzip);
    Reply uploaded(const Request& request);
    Reply control(const Request& request);
    void touch(const std::string& kind);

    const bool mIsTls;
    PageSource mSource;
    DavPages mDav;
    std::unique_ptr<SSL_CTX, FreeTls> mTls;
    int mListening = -1;
    int mPort = 0;
    const std::string mAuthorization;
    const Reply mTokenReply;
    const Reply mUnauthorized;
    const Reply mRefused;

    std::shared_mutex mMutex;  // of the pages
    std::unordered_map<std::string, Reply> mPages;

    std::atomic<long> mRequests{0};
    std::atomic<long> mConnections{0};
    std::atomic<long> mUploads{0};
    std::atomic<long> mBytes{0};
    std::atomic<long> mMade{0};  // pages that had to be asked for
};

}  // namespace bench
