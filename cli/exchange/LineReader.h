// LineReader.h: the lines of a file of iCalendar or vCard, unfolded, read block by block.
#pragma once

#include <string>
#include <string_view>

#include "Handles.h"

namespace exchange {

struct TextLine {
    std::string text;
    size_t number = 0;       // of its first line in the file, from 1
    bool isTooLong = false;  // longer than the largest photo takes; `text` is then its beginning
};

class LineReader {
public:
    // "-" reads standard input. A Failure when the file cannot be read.
    explicit LineReader(const std::string& path);

    // False at the end. A Failure when the file cannot be read on, is too large, or is UTF-16.
    bool next(TextLine* out);

    static constexpr size_t kMostFileBytes = size_t{256} * 1024 * 1024;
    static constexpr size_t kMostLineBytes = size_t{48} * 1024 * 1024;

private:
    bool fill();
    bool peek(char* out);
    // The rest of a line of the file, without its end.
    void appendLine(TextLine* out);
    [[nodiscard]] bool goesOn(const TextLine& line);

    std::string mName;
    Descriptor mFile;
    int mFd = -1;
    std::string mBlock;
    size_t mAt = 0;
    size_t mRead = 0;
    size_t mLineNumber = 0;
};

}  // namespace exchange
