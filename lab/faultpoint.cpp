// faultpoint: runs a program and disturbs it at one step. A step is a system call that changes a file below a folder or sends
// data; steps are counted for each thread apart, by the thread's name, so that the same number means the same step in every run.
//
//   faultpoint --root DIR --report FILE [--thread NAME --at N --action kill|ENOSPC|EIO [--length M]] -- PROGRAM [ARGUMENT...]
//
// kill ends the program before the step is carried out. ENOSPC and EIO make M steps that write a file fail, of all threads,
// beginning with this one; without M all of them until SIGUSR1. FILE has a line for the program's pid, for each step
// ("step", thread, number, call, whether it can fail, file), for the disturbance and for the end.
#include <fcntl.h>
#include <linux/audit.h>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <signal.h>
#include <sys/prctl.h>
#include <sys/ptrace.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/uio.h>
#include <sys/user.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <climits>
#include <cstddef>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <map>
#include <string>
#include <vector>

#ifndef __x86_64__
#error "the registers of a system call are known for x86-64 only"
#endif

namespace {

volatile sig_atomic_t gIsHealed = 0;

// What the arguments of a call name.
enum class Target { kFile, kPath, kPathAt, kSecondPath, kSocket, kFileOrSocket };

struct Call {
    long number;
    const char* name;
    Target target;
    bool canFail;  // for want of space or by a broken disk
};

constexpr std::array kCalls = {
    Call{SYS_write, "write", Target::kFileOrSocket, true},
    Call{SYS_writev, "writev", Target::kFileOrSocket, true},
    Call{SYS_pwrite64, "pwrite64", Target::kFile, true},
    Call{SYS_pwritev, "pwritev", Target::kFile, true},
    Call{SYS_fsync, "fsync", Target::kFile, true},
    Call{SYS_fdatasync, "fdatasync", Target::kFile, true},
    Call{SYS_ftruncate, "ftruncate", Target::kFile, true},
    Call{SYS_fallocate, "fallocate", Target::kFile, true},
    Call{SYS_fchmod, "fchmod", Target::kFile, false},
    Call{SYS_chmod, "chmod", Target::kPath, false},
    Call{SYS_openat, "openat", Target::kPathAt, true},
    Call{SYS_open, "open", Target::kPath, true},
    Call{SYS_mkdir, "mkdir", Target::kPath, true},
    Call{SYS_unlink, "unlink", Target::kPath, false},
    Call{SYS_unlinkat, "unlinkat", Target::kPathAt, false},
    Call{SYS_rmdir, "rmdir", Target::kPath, false},
    Call{SYS_rename, "rename", Target::kPath, true},
    Call{SYS_renameat, "renameat", Target::kPathAt, true},
    Call{SYS_renameat2, "renameat2", Target::kPathAt, true},
    Call{SYS_link, "link", Target::kSecondPath, true},
    Call{SYS_symlink, "symlink", Target::kSecondPath, true},
    Call{SYS_bind, "bind", Target::kSocket, false},
    Call{SYS_sendto, "sendto", Target::kSocket, false},
    Call{SYS_sendmsg, "sendmsg", Target::kSocket, false},
};

struct Options {
    std::string root;
    std::string report;
    std::string thread;
    long at = 0;
    std::string action;
    long length = 0;
    std::vector<char*> program;
};

[[noreturn]] void fail(const std::string& why) {
    std::fprintf(stderr, "faultpoint: %s\n", why.c_str());
    std::exit(2);
}

std::string linkText(const std::string& path) {
    std::array<char, PATH_MAX> text{};
    const ssize_t size = readlink(path.c_str(), text.data(), text.size());
    return size > 0 ? std::string(text.data(), static_cast<size_t>(size)) : std::string();
}

std::string descriptorText(pid_t thread, unsigned long long descriptor) {
    return linkText("/proc/" + std::to_string(thread) + "/fd/" +
                    std::to_string(static_cast<int>(descriptor)));
}

std::string memoryText(pid_t thread, unsigned long long address) {
    std::string text;
    std::array<char, 256> part{};
    while (text.size() < PATH_MAX) {
        // Not across a page: the next one need not be there.
        const size_t room = 4096 - (address + text.size()) % 4096;
        iovec local{part.data(), std::min(part.size(), room)};
        // NOLINTNEXTLINE(performance-no-int-to-ptr): an address of the other process
        iovec remote{reinterpret_cast<void*>(address + text.size()), local.iov_len};
        const ssize_t got = process_vm_readv(thread, &local, 1, &remote, 1, 0);
        if (got <= 0) return text;
        const size_t length = strnlen(part.data(), static_cast<size_t>(got));
        text.append(part.data(), length);
        if (length < static_cast<size_t>(got)) return text;
    }
    return text;
}

bool exists(const std::string& path) {
    struct stat ignored {};
    return lstat(path.c_str(), &ignored) == 0;
}

class Tracer {
public:
    explicit Tracer(const Options& options) : mOptions(options) {
        mReport = std::fopen(options.report.c_str(), "we");
        if (mReport == nullptr) fail(options.report + " cannot be written");
        setvbuf(mReport, nullptr, _IOLBF, 0);
    }

