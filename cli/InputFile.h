// InputFile.h: what a command reads from a file or from standard input.
#pragma once

#include <string>

namespace input_file {

// The whole of the file, "-" for standard input. A Failure when it cannot be read or is larger than `mostBytes`.
std::string read(const std::string& path, size_t mostBytes);

// A secret: the whole input without one trailing line end. A Failure when it is empty or holds a NUL.
// `what` names it in the Failure; the value itself is in no text.
std::string readSecret(const std::string& path, const std::string& what);

}  // namespace input_file
