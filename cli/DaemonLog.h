// DaemonLog.h: the lines that the daemon wrote.
#pragma once

#include <cstddef>
#include <deque>
#include <string>

namespace daemon_log {

// The last `most` lines, the oldest first; `account` 0: all. Of a log file only the last 16 MB are looked at.
// A Failure when there is a log that cannot be read.
std::deque<std::string> last(int account, size_t most);

// Without the colours that the daemon gives to grave lines.
std::string plain(const std::string& line);

}  // namespace daemon_log
