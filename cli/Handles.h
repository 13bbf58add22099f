// Handles.h: owners for the C handles and descriptors that the tool uses.
#pragma once

#include <glib.h>
#include <unistd.h>

#include <memory>
#include <utility>

struct GCharsDeleter {
    void operator()(char* text) const noexcept { g_free(text); }
};
using GChars = std::unique_ptr<char, GCharsDeleter>;

// A file descriptor that is closed with its owner; -1 is none.
class Descriptor {
public:
    Descriptor() = default;
    explicit Descriptor(int fd) : mFd(fd) {}
    Descriptor(Descriptor&& other) noexcept : mFd(std::exchange(other.mFd, -1)) {}
    Descriptor& operator=(Descriptor&& other) noexcept {
        std::swap(mFd, other.mFd);
        return *this;
    }
    ~Descriptor() { reset(); }

    void reset() {
        if (mFd >= 0) close(mFd);
        mFd = -1;
    }
    [[nodiscard]] int get() const { return mFd; }
    explicit operator bool() const { return mFd >= 0; }

private:
    int mFd = -1;
};
