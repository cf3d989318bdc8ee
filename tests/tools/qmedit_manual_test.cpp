#include "tests/tools/qmedit_fixture.h"

#include <filesystem>
#include <fstream>
#include <regex>

namespace {

/// A command that the manual shows, and what it says it prints.
struct Example {
    int line;
    std::string command;
    std::vector<std::string> printed;
};

/// The examples of a manual: in blocks of code, lines that begin with "$ " and those that follow them.
std::vector<Example> examplesOf(const std::string& path) {
    std::vector<Example> examples;
    std::ifstream file(path);
    const std::string indent(4, ' ');
    bool isOpen = false;
    int number = 0;
    for (std::string line; std::getline(file, line);) {
        ++number;
        if (line.starts_with(indent + "$ ")) {
            examples.push_back({number, line.substr(6), {}});
            isOpen = true;
        } else if (isOpen && (line.empty() || line.starts_with(indent))) {
            examples.back().printed.push_back(line.empty() ? line : line.substr(indent.size()));
        } else {
            isOpen = false;
        }
    }
    for (Example& example : examples) {
        while (!example.printed.empty() && example.printed.back().empty()) {
            example.printed.pop_back();
        }
    }
    return examples;
}

/// A line without what differs from run to run: dates, and the sizes of files beside them.
std::string comparable(const std::string& line) {
    static const std::regex date("[0-9]{4}-[0-9]{2}-[0-9]{2}( [0-9]{2}:[0-9]{2}( +[0-9]+ )?|T[0-9:]{8}Z)");
    return std::regex_replace(line, date, "DATE");
}

/// True if the lines are those of the manual, where "..." stands for any number of lines.
bool matches(const std::vector<std::string>& shown, size_t i, const std::vector<std::string>& printed,
             size_t j) {
    if (i == shown.size()) {
        return j == printed.size();
    }
    if (shown[i] == "...") {
        return matches(shown, i + 1, printed, j) || (j < printed.size() && matches(shown, i, printed, j + 1));
    }
    return j < printed.size() && comparable(shown[i]) == comparable(printed[j]) &&
           matches(shown, i + 1, printed, j + 1);
}

/// Each example is run after those before it, in one folder with the installed examples, as a user would.
TEST_F(Qmedit, TheManualsExamplesPrintWhatItShows) {
    namespace fs = std::filesystem;
    fs::create_directory(folder.path("bin").c_str());
    fs::create_symlink(QMEDIT_PROGRAM, folder.path("bin/qmedit").c_str());
    for (const fs::directory_entry& entry : fs::directory_iterator(QMEDIT_EXAMPLES)) {
        if (entry.path().extension() == ".edl") {
            fs::copy_file(entry.path(), folder.path(entry.path().filename().string()).c_str());
        }
    }
    const std::vector<Example> examples = examplesOf(QMEDIT_MANUAL);
    ASSERT_GT(examples.size(), 20u);
    for (const Example& example : examples) {
        const test::ProgramResult result = test::runProgram(
            "/bin/sh", {"-c", "cd " + folder.path() + " && { " + example.command + "; } 2>&1"},
            {{"PATH=" + folder.path("bin") + ":/usr/bin:/bin", "LANG=C.UTF-8", "COLUMNS=84",
              "TMPDIR=" + folder.path(), "TZ=UTC"},
             {}});
        std::vector<std::string> printed;
        for (const String& line : result.out.split('\n')) {
            printed.push_back(line);
        }
        while (!printed.empty() && printed.back().empty()) {
            printed.pop_back();
        }
        EXPECT_TRUE(matches(example.printed, 0, printed, 0))
            << QMEDIT_MANUAL << ":" << example.line << ": $ " << example.command << "\n"
            << result.out;
    }
}

} // namespace
