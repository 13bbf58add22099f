#include "platform/log.h"

#include <sys/stat.h>
#include <sys/uio.h>
#include <systemd/sd-journal.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <mutex>
#include <string>
#include <vector>

namespace {

constexpr size_t kMaxMessageBytes = 4096;

struct PriorityName {
    log_priority priority;
    const char* name;
    char letter;
    int syslog;
};
// From the least grave on.
constexpr PriorityName kPriorities[] = {
    {DLOG_DEBUG, "debug", 'D', 7},
    {DLOG_INFO, "info", 'I', 6},
    {DLOG_WARN, "warning", 'W', 4},
    {DLOG_ERROR, "error", 'E', 3},
};

const PriorityName& nameOf(log_priority priority) {
    for (const PriorityName& row : kPriorities) {
        if (row.priority == priority) return row;
    }
    return kPriorities[3];
}

log_priority initialThreshold() {
    const char* wanted = std::getenv("VANTOR_PIM_SYNC_LOG");
    for (const PriorityName& row : kPriorities) {
        if (wanted != nullptr && std::strcmp(row.name, wanted) == 0) return row.priority;
    }
    return DLOG_INFO;
}

std::atomic<log_priority>& threshold() {
    static std::atomic<log_priority> value{initialThreshold()};
    return value;
}

struct Sink {
    std::mutex mutex;
    void (*write)(log_priority, const char*, const char*, void*) = nullptr;
    void* userData = nullptr;
};

Sink& sink() {
    static Sink* const instance = new Sink;
    return *instance;
}

// Whether standard error is the journal's own stream.
bool goesToJournal() {
    const char* stream = std::getenv("JOURNAL_STREAM");
    struct stat info {};
    if (stream == nullptr || fstat(STDERR_FILENO, &info) != 0) return false;
    unsigned long device = 0;
    unsigned long inode = 0;
    return std::sscanf(stream, "%lu:%lu", &device, &inode) == 2 && device == info.st_dev &&
           inode == info.st_ino;
}

thread_local const LogContext* context = nullptr;

// "[7 calendar] "; nothing where a line is about the whole program.
std::string contextText() {
    if (context == nullptr) return {};
    return "[" + std::to_string(context->accountId()) + " " + context->kind() + "] ";
}

// Length of the colour sequence at `text` ("ESC [ digits and semicolons m"), 0 when there is none.
size_t colourLength(const char* text) {
    if (text[0] != '\033' || text[1] != '[') return 0;
    const size_t digits = std::strspn(text + 2, "0123456789;");
    return text[2 + digits] == 'm' ? digits + 3 : 0;
}

// Text from outside must not forge lines or move the cursor of a terminal.
void replaceControls(std::string* message) {
    for (size_t i = 0; i < message->size(); ++i) {
        const auto byte = static_cast<unsigned char>((*message)[i]);
        if (byte >= 0x20 && byte != 0x7f) continue;
        if (const size_t length = colourLength(message->c_str() + i); length != 0) {
            i += length - 1;
        } else {
            (*message)[i] = ' ';
        }
    }
}

int writeToStandardError(log_priority priority, const char* tag, const std::string& message) {
    timespec now{};
    clock_gettime(CLOCK_REALTIME, &now);
    tm parts{};
    localtime_r(&now.tv_sec, &parts);
    char head[128];
    const int length =
        std::snprintf(head, sizeof head, "%02d-%02d %02d:%02d:%02d.%03ld %c/%s(%d): ", parts.tm_mon + 1,
                      parts.tm_mday, parts.tm_hour, parts.tm_min, parts.tm_sec, now.tv_nsec / 1'000'000,
                      nameOf(priority).letter, tag, getpid());
    const std::string line = std::string(head, static_cast<size_t>(length)) + contextText() + message + "\n";
    // One write a line: lines of several threads and processes stay whole.
    return static_cast<int>(write(STDERR_FILENO, line.data(), line.size()));
}

class JournalFields {
public:
    void add(const char* name, const std::string& value) {
        mTexts.push_back(std::string(name) + "=" + value);
    }
    void send() const {
        std::vector<iovec> parts;
        for (const std::string& text : mTexts) parts.push_back({const_cast<char*>(text.data()), text.size()});
        sd_journal_sendv(parts.data(), static_cast<int>(parts.size()));
    }

private:
    std::vector<std::string> mTexts;
};

void writeToJournal(log_priority priority, const char* tag, const log_place_s* place,
                    const std::string& message) {
    JournalFields fields;
    fields.add("MESSAGE", contextText() + message);
    fields.add("PRIORITY", std::to_string(nameOf(priority).syslog));
    fields.add("TAG", tag);
    if (context != nullptr) {
        fields.add("ACCOUNT", std::to_string(context->accountId()));
        fields.add("KIND", context->kind());
    }
    if (place != nullptr) {
        fields.add("CODE_FILE", place->file);
        fields.add("CODE_FUNC", place->function);
        fields.add("CODE_LINE", std::to_string(place->line));
    }
    fields.send();
}

__attribute__((format(printf, 4, 0))) int print(log_priority priority, const char* tag,
                                                const log_place_s* place, const char* format,
                                                va_list arguments) {
    char buffer[kMaxMessageBytes];
    size_t length = 0;
    if (place != nullptr) {
        const int head =
            std::snprintf(buffer, sizeof buffer, "%s: %s(%d) > ", place->file, place->function, place->line);
        length = std::min(sizeof buffer - 1, static_cast<size_t>(std::max(head, 0)));
    }
    // NOLINTNEXTLINE(clang-analyzer-valist.Uninitialized): the callers have begun the list
    if (std::vsnprintf(buffer + length, sizeof buffer - length, format, arguments) < 0) return 0;
    std::string message(buffer);
    replaceControls(&message);
    {
        const std::lock_guard lock(sink().mutex);
        if (sink().write != nullptr) sink().write(priority, tag, message.c_str(), sink().userData);
    }
    if (!goesToJournal()) return writeToStandardError(priority, tag, message);
    writeToJournal(priority, tag, place, message);
    return static_cast<int>(message.size());
}

}  // namespace

int dlog_print(log_priority priority, const char* tag, const char* format, ...) {
    if (!dlog_is_shown(priority)) return 0;
    va_list arguments;
    va_start(arguments, format);
    const int written = print(priority, tag, nullptr, format, arguments);
    va_end(arguments);
    return written;
}

int dlog_print_at(log_priority priority, const char* tag, const log_place_s& place, const char* format, ...) {
    if (!dlog_is_shown(priority)) return 0;
    va_list arguments;
    va_start(arguments, format);
    const int written = print(priority, tag, &place, format, arguments);
    va_end(arguments);
    return written;
}

LogContext::LogContext(int accountId, const char* kind)
    : mAccountId(accountId), mKind(kind), mOuter(context) {
    context = this;
}

LogContext::~LogContext() {
    context = mOuter;
}

void dlog_set_threshold(log_priority lowestShown) {
    threshold() = lowestShown;
}

bool dlog_is_shown(log_priority priority) {
    return priority >= threshold().load();
}

char dlog_letter_of_syslog(int severity) {
    const auto isAsGrave = [severity](const PriorityName& row) { return severity <= row.syslog; };
    const auto row = std::find_if(std::rbegin(kPriorities), std::rend(kPriorities), isAsGrave);
    return row != std::rend(kPriorities) ? row->letter : kPriorities[0].letter;
}

void dlog_set_sink(void (*write)(log_priority, const char*, const char*, void*), void* userData) {
    const std::lock_guard lock(sink().mutex);
    sink().write = write;
    sink().userData = userData;
}
