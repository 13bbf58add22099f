#include "exchange/LineReader.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <cerrno>
#include <cstring>

#include "Failure.h"
#include "exchange/ContentLine.h"

namespace exchange {

namespace {

constexpr size_t kBlockBytes = 65536;
constexpr std::string_view kByteOrderMark = "\xEF\xBB\xBF";
constexpr std::string_view kWideMarks[] = {"\xFF\xFE", "\xFE\xFF"};

// A line of an older card that is written as quoted-printable goes on behind a "=" at its end.
bool isQuotedPrintable(std::string_view line) {
    const std::string head = content_line::upper(line.substr(0, line.find(':')));
    return head.find(";QUOTED-PRINTABLE") != std::string::npos ||
           head.find("=QUOTED-PRINTABLE") != std::string::npos;
}

}  // namespace

LineReader::LineReader(const std::string& path) : mName(path == "-" ? "standard input" : path) {
    mFd = STDIN_FILENO;
    if (path != "-") {
        mFile = Descriptor(open(path.c_str(), O_RDONLY | O_CLOEXEC));
        mFd = mFile.get();
    }
    struct stat info {};
    if (mFd < 0 || fstat(mFd, &info) != 0) throw Failure(mName + " cannot be read: " + std::strerror(errno));
    if (S_ISREG(info.st_mode) && static_cast<size_t>(info.st_size) > kMostFileBytes) {
        throw Failure(mName + " is too large; split it into files of at most " +
                      std::to_string(kMostFileBytes >> 20) + " MB");
    }
    fill();
    for (const std::string_view mark : kWideMarks) {
        if (mBlock.starts_with(mark))
            throw Failure(mName + " is not UTF-8 but UTF-16; convert it with iconv");
    }
    if (mBlock.starts_with(kByteOrderMark)) mAt = kByteOrderMark.size();
}

bool LineReader::fill() {
    mBlock.resize(kBlockBytes);
    mAt = 0;
    ssize_t got = -1;
    do {
        got = ::read(mFd, mBlock.data(), mBlock.size());
    } while (got < 0 && errno == EINTR);
    if (got < 0) throw Failure(mName + " cannot be read: " + std::strerror(errno));
    mBlock.resize(static_cast<size_t>(got));
    mRead += mBlock.size();
    if (mRead > kMostFileBytes) {
        throw Failure(mName + " is too large; at most " + std::to_string(kMostFileBytes >> 20) +
                      " MB are read");
    }
    return got > 0;
}

bool LineReader::peek(char* out) {
    if (mAt == mBlock.size() && !fill()) return false;
    *out = mBlock[mAt];
    return true;
}

void LineReader::appendLine(TextLine* out) {
    ++mLineNumber;
    bool hasEnded = false;
    while (!hasEnded && (mAt < mBlock.size() || fill())) {
        size_t end = mBlock.find('\n', mAt);
        hasEnded = end != std::string::npos;
        end = hasEnded ? end : mBlock.size();
        const size_t room = kMostLineBytes - std::min(kMostLineBytes, out->text.size());
        out->isTooLong = out->isTooLong || end - mAt > room;
        out->text.append(mBlock, mAt, std::min(room, end - mAt));
        mAt = hasEnded ? end + 1 : end;
    }
    if (out->text.ends_with('\r')) out->text.pop_back();
}

bool LineReader::goesOn(const TextLine& line) {
    char next = '\0';
    return peek(&next) && (next == ' ' || next == '\t') && !line.text.empty();
}

bool LineReader::next(TextLine* out) {
    char first = '\0';
    if (!peek(&first)) return false;
    *out = {};
    out->number = mLineNumber + 1;
    appendLine(out);
    for (;;) {
        if (out->text.ends_with('=') && isQuotedPrintable(out->text) && peek(&first)) {
            out->text.pop_back();
        } else if (goesOn(*out)) {
            ++mAt;
        } else {
            return true;
        }
        appendLine(out);
    }
}

}  // namespace exchange
