#include "DaemonLog.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <syslog.h>
#include <systemd/sd-journal.h>
#include <time.h>

#include <cerrno>
#include <charconv>
#include <cstring>
#include <memory>

#include "DaemonProcess.h"
#include "Device.h"
#include "Failure.h"
#include "Handles.h"
#include "platform/log.h"
#include "platform/root.h"

namespace daemon_log {

namespace {

constexpr off_t kMostBytes = 16 * 1024 * 1024;
constexpr const char* kUnit = "_SYSTEMD_UNIT=vantor-pim-sync.service";
constexpr const char* kAccountField = "ACCOUNT=";

bool isAbout(const std::string& line, int account) {
    return account == 0 || line.find("): [" + std::to_string(account) + " ") != std::string::npos;
}

void keepLast(std::deque<std::string>& lines, std::string line, size_t most) {
    lines.push_back(std::move(line));
    if (lines.size() > most) lines.pop_front();
}

std::string tailOf(const std::string& path) {
    const Descriptor file(open(path.c_str(), O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC));
    if (!file && errno == ENOENT) return {};
    struct stat info {};
    if (!file || fstat(file.get(), &info) != 0 || !S_ISREG(info.st_mode))
        throw Failure("the daemon's log " + path + " cannot be read: " + std::strerror(errno));
    const off_t begin = info.st_size > kMostBytes ? info.st_size - kMostBytes : 0;
    std::string text(static_cast<size_t>(info.st_size - begin), '\0');
    const ssize_t got = pread(file.get(), text.data(), text.size(), begin);
    if (got < 0) throw Failure("the daemon's log " + path + " cannot be read: " + std::strerror(errno));
    text.resize(static_cast<size_t>(got));
    if (begin > 0) text.erase(0, text.find('\n') + 1);  // the first may be the rest of one
    return text;
}

std::deque<std::string> fromFile(int account, size_t most) {
    const std::string text = tailOf(platform::rootedPath(DaemonProcess::kLog));
    std::deque<std::string> lines;
    for (size_t at = 0; at < text.size();) {
        const size_t end = std::min(text.find('\n', at), text.size());
        std::string line = text.substr(at, end - at);
        if (isAbout(line, account)) keepLast(lines, std::move(line), most);
        at = end + 1;
    }
    return lines;
}

struct JournalDeleter {
    void operator()(sd_journal* journal) const noexcept { sd_journal_close(journal); }
};
using Journal = std::unique_ptr<sd_journal, JournalDeleter>;

void checkJournal(int code) {
    if (code < 0) {
        throw Failure(std::string("the journal cannot be read: ") + std::strerror(-code) +
                      "; run it as root or as a member of the group systemd-journal");
    }
}

std::string fieldOf(sd_journal* journal, const std::string& name) {
    const void* data = nullptr;
    size_t size = 0;
    if (sd_journal_get_data(journal, name.c_str(), &data, &size) < 0) return {};
    const std::string field(static_cast<const char*>(data), size);
    return field.substr(std::min(name.size() + 1, field.size()));
}

std::string lineOf(sd_journal* journal) {
    constexpr uint64_t kMicroseconds = 1'000'000;
    uint64_t when = 0;
    if (sd_journal_get_realtime_usec(journal, &when) < 0) return fieldOf(journal, "MESSAGE");
    const auto seconds = static_cast<time_t>(when / kMicroseconds);
    tm parts{};
    localtime_r(&seconds, &parts);
    char text[32];
    (void)strftime(text, sizeof text, "%m-%d %H:%M:%S", &parts);
    int severity = LOG_INFO;
    const std::string priority = fieldOf(journal, "PRIORITY");
    std::from_chars(priority.data(), priority.data() + priority.size(), severity);
    return std::string(text) + " " + dlog_letter_of_syslog(severity) + "/" + fieldOf(journal, "TAG") + ": " +
           fieldOf(journal, "MESSAGE");
}

std::deque<std::string> fromJournal(int account, size_t most) {
    sd_journal* raw = nullptr;
    checkJournal(sd_journal_open(&raw, SD_JOURNAL_LOCAL_ONLY | SD_JOURNAL_SYSTEM));
    const Journal journal(raw);
    checkJournal(sd_journal_add_match(raw, kUnit, 0));
    if (account != 0)
        checkJournal(sd_journal_add_match(raw, (kAccountField + std::to_string(account)).c_str(), 0));
    checkJournal(sd_journal_seek_tail(raw));
    std::deque<std::string> lines;
    while (lines.size() < most && sd_journal_previous(raw) > 0) lines.push_front(lineOf(raw));
    return lines;
}

}  // namespace

std::deque<std::string> last(int account, size_t most) {
    return device::isPrivate() ? fromFile(account, most) : fromJournal(account, most);
}

std::string plain(const std::string& line) {
    std::string text;
    for (size_t at = 0; at < line.size(); ++at) {
        const size_t end = line[at] == '\033' ? line.find('m', at) : std::string::npos;
        if (end == std::string::npos) {
            text += line[at];
        } else {
            at = end;
        }
    }
    return text;
}

}  // namespace daemon_log
