#pragma once

#include "tests/support/run_program.h"
#include "tests/support/temporary_folder.h"
#include "tests/support/tree_snapshot.h"

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

/// Shows a text in a failure as it is.
inline void PrintTo(const String& text, std::ostream* out) {
    *out << '"' << std::string_view(text) << '"';
}

/// Runs the real program on a project of the test's own.
class Qmedit : public testing::Test {
protected:
    test::ProgramResult run(std::vector<std::string> arguments,
                            std::vector<std::string> environment = {"LANG=C.UTF-8"},
                            const std::string& standardOutput = {}) {
        environment.push_back("QMEDIT_PROJECT=" + project());
        environment.push_back("TMPDIR=" + folder.path());
        return test::runProgram(QMEDIT_PROGRAM, std::move(arguments),
                                {std::move(environment), standardOutput});
    }
    /// The same with a file on its standard input.
    test::ProgramResult runOn(const std::string& input, std::vector<std::string> arguments) {
        return test::runProgram(QMEDIT_PROGRAM, std::move(arguments),
                                {{"LANG=C.UTF-8", "QMEDIT_PROJECT=" + project()}, {}, input});
    }
    [[nodiscard]] String project() const { return folder.path("project"); }
    [[nodiscard]] std::map<std::string, std::string> snapshot() const {
        return test::treeSnapshot(project());
    }

    /// The cookie that an import prints.
    String imported(const std::string& list, std::vector<std::string> more = {}) {
        more.insert(more.begin(), {"import", folder.write("list.edl", list)});
        const test::ProgramResult result = run(std::move(more));
        EXPECT_EQ(result.code, 0) << result.err;
        return result.out.trimmed();
    }
    nlohmann::json shown(const String& item) {
        const test::ProgramResult result = run({"show", item, "--json"});
        EXPECT_EQ(result.code, 0) << result.err;
        return nlohmann::json::parse(result.out);
    }
    static size_t lines(const String& text) {
        return static_cast<size_t>(std::count(text.begin(), text.end(), '\n'));
    }

    test::TemporaryFolder folder;
};

/// Ten seconds of picture (a shot, black, a gap, a shot at half speed) over one sound, at 25 frames a second.
inline constexpr const char* kShortList =
    "TITLE: Short\n"
    "001  R1 V C        00:00:10:00 00:00:13:00 10:00:00:00 10:00:03:00\n"
    "* FROM CLIP NAME: harbour\n"
    "* LOC: 10:00:01:00 RED     ship\n"
    "002  R2 A C        00:01:00:00 00:01:10:00 10:00:00:00 10:00:10:00\n"
    "* FROM CLIP NAME: gulls\n"
    "003  BL V C        00:00:00:00 00:00:01:00 10:00:03:00 10:00:04:00\n"
    "004  R1 V C        00:00:20:00 00:00:22:12 10:00:05:00 10:00:10:00\n"
    "* FROM CLIP NAME: harbour\n"
    "M2   R1             012.5                00:00:20:00\n";
