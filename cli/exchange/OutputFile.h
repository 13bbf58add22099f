// OutputFile.h: a file that takes its name only when it is whole. What is exported is private, so nobody else may
// read it.
#pragma once

#include <string>
#include <string_view>

#include "Handles.h"

namespace exchange {

class OutputFile {
public:
    // "-" is standard output; a device or pipe is written as it is. A Failure when it cannot be made.
    explicit OutputFile(const std::string& path);
    ~OutputFile();  // without finish() the former file stays
    OutputFile(const OutputFile&) = delete;
    OutputFile& operator=(const OutputFile&) = delete;

    void write(std::string_view text);
    // A Failure when it cannot be kept.
    void finish();

private:
    void flush();
    [[noreturn]] void fail(const char* what);

    const std::string mPath;
    std::string mFresh;  // the name until it is whole; empty when it is written as it is
    Descriptor mFile;
    int mFd = -1;
    std::string mBuffer;
};

}  // namespace exchange
