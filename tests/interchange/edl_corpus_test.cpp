#include "edl_printing.h"

#include "interchange/edl/edl_import.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <sstream>

using namespace interchange;
namespace fs = std::filesystem;

namespace {

const fs::path kCorpus = fs::path(QUILLMARCH_SOURCE_DIR) / "tests/interchange/corpus";

std::vector<fs::path> listsIn(const fs::path& folder) {
    std::vector<fs::path> paths;
    for (const auto& entry : fs::directory_iterator(folder)) {
        if (entry.path().extension() == ".edl") {
            paths.push_back(entry.path());
        }
    }
    std::sort(paths.begin(), paths.end());
    return paths;
}

// What stands beside a list: a line "rate 25", "rate 25 strict" or "rate 25 skip", then what is expected of it.
struct Expectation {
    ImportOptions options;
    std::string text;

    explicit Expectation(fs::path path) {
        std::ifstream in(path.replace_extension(".txt"), std::ios::binary);
        std::string line;
        std::getline(in, line);
        std::istringstream words(line);
        std::string word;
        words >> word >> word;
        options.rate = Qx::FrameRate::fromString(word);
        words >> word;
        options.strict = word == "strict";
        options.skipBad = word == "skip";
        text = {std::istreambuf_iterator<char>(in), {}};
    }
};

/// Messages name a list as it was given: here without its folder.
std::string withoutFolder(std::string text, const fs::path& path) {
    const std::string folder = path.parent_path().string() + "/";
    for (size_t at = text.find(folder); at != std::string::npos; at = text.find(folder, at)) {
        text.erase(at, folder.size());
    }
    return text;
}

std::string outcome(const fs::path& path, const ImportOptions& options) {
    EdlList list;
    EdlProgramme programme;
    LossReport report;
    const BadLines bad = options.skipBad ? BadLines::Skip : BadLines::Refuse;
    Qx::Status status = readEdlFile(path.string(), options.rate, list, report, bad);
    if (status) {
        status = layTracks(list, options.strict, programme, report);
    }
    return withoutFolder(status ? printProgramme(list, programme, report) : status.reason() + "\n", path);
}

} // namespace

TEST(EdlCorpus, GoodListsBecomeTheTracksBesideThem) {
    auto paths = listsIn(kCorpus / "good");
    ASSERT_GE(paths.size(), 18U);
    // Lists of which a part is good.
    for (const fs::path& path : listsIn(kCorpus / "partly")) {
        paths.push_back(path);
    }
    for (const fs::path& path : paths) {
        const Expectation expected(path);
        ASSERT_TRUE(expected.options.rate.valid()) << path;
        EXPECT_EQ(outcome(path, expected.options), expected.text) << path.filename();
    }
}

TEST(EdlCorpus, BadListsAreRefusedInOneSentence) {
    const auto paths = listsIn(kCorpus / "bad");
    ASSERT_GE(paths.size(), 17U);
    for (const fs::path& path : paths) {
        const Expectation expected(path);
        const std::string text = outcome(path, expected.options);
        EXPECT_EQ(text, expected.text) << path.filename();
        EXPECT_EQ(std::count(text.begin(), text.end(), '\n'), 1) << text;
    }
}

// Lists as tools in the field wrote them. They are not part of this tree: the folder is named from outside.
TEST(EdlCorpus, ListsOfTheFieldImport) {
    const char* const folder = std::getenv("QUILLMARCH_EDL_SAMPLES");
    if (folder == nullptr || !fs::is_directory(folder)) {
        GTEST_SKIP() << "QUILLMARCH_EDL_SAMPLES does not name a folder of edit lists";
    }
    for (const fs::path& path : listsIn(folder)) {
        Import result;
        Qx::Status status;
        for (const int code : {Qx::FrameRate::Fps24, Qx::FrameRate::Fps25, Qx::FrameRate::Fps30}) {
            status = importEdl(path.string(), {Qx::FrameRate(code), false}, result);
            if (status) {
                break;
            }
        }
        EXPECT_TRUE(status.isOk()) << status.reason();
        EXPECT_TRUE(result.sequence.valid());
        EXPECT_FALSE(result.shots.empty());
    }
}