    int run() {
        start();
        int status = 0;
        while (true) {
            const pid_t thread = waitpid(-1, &status, __WALL);
            if (thread < 0 && errno == EINTR) continue;
            if (thread < 0) fail("the program is gone");
            if (WIFSTOPPED(status)) {
                handleStop(thread, status);
            } else if (thread == mProgram) {
                return ended(status);
            }
        }
    }

private:
    void start() {
        mProgram = fork();
        if (mProgram < 0) fail("no process could be made");
        if (mProgram == 0) becomeProgram();
        int status = 0;
        if (waitpid(mProgram, &status, 0) != mProgram || !WIFSTOPPED(status))
            fail("the program did not start");
        if (ptrace(PTRACE_SETOPTIONS, mProgram, 0,
                   PTRACE_O_TRACESECCOMP | PTRACE_O_TRACECLONE | PTRACE_O_EXITKILL) != 0)
            fail("the program cannot be traced");
        std::fprintf(mReport, "pid %d\n", mProgram);
        ptrace(PTRACE_CONT, mProgram, 0, 0);
    }

    [[noreturn]] void becomeProgram() {
        ptrace(PTRACE_TRACEME, 0, 0, 0);
        raise(SIGSTOP);
        std::vector<sock_filter> filter = {
            BPF_STMT(BPF_LD | BPF_W | BPF_ABS, static_cast<unsigned>(offsetof(seccomp_data, nr)))};
        for (const Call& call : kCalls) {
            filter.push_back(BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, static_cast<unsigned>(call.number), 0, 1));
            filter.push_back(BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_TRACE));
        }
        filter.push_back(BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW));
        sock_fprog program{static_cast<unsigned short>(filter.size()), filter.data()};
        if (prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) != 0 ||
            prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &program) != 0)
            _exit(126);
        execv(mOptions.program[0], mOptions.program.data());
        _exit(127);
    }

    void handleStop(pid_t thread, int status) {
        const int signal = WSTOPSIG(status);
        const int event = status >> 16;
        if (event == PTRACE_EVENT_SECCOMP) {
            handleCall(thread);
            ptrace(PTRACE_CONT, thread, 0, 0);
        } else if (event != 0 || signal == SIGSTOP || signal == SIGTRAP) {
            ptrace(PTRACE_CONT, thread, 0, 0);
        } else {
            ptrace(PTRACE_CONT, thread, 0, signal);
        }
    }

    void handleCall(pid_t thread) {
        user_regs_struct registers{};
        if (ptrace(PTRACE_GETREGS, thread, 0, &registers) != 0) return;
        const Call* call = nullptr;
        for (const Call& each : kCalls) {
            if (each.number == static_cast<long>(registers.orig_rax)) call = &each;
        }
        if (call == nullptr) return;
        const std::string what = stepText(thread, *call, registers);
        if (what.empty()) return;
        const std::string name = threadName(thread);
        const long number = ++mCounts[name];
        const bool isFallible = canFail(*call, what);
        std::fprintf(mReport, "step %s %ld %s %d %s\n", name.c_str(), number, call->name, isFallible ? 1 : 0,
                     what.c_str());
        if (name == mOptions.thread && number == mOptions.at) begin(*call, what);
        if (!mIsFailing || gIsHealed != 0 || !isFallible) return;
        registers.orig_rax = static_cast<unsigned long long>(-1);
        registers.rax = static_cast<unsigned long long>(-(mOptions.action == "EIO" ? EIO : ENOSPC));
        ptrace(PTRACE_SETREGS, thread, 0, &registers);
        if (++mFailed == mOptions.length) mIsFailing = false;
    }

    // A file that is there is opened without a write to the disk.
    static bool canFail(const Call& call, const std::string& what) {
        if (!call.canFail || !what.starts_with('/')) return false;
        return (call.number != SYS_openat && call.number != SYS_open) || !exists(what);
    }

    void begin(const Call& call, const std::string& what) {
        std::fprintf(mReport, "hit %s %s\n", call.name, what.c_str());
        if (mOptions.action == "kill") kill(mProgram, SIGKILL);
        mIsFailing = mOptions.action == "EIO" || mOptions.action == "ENOSPC";
    }

    // What the call works on; empty when it changes nothing that lasts and sends nothing.
    std::string stepText(pid_t thread, const Call& call, const user_regs_struct& registers) {
        if (call.target == Target::kSocket) return "socket";
        if (call.target == Target::kFile || call.target == Target::kFileOrSocket) {
            const std::string file = descriptorText(thread, registers.rdi);
            if (call.target == Target::kFileOrSocket && file.starts_with("socket:")) return "socket";
            return isOurs(file) ? file : std::string();
        }
        std::string path = memoryText(thread, registers.rdi);
        if (call.target != Target::kPath) path = memoryText(thread, registers.rsi);
        if (call.target == Target::kPathAt && !path.starts_with('/') &&
            static_cast<int>(registers.rdi) != AT_FDCWD)
            path = descriptorText(thread, registers.rdi) + "/" + path;
        if (!isOurs(path)) return "";
        return doesChange(call, registers, path) ? path : std::string();
    }

    static bool doesChange(const Call& call, const user_regs_struct& registers, const std::string& path) {
        if (call.number == SYS_openat || call.number == SYS_open) {
            const auto flags = static_cast<int>(call.number == SYS_openat ? registers.rdx : registers.rsi);
            return (flags & O_TRUNC) != 0 || ((flags & O_CREAT) != 0 && !exists(path));
        }
        if (call.number == SYS_mkdir || call.target == Target::kSecondPath) return !exists(path);
        return exists(path);
    }

    bool isOurs(const std::string& path) const { return path.starts_with(mOptions.root + "/"); }

    std::string threadName(pid_t thread) {
        if (thread == mProgram) return "main";
        std::ifstream file("/proc/" + std::to_string(thread) + "/comm");
        std::string name;
        std::getline(file, name);
        return name;
    }

    int ended(int status) {
        if (WIFSIGNALED(status)) {
            std::fprintf(mReport, "ended signal %d\n", WTERMSIG(status));
            return 128 + WTERMSIG(status);
        }
        std::fprintf(mReport, "ended status %d\n", WEXITSTATUS(status));
        return WEXITSTATUS(status);
    }

    const Options& mOptions;
    std::FILE* mReport = nullptr;
    pid_t mProgram = 0;
    std::map<std::string, long> mCounts;
    bool mIsFailing = false;
    long mFailed = 0;
};

