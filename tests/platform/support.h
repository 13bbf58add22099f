// What the platform tests share: another process that writes, and the main loop.
#pragma once

#include <sys/wait.h>
#include <unistd.h>

#include <functional>

// Runs `body` in a process of its own; its return value is the exit status. The body must not have opened a store before.
inline pid_t inOtherProcess(const std::function<int()>& body) {
    const pid_t pid = fork();
    if (pid == 0) _exit(body());
    return pid;
}

inline int statusOf(pid_t pid) {
    int status = 0;
    if (waitpid(pid, &status, 0) != pid) return -1;
    return WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
}
