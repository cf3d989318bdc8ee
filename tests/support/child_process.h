#pragma once

#include <csignal>
#include <functional>
#include <sys/wait.h>
#include <unistd.h>

namespace test {

enum class ChildEnd { Succeeded, Failed, Killed };

/// Runs `work` in a child process, for what kills the process, and waits for its end. The child runs no
/// destructors of its own on the way out.
inline ChildEnd runInChild(const std::function<bool()>& work) {
    const pid_t child = ::fork();
    if (child == 0) {
        ::_exit(work() ? 0 : 1);
    }
    int status = 0;
    if (child < 0 || ::waitpid(child, &status, 0) != child) {
        return ChildEnd::Failed;
    }
    if (WIFSIGNALED(status)) {
        return WTERMSIG(status) == SIGKILL ? ChildEnd::Killed : ChildEnd::Failed;
    }
    return WIFEXITED(status) && WEXITSTATUS(status) == 0 ? ChildEnd::Succeeded : ChildEnd::Failed;
}

} // namespace test
