// Failure.h: how a command ends without success. main() turns each into one line on standard error and an exit status.
#pragma once

#include <stdexcept>
#include <string>

inline constexpr int kExitDone = 0;
inline constexpr int kExitFailed = 1;
inline constexpr int kExitMisused = 2;

// The command was understood and could not be done. The text says why and what to do about it.
class Failure : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

// The command line itself is wrong.
class Misuse : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

// Nothing when `code` is 0, else a Failure "WHAT: the reason that the platform's code stands for".
void check(int code, const std::string& what);
