#include "command_runs.h"

#include "tests/support/temporary_folder.h"

#include <csignal>
#include <filesystem>
#include <fstream>

namespace torture {

namespace fs = std::filesystem;

namespace {

constexpr const char* kList = "TITLE: %s\n"
                              "001  R1 V C        00:00:10:00 00:00:13:00 10:00:00:00 10:00:03:00\n"
                              "* FROM CLIP NAME: harbour\n"
                              "* LOC: 10:00:01:00 RED     ship\n"
                              "002  R2 A C        00:01:00:00 00:01:10:00 10:00:00:00 10:00:10:00\n"
                              "* FROM CLIP NAME: gulls\n"
                              "003  BL V C        00:00:00:00 00:00:01:00 10:00:03:00 10:00:04:00\n"
                              "004  R1 V C        00:00:20:00 00:00:25:00 10:00:05:00 10:00:10:00\n"
                              "* FROM CLIP NAME: harbour\n";

/// What every workplace is a copy of.
struct Original {
    test::TemporaryFolder folder;
    std::string cookies[3];
};

Original* original = nullptr;

void copyWithTimes(const fs::path& from, const fs::path& to) {
    for (const auto& entry : fs::recursive_directory_iterator(from)) {
        const fs::path target = to / entry.path().lexically_relative(from);
        if (entry.is_directory()) {
            fs::create_directories(target);
        } else {
            fs::copy_file(entry.path(), target);
            fs::last_write_time(target, entry.last_write_time());
        }
    }
}

std::string replaced(std::string text, const std::string& what, const std::string& with) {
    for (size_t at = 0; (at = text.find(what, at)) != std::string::npos; at += with.size()) {
        text.replace(at, what.size(), with);
    }
    return text;
}

Met runIn(const std::string& folder, std::vector<std::string> arguments, const Interference& interference) {
    for (std::string& argument : arguments) {
        for (int edit = 1; edit <= 3; ++edit) {
            argument = replaced(argument, "$" + std::to_string(edit), original->cookies[edit - 1]);
        }
        argument = replaced(argument, "$D", folder);
    }
    // Beside the folder whose files count.
    const std::string report = folder + ".calls";
    fs::remove(report);
    test::ProgramSettings settings;
    settings.environment = {"LANG=C.UTF-8",
                            "QMEDIT_PROJECT=" + folder + "/project",
                            "TMPDIR=/tmp",
                            "TORTURE_UNDER=" + folder,
                            "TORTURE_REPORT=" + report,
                            "LD_PRELOAD=" TORTURE_SHIM,
                            "TORTURE_AT=" + std::to_string(interference.at),
                            "TORTURE_ERROR=" + std::to_string(interference.error),
                            "TORTURE_SIGNAL=" + std::to_string(interference.signal),
                            std::string("TORTURE_MODE=") + interference.mode};
    settings.standardOutput = interference.outputFull ? "/dev/full" : "";
    Met met;
    // Texts are the same wherever the folder is.
    met.result = test::runProgram(QMEDIT_PROGRAM, arguments, settings);
    met.result.out = replaced(met.result.out, folder, "$D");
    met.result.err = replaced(met.result.err, folder, "$D");
    std::ifstream file(report);
    for (std::string line; std::getline(file, line);) {
        if (line.starts_with("calls ")) {
            met.calls = std::stoul("0" + line.substr(6));
        } else if (met.call.empty()) {
            met.call = replaced(line, folder + "/", "");
        }
    }
    return met;
}

std::string succeed(const std::vector<std::string>& arguments) {
    const Met met = runIn(original->folder.path(), arguments, {});
    if (met.result.code != 0) {
        throw std::runtime_error("qmedit " + arguments[0] + " failed: " + met.result.err);
    }
    return met.result.out.trimmed();
}

} // namespace

void Workplace::prepare() {
    original = new Original;
    const test::TemporaryFolder& folder = original->folder;
    for (int edit = 0; edit < 3; ++edit) {
        const std::string list = replaced(kList, "%s", "REEL " + std::to_string(edit + 1));
        folder.write("list.edl", list);
        original->cookies[edit] = succeed({"import", "$D/list.edl", "--new-shots"});
    }
    for (const char* place : {"$1@1s-2s", "$1@3s-4s", "$1@2s-3s", "$2@1s-2s", "$3@1s-2s"}) {
        succeed({"apply", "remove", "--to", place});
    }
    succeed({"undo", "$1"});
    const std::string damaged = folder.path("project/P0001000/" + cookieOf(3) + ".qme");
    fs::resize_file(damaged, fs::file_size(damaged) / 2);
    folder.write("list.edl", replaced(kList, "%s", "FRESH"));
    succeed({"flush"});
    fs::remove(folder.path().c_str() + std::string(".calls"));
    // Read by processes of any user.
    fs::permissions(folder.path().c_str(), fs::perms(0755));
}

std::string Workplace::cookieOf(int edit) {
    return original->cookies[edit - 1];
}

Workplace::Workplace(std::string folder) : m_folder(std::move(folder)) {
    copyWithTimes(fs::path(std::string(original->folder.path())), m_folder);
}

Met Workplace::run(const std::vector<std::string>& arguments, const Interference& interference) const {
    return runIn(m_folder, arguments, interference);
}

} // namespace torture
