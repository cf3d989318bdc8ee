#pragma once

#include "platform/base/qx_string.h"

#include <cstdio>
#include <fcntl.h>
#include <spawn.h>
#include <stdexcept>
#include <string>
#include <sys/wait.h>
#include <unistd.h>
#include <vector>

namespace test {

/// What a program left behind.
struct ProgramResult {
    int code = -1; ///< its exit code; 1000 and the signal's number for one that was killed
    String out;    ///< standard output
    String err;    ///< standard error
};

/// How a program is run.
struct ProgramSettings {
    std::vector<std::string> environment;    ///< "NAME=value"; nothing else is in the environment
    std::string standardOutput;              ///< a path to write to in the place of `ProgramResult::out`
    std::string standardInput = "/dev/null"; ///< a path
};

namespace detail {

/// A file without a name, open for both ways.
inline FILE* namelessFile() {
    FILE* file = std::tmpfile();
    if (file == nullptr) {
        throw std::runtime_error("cannot make a temporary file");
    }
    return file;
}

inline String contents(FILE* file) {
    String text;
    char buffer[65536];
    std::rewind(file);
    for (size_t got = 0; (got = std::fread(buffer, 1, sizeof buffer, file)) > 0;) {
        text.append(buffer, got);
    }
    std::fclose(file);
    return text;
}

inline std::vector<char*> pointers(std::vector<std::string>& texts) {
    std::vector<char*> result;
    for (std::string& text : texts) {
        result.push_back(text.data());
    }
    result.push_back(nullptr);
    return result;
}

} // namespace detail

/// Runs a program with arguments, without a shell and without a terminal, and waits for its end.
inline ProgramResult runProgram(const std::string& program, std::vector<std::string> arguments,
                                ProgramSettings settings = {}) {
    FILE* const out = detail::namelessFile();
    FILE* const err = detail::namelessFile();
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_addopen(&actions, STDIN_FILENO, settings.standardInput.c_str(), O_RDONLY, 0);
    if (settings.standardOutput.empty()) {
        posix_spawn_file_actions_adddup2(&actions, fileno(out), STDOUT_FILENO);
    } else {
        posix_spawn_file_actions_addopen(&actions, STDOUT_FILENO, settings.standardOutput.c_str(), O_WRONLY,
                                         0);
    }
    posix_spawn_file_actions_adddup2(&actions, fileno(err), STDERR_FILENO);

    arguments.insert(arguments.begin(), program);
    pid_t child = 0;
    int status = 0;
    ProgramResult result;
    const int spawned =
        posix_spawn(&child, program.c_str(), &actions, nullptr, detail::pointers(arguments).data(),
                    detail::pointers(settings.environment).data());
    if (spawned == 0 && ::waitpid(child, &status, 0) == child) {
        result.code = WIFEXITED(status) ? WEXITSTATUS(status) : 1000 + WTERMSIG(status);
    }
    posix_spawn_file_actions_destroy(&actions);
    result.out = detail::contents(out);
    result.err = detail::contents(err);
    return result;
}

} // namespace test
