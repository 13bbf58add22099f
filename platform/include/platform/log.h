// log.h: the platform log. Lines go to standard error when the program is run by hand and to the journal
// under systemd (when standard error is the journal's own stream). One severity threshold hides the rest;
// the default hides debug. VANTOR_PIM_SYNC_LOG=debug|info|warning|error sets it for a process.
// Threads: any. A line is written whole, never interleaved with another thread's.
#pragma once

enum log_priority {
    DLOG_DEBUG = 3,
    DLOG_INFO = 4,
    DLOG_WARN = 5,
    DLOG_ERROR = 6,
};

// Writes one line "TIME PRIORITY/TAG(PID): MESSAGE". Returns the number of bytes, 0 when the line was hidden.
// Control characters other than the colour sequences (ESC [ ... m) are replaced, so that text from outside
// cannot forge lines. Lines longer than 4096 bytes are cut.
int dlog_print(log_priority priority, const char* tag, const char* format, ...)
    __attribute__((format(printf, 3, 4)));

// Where a line comes from. The journal gets each part as a field of its own; in the text they stand before the
// message, as "FILE: FUNCTION(LINE) > ".
struct log_place_s {
    const char* file;
    const char* function;
    int line;
};
int dlog_print_at(log_priority priority, const char* tag, const log_place_s& place, const char* format, ...)
    __attribute__((format(printf, 4, 5)));

// What the lines of this thread are about while the object lives: an account and a kind of its data. They begin with
// "[ACCOUNT KIND] ", and carry both as fields (ACCOUNT, KIND) in the journal. Of several the
// youngest holds.
class LogContext {
public:
    // `kind` is not copied.
    LogContext(int accountId, const char* kind);
    ~LogContext();
    LogContext(const LogContext&) = delete;
    LogContext& operator=(const LogContext&) = delete;

    [[nodiscard]] int accountId() const { return mAccountId; }
    [[nodiscard]] const char* kind() const { return mKind; }

private:
    const int mAccountId;
    const char* const mKind;
    const LogContext* const mOuter;
};

// Sets the threshold of this process; lines below it are hidden.
void dlog_set_threshold(log_priority lowestShown);

// Whether a line of this priority would be shown: lets callers skip expensive messages.
bool dlog_is_shown(log_priority priority);

// The letter of PRIORITY for a severity of syslog (0 to 7), which the journal knows the lines by.
char dlog_letter_of_syslog(int severity);

// Tests only: every shown line also goes to `sink` (NULL switches it off again).
void dlog_set_sink(void (*sink)(log_priority priority, const char* tag, const char* message, void* userData),
                   void* userData);