Options readOptions(int argc, char** argv) {
    Options options;
    const std::map<std::string, std::string*> texts = {{"--root", &options.root},
                                                       {"--report", &options.report},
                                                       {"--thread", &options.thread},
                                                       {"--action", &options.action}};
    const std::map<std::string, long*> numbers = {{"--at", &options.at}, {"--length", &options.length}};
    int i = 1;
    for (; i + 1 < argc && std::strcmp(argv[i], "--") != 0; i += 2) {
        if (const auto text = texts.find(argv[i]); text != texts.end()) {
            *text->second = argv[i + 1];
        } else if (const auto number = numbers.find(argv[i]); number != numbers.end()) {
            *number->second = std::strtol(argv[i + 1], nullptr, 10);
        } else {
            fail(std::string("unknown option ") + argv[i]);
        }
    }
    for (++i; i < argc; ++i) options.program.push_back(argv[i]);
    if (options.program.empty() || options.root.empty() || options.report.empty()) fail("see the source");
    options.program.push_back(nullptr);
    return options;
}

}  // namespace

int main(int argc, char** argv) {
    const Options options = readOptions(argc, argv);
    struct sigaction heal {};
    heal.sa_handler = [](int) { gIsHealed = 1; };
    sigaction(SIGUSR1, &heal, nullptr);
    return Tracer(options).run();
}
