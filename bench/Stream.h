// Stream: one accepted connection, plain or TLS, and the requests that come over it.
// Owner and thread: the thread that serves the connection. Errors: false, and the connection is over.
#pragma once

#include <openssl/ssl.h>

#include <memory>
#include <string>
#include <string_view>

namespace bench {

struct FreeTls {
    void operator()(SSL* tls) const noexcept { SSL_free(tls); }
    void operator()(SSL_CTX* context) const noexcept { SSL_CTX_free(context); }
};

// What the server looks at of a request.
struct Request {
    std::string method;
    std::string target;
    std::string body;
    std::string authorization;
    bool wantsGzip = false;
};

class Stream {
public:
    // Takes the descriptor over. A context makes it TLS.
    Stream(int fd, SSL_CTX* context);
    ~Stream();
    Stream(const Stream&) = delete;
    Stream& operator=(const Stream&) = delete;

    // Waits for the next request; false at the end of the connection.
    bool read(Request* request);
    bool write(std::string_view bytes);

private:
    bool fillBuffer();
    void readHead(std::string_view head, Request* request, std::size_t* bodyBytes);

    int mFd;
    std::unique_ptr<SSL, FreeTls> mTls;
    std::string mBuffer;
};

}  // namespace bench
