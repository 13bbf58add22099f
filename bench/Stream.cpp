#include "Stream.h"

#include <netinet/in.h>
#include <netinet/tcp.h>
#include <strings.h>
#include <sys/socket.h>
#include <unistd.h>

#include <charconv>

namespace bench {

namespace {

constexpr std::size_t kChunk = 65536;

bool startsWith(std::string_view line, std::string_view name) {
    return line.size() >= name.size() && strncasecmp(line.data(), name.data(), name.size()) == 0;
}

std::string_view valueOf(std::string_view line) {
    line.remove_prefix(line.find(':') + 1);
    while (line.starts_with(' ')) line.remove_prefix(1);
    return line;
}

}  // namespace

Stream::Stream(int fd, SSL_CTX* context) : mFd(fd) {
    const int on = 1;
    setsockopt(fd, IPPROTO_TCP, TCP_NODELAY, &on, sizeof on);
    if (context == nullptr) return;
    mTls.reset(SSL_new(context));
    if (mTls && (SSL_set_fd(mTls.get(), fd) != 1 || SSL_accept(mTls.get()) != 1)) {
        close(mFd);
        mFd = -1;
    }
}

Stream::~Stream() {
    if (mTls) SSL_shutdown(mTls.get());
    if (mFd != -1) close(mFd);
}

bool Stream::fillBuffer() {
    if (mFd == -1) return false;
    const std::size_t before = mBuffer.size();
    mBuffer.resize(before + kChunk);
    const long got = mTls ? SSL_read(mTls.get(), mBuffer.data() + before, static_cast<int>(kChunk))
                          : recv(mFd, mBuffer.data() + before, kChunk, 0);
    mBuffer.resize(before + static_cast<std::size_t>(got > 0 ? got : 0));
    return got > 0;
}

void Stream::readHead(std::string_view head, Request* request, std::size_t* bodyBytes) {
    const std::string_view first = head.substr(0, head.find("\r\n"));
    const std::size_t space = first.find(' ');
    const std::size_t end = first.rfind(' ');
    request->method = first.substr(0, space);
    request->target = end > space ? first.substr(space + 1, end - space - 1) : std::string_view();
    for (std::size_t at = first.size(); at < head.size();) {
        const std::size_t begin = at + 2;
        at = std::min(head.find("\r\n", begin), head.size());
        const std::string_view line = head.substr(std::min(begin, head.size()), at - begin);
        if (startsWith(line, "content-length:")) {
            const std::string_view value = valueOf(line);
            std::from_chars(value.data(), value.data() + value.size(), *bodyBytes);
        } else if (startsWith(line, "authorization:")) {
            request->authorization = valueOf(line);
        } else if (startsWith(line, "accept-encoding:")) {
            request->wantsGzip = line.find("gzip") != std::string_view::npos;
        }
    }
}

bool Stream::read(Request* request) {
    constexpr std::string_view kEnd = "\r\n\r\n";
    std::size_t head = 0;
    while ((head = mBuffer.find(kEnd)) == std::string::npos) {
        if (!fillBuffer()) return false;
    }
    *request = Request();
    std::size_t bodyBytes = 0;
    readHead(std::string_view(mBuffer).substr(0, head), request, &bodyBytes);
    const std::size_t body = head + kEnd.size();
    while (mBuffer.size() < body + bodyBytes) {
        if (!fillBuffer()) return false;
    }
    request->body = mBuffer.substr(body, bodyBytes);
    mBuffer.erase(0, body + bodyBytes);
    return true;
}

bool Stream::write(std::string_view bytes) {
    while (!bytes.empty()) {
        const long put = mTls ? SSL_write(mTls.get(), bytes.data(), static_cast<int>(bytes.size()))
                              : send(mFd, bytes.data(), bytes.size(), MSG_NOSIGNAL);
        if (put <= 0) return false;
        bytes.remove_prefix(static_cast<std::size_t>(put));
    }
    return true;
}

}  // namespace bench
