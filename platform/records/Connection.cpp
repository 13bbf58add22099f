#include "Connection.h"

#include <array>
#include <charconv>
#include <cstdio>

namespace platform::records {

namespace {

// A time in its column: "u" and seconds, or "l" and the wall time.
std::string timeText(const calendar_time_s& time) {
    if (time.type == CALENDAR_TIME_UTIME) return "u" + std::to_string(time.utime);
    char text[128];
    std::snprintf(text, sizeof text, "l%d-%d-%dT%d:%d:%d", time.year, time.month, time.mday, time.hour,
                  time.minute, time.second);
    return text;
}

calendar_time_s timeOf(const std::string& text) {
    calendar_time_s time;
    if (text.starts_with('l')) {
        time.type = CALENDAR_TIME_LOCALTIME;
        std::sscanf(text.c_str(), "l%d-%d-%dT%d:%d:%d", &time.year, &time.month, &time.mday, &time.hour,
                    &time.minute, &time.second);
    } else if (text.starts_with('u')) {
        (void)std::from_chars(text.data() + 1, text.data() + text.size(), time.utime);
    }
    return time;
}

}  // namespace

Statement::~Statement() {
    if (mpStatement == nullptr) return;
    sqlite3_reset(mpStatement);
    sqlite3_clear_bindings(mpStatement);
}

Statement& Statement::bind(int64_t value) {
    if (mpStatement != nullptr && mCode == SQLITE_OK) mCode = sqlite3_bind_int64(mpStatement, mNext++, value);
    return *this;
}

Statement& Statement::bind(const std::string& value) {
    if (mpStatement != nullptr && mCode == SQLITE_OK) {
        mCode = sqlite3_bind_text64(mpStatement, mNext++, value.data(), value.size(), SQLITE_TRANSIENT,
                                    SQLITE_UTF8);
    }
    return *this;
}

Statement& Statement::bind(const Value& value) {
    if (const auto* number = std::get_if<int64_t>(&value)) return bind(*number);
    if (const auto* text = std::get_if<std::string>(&value)) {
        if (mpStatement != nullptr && mCode == SQLITE_OK) {
            mCode = sqlite3_bind_text64(mpStatement, mNext++, text->data(), text->size(), SQLITE_STATIC,
                                        SQLITE_UTF8);
        }
        return *this;
    }
    return bind(timeText(std::get<calendar_time_s>(value)));
}

int Statement::step() {
    if (mpStatement == nullptr) return SQLITE_ERROR;
    return mCode == SQLITE_OK ? sqlite3_step(mpStatement) : mCode;
}

std::string Statement::text(int column) const {
    const auto* data = static_cast<const char*>(sqlite3_column_blob(mpStatement, column));
    if (data == nullptr) return {};
    return {data, static_cast<size_t>(sqlite3_column_bytes(mpStatement, column))};
}

Value Statement::value(int column, Type type) const {
    switch (type) {
        case Type::kInt:
        case Type::kLong:
        case Type::kChildren:
            return integer(column);
        case Type::kText:
            return text(column);
        case Type::kTime:
            return timeOf(text(column));
    }
    return int64_t{0};
}

int Connection::open(const std::string& path, int newestSchema) {
    return db_util_open(path.c_str(), &mpHandle, newestSchema);
}

void Connection::close() {
    mByView.clear();
    mStatements.clear();
    db_util_close(std::exchange(mpHandle, nullptr));
}

Statement Connection::prepare(const std::string& sql) {
    return Statement(kept(sql));
}

sqlite3_stmt* Connection::kept(const std::string& sql) {
    if (const auto known = mStatements.find(sql); known != mStatements.end()) return known->second.get();
    sqlite3_stmt* statement = nullptr;
    if (sqlite3_prepare_v3(mpHandle, sql.c_str(), -1, SQLITE_PREPARE_PERSISTENT, &statement, nullptr) !=
        SQLITE_OK) {
        return nullptr;
    }
    mStatements[sql].reset(statement);
    return statement;
}

int Connection::readChangeCounter(uint64_t* counter) {
    constexpr sqlite3_int64 kOffset = 24;  // of the file format: big-endian
    sqlite3_file* file = nullptr;
    const int code = sqlite3_file_control(mpHandle, "main", SQLITE_FCNTL_FILE_POINTER, &file);
    if (code != SQLITE_OK) return code;
    if (file == nullptr || file->pMethods == nullptr) return SQLITE_ERROR;
    // A descriptor of our own would take SQLite's locks with it when it is closed.
    std::array<unsigned char, 4> bytes{};
    const int read = file->pMethods->xRead(file, bytes.data(), static_cast<int>(bytes.size()), kOffset);
    if (read != SQLITE_OK) return read;
    *counter = 0;
    for (const unsigned char byte : bytes) *counter = *counter << 8 | byte;
    return SQLITE_OK;
}

int Connection::run(const std::string& sql) {
    return sqlite3_exec(mpHandle, sql.c_str(), nullptr, nullptr, nullptr);
}

}  // namespace platform::records
