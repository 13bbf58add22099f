// Process: a child program of a test, ended with the object. Its standard output is read line by line.
#pragma once

#include <sys/types.h>

#include <map>
#include <optional>
#include <string>
#include <vector>

using Environment = std::map<std::string, std::string>;  // added to the test's own

class Process {
public:
    // Standard error goes to `errorFile` when it is not empty.
    Process(const std::vector<std::string>& command, const Environment& environment,
            const std::string& errorFile = "");
    ~Process();  // SIGTERM, after two seconds SIGKILL
    Process(const Process&) = delete;
    Process& operator=(const Process&) = delete;

    [[nodiscard]] pid_t pid() const { return mPid; }
    // The next line of standard output; nothing at its end or after `timeoutMs`.
    std::optional<std::string> readLine(int timeoutMs);
    void kill(int signal) const;
    // The exit status (128 + signal when it was killed); nothing while it runs after `timeoutMs`.
    std::optional<int> wait(int timeoutMs);

private:
    pid_t mPid = -1;
    int mOutput = -1;
    std::string mBuffer;
    std::optional<int> mStatus;
};

struct CommandResult {
    int status = -1;
    std::string output;
    std::string error;
};

// Runs a program to its end, with `input` on its standard input; killed after `timeoutMs` (status 124).
CommandResult runCommand(const std::vector<std::string>& command, const Environment& environment,
                         const std::string& input = "", int timeoutMs = 60'000);
