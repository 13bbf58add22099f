// LogCapture: the lines that this process logs while the object lives. One at a time.
#pragma once

#include <mutex>
#include <string>

#include "platform/log.h"

class LogCapture {
public:
    LogCapture() { dlog_set_sink(take, this); }
    ~LogCapture() { dlog_set_sink(nullptr, nullptr); }
    LogCapture(const LogCapture&) = delete;
    LogCapture& operator=(const LogCapture&) = delete;

    // How often a text was logged.
    [[nodiscard]] int count(const std::string& text) const {
        const std::lock_guard lock(mMutex);
        int found = 0;
        for (size_t at = mLines.find(text); at != std::string::npos; at = mLines.find(text, at + 1)) ++found;
        return found;
    }

private:
    static void take(log_priority /*priority*/, const char* /*tag*/, const char* message, void* self) {
        auto* capture = static_cast<LogCapture*>(self);
        const std::lock_guard lock(capture->mMutex);
        capture->mLines.append(message).append("\n");
    }

    mutable std::mutex mMutex;
    std::string mLines;
};
