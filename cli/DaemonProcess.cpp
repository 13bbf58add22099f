#include "DaemonProcess.h"

#include <fcntl.h>
#include <glib.h>
#include <linux/close_range.h>
#include <signal.h>
#include <sys/prctl.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <filesystem>

#include "Failure.h"
#include "Handles.h"
#include "platform/root.h"

namespace {

constexpr const char* kProgram = "vantor-pim-sync";
constexpr mode_t kLogMode = 0600;
constexpr off_t kMostLogBytes = 10 * 1024 * 1024;

std::string findProgram() {
    std::error_code ignored;
    const std::filesystem::path own = std::filesystem::read_symlink("/proc/self/exe", ignored);
    const std::filesystem::path beside = own.parent_path() / kProgram;
    if (!own.empty() && access(beside.c_str(), X_OK) == 0) return beside.string();
    const GChars inPath(g_find_program_in_path(kProgram));
    if (inPath == nullptr) {
        throw Failure(std::string(kProgram) + " is neither beside this program nor in PATH; install it");
    }
    return inPath.get();
}

Descriptor openLog() {
    const std::string path = platform::rootedPath(DaemonProcess::kLog);
    struct stat info {};
    const bool isLarge =
        lstat(path.c_str(), &info) == 0 && S_ISREG(info.st_mode) && info.st_size > kMostLogBytes;
    // Where that fails it goes on growing, which is better than no daemon.
    if (isLarge) (void)rename(path.c_str(), (path + ".1").c_str());
    Descriptor log(open(path.c_str(), O_WRONLY | O_CREAT | O_APPEND | O_NOFOLLOW | O_CLOEXEC, kLogMode));
    if (!log) throw Failure(path + " cannot be written: " + std::strerror(errno));
    return log;
}

// What the child tells about itself. Nothing but async-signal-safe calls between fork and exec.
struct Report {
    pid_t pid;
    int error;
};

void tell(int pipeFd, int error) {
    const Report report{getpid(), error};
    // A reader that is gone leaves nobody to tell.
    if (::write(pipeFd, &report, sizeof report) < 0) return;
}

[[noreturn]] void becomeDaemon(const char* program, int logFd, int nullFd, int pipeFd) {
    setsid();
    const pid_t second = fork();  // no session leader: the daemon can never get a terminal
    if (second != 0) _exit(second < 0 ? 1 : 0);
    sigset_t none;
    sigemptyset(&none);
    sigprocmask(SIG_SETMASK, &none, nullptr);
    signal(SIGPIPE, SIG_DFL);
    dup2(nullFd, STDIN_FILENO);
    dup2(logFd, STDOUT_FILENO);
    dup2(logFd, STDERR_FILENO);
    syscall(SYS_close_range, STDERR_FILENO + 1, ~0U, CLOSE_RANGE_CLOEXEC);
    tell(pipeFd, 0);
    std::array<char*, 2> arguments{const_cast<char*>(program), nullptr};
    execv(program, arguments.data());
    tell(pipeFd, errno);
    _exit(127);
}

bool readReport(int fd, Report* report) {
    ssize_t got = 0;
    do {
        got = read(fd, report, sizeof *report);
    } while (got < 0 && errno == EINTR);
    return got == static_cast<ssize_t>(sizeof *report);
}

}  // namespace

DaemonProcess DaemonProcess::spawn() {
    const std::string program = findProgram();
    const Descriptor log = openLog();
    const Descriptor null(open("/dev/null", O_RDONLY | O_CLOEXEC));
    std::array<int, 2> ends{-1, -1};
    if (!null || pipe2(ends.data(), O_CLOEXEC) != 0) {
        throw Failure(std::string("the daemon cannot be started: ") + std::strerror(errno));
    }
    const Descriptor readEnd(ends[0]);
    Descriptor writeEnd(ends[1]);
    // Orphans come to this process, so that an early end is seen with its status.
    prctl(PR_SET_CHILD_SUBREAPER, 1);
    const pid_t first = fork();
    if (first < 0) throw Failure(std::string("the daemon cannot be started: ") + std::strerror(errno));
    if (first == 0) becomeDaemon(program.c_str(), log.get(), null.get(), writeEnd.get());
    writeEnd.reset();
    while (waitpid(first, nullptr, 0) < 0 && errno == EINTR) continue;
    Report started{};
    if (!readReport(readEnd.get(), &started))
        throw Failure("the daemon cannot be started: no process could be made");
    Report failed{};
    if (readReport(readEnd.get(), &failed))
        throw Failure(program + " cannot be run: " + std::strerror(failed.error));
    return DaemonProcess(started.pid);
}

bool DaemonProcess::waitForEnd(int timeoutMs) {
    constexpr int kStepMs = 10;
    for (int waited = 0; !mHasEnded; waited += kStepMs) {
        const pid_t ended = waitpid(mPid, &mStatus, WNOHANG);
        mHasEnded = ended == mPid || (ended < 0 && errno == ECHILD);
        if (waited >= timeoutMs) break;
        if (!mHasEnded) g_usleep(kStepMs * 1000);
    }
    return mHasEnded;
}

std::string DaemonProcess::howItEnded() const {
    if (WIFSIGNALED(mStatus)) return "signal " + std::to_string(WTERMSIG(mStatus));
    return "exit status " + std::to_string(WEXITSTATUS(mStatus));
}

void DaemonProcess::kill() {
    if (mHasEnded) return;
    ::kill(mPid, SIGKILL);
    while (waitpid(mPid, &mStatus, 0) < 0 && errno == EINTR) continue;
    mHasEnded = true;
}
