#include "e2e/Process.h"

#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <cstring>
#include <stdexcept>
#include <thread>

namespace {

using Clock = std::chrono::steady_clock;

struct Pipe {
    int read = -1;
    int write = -1;
    Pipe() {
        int ends[2];
        if (pipe2(ends, O_CLOEXEC) != 0) throw std::runtime_error("pipe2");
        read = ends[0];
        write = ends[1];
    }
};

pid_t spawn(const std::vector<std::string>& command, const Environment& environment, int input, int output,
            int error) {
    std::vector<char*> arguments;
    for (const std::string& word : command) arguments.push_back(const_cast<char*>(word.c_str()));
    arguments.push_back(nullptr);
    const pid_t pid = fork();
    if (pid != 0) return pid;
    for (const auto& [name, value] : environment) setenv(name.c_str(), value.c_str(), 1);
    dup2(input, STDIN_FILENO);
    dup2(output, STDOUT_FILENO);
    dup2(error, STDERR_FILENO);
    execv(arguments[0], arguments.data());
    _exit(127);
}

std::optional<int> waitFor(pid_t pid, int timeoutMs) {
    const auto deadline = Clock::now() + std::chrono::milliseconds(timeoutMs);
    for (;;) {
        int status = 0;
        if (waitpid(pid, &status, WNOHANG) == pid) {
            return WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
        }
        if (Clock::now() >= deadline) return std::nullopt;
        std::this_thread::sleep_for(std::chrono::milliseconds(5));
    }
}

// Reads both pipes to their ends; false at the deadline.
bool drain(Pipe& output, Pipe& error, CommandResult* result, int timeoutMs) {
    const auto deadline = Clock::now() + std::chrono::milliseconds(timeoutMs);
    pollfd fds[2] = {{output.read, POLLIN, 0}, {error.read, POLLIN, 0}};
    std::string* texts[2] = {&result->output, &result->error};
    while (fds[0].fd != -1 || fds[1].fd != -1) {
        const auto left =
            std::chrono::duration_cast<std::chrono::milliseconds>(deadline - Clock::now()).count();
        if (left <= 0 || poll(fds, 2, static_cast<int>(left)) <= 0) return false;
        for (int i = 0; i < 2; ++i) {
            if (fds[i].fd == -1 || fds[i].revents == 0) continue;
            char chunk[65536];
            const ssize_t count = read(fds[i].fd, chunk, sizeof chunk);
            if (count > 0) {
                texts[i]->append(chunk, static_cast<size_t>(count));
            } else {
                fds[i].fd = -1;
            }
        }
    }
    return true;
}

}  // namespace

Process::Process(const std::vector<std::string>& command, const Environment& environment,
                 const std::string& errorFile) {
    const Pipe output;
    const int null = open("/dev/null", O_RDWR | O_CLOEXEC);
    const int error =
        errorFile.empty() ? null : open(errorFile.c_str(), O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC, 0600);
    mPid = spawn(command, environment, null, output.write, error);
    close(output.write);
    if (error != null) close(error);
    close(null);
    mOutput = output.read;
}

Process::~Process() {
    if (!wait(0)) {
        kill(SIGTERM);
        if (!wait(2000)) {
            kill(SIGKILL);
            wait(5000);
        }
    }
    close(mOutput);
}

std::optional<std::string> Process::readLine(int timeoutMs) {
    const auto deadline = Clock::now() + std::chrono::milliseconds(timeoutMs);
    for (;;) {
        if (const size_t end = mBuffer.find('\n'); end != std::string::npos) {
            std::string line = mBuffer.substr(0, end);
            mBuffer.erase(0, end + 1);
            return line;
        }
        const auto left =
            std::chrono::duration_cast<std::chrono::milliseconds>(deadline - Clock::now()).count();
        pollfd fd{mOutput, POLLIN, 0};
        if (left <= 0 || poll(&fd, 1, static_cast<int>(left)) <= 0) return std::nullopt;
        char chunk[4096];
        const ssize_t count = read(mOutput, chunk, sizeof chunk);
        if (count <= 0) return std::nullopt;
        mBuffer.append(chunk, static_cast<size_t>(count));
    }
}

void Process::kill(int signal) const {
    if (!mStatus) ::kill(mPid, signal);
}

std::optional<int> Process::wait(int timeoutMs) {
    if (!mStatus) mStatus = waitFor(mPid, timeoutMs);
    return mStatus;
}

CommandResult runCommand(const std::vector<std::string>& command, const Environment& environment,
                         const std::string& input, int timeoutMs) {
    Pipe in;
    Pipe out;
    Pipe err;
    const pid_t pid = spawn(command, environment, in.read, out.write, err.write);
    close(in.read);
    close(out.write);
    close(err.write);
    // A program that does not read its input must not end the test with SIGPIPE.
    signal(SIGPIPE, SIG_IGN);
    size_t sent = 0;
    while (sent < input.size()) {
        const ssize_t count = write(in.write, input.data() + sent, input.size() - sent);
        if (count <= 0) break;
        sent += static_cast<size_t>(count);
    }
    close(in.write);

    CommandResult result;
    const bool ended = drain(out, err, &result, timeoutMs);
    if (!ended) ::kill(pid, SIGKILL);
    const std::optional<int> status = waitFor(pid, 10'000);
    result.status = ended ? status.value_or(-1) : 124;
    close(out.read);
    close(err.read);
    return result;
}
