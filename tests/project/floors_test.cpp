// The house rules that the tree itself must keep: includes go only downwards, and what is installed needs
// nothing that is not.

#include <gtest/gtest.h>

#include <array>
#include <filesystem>
#include <fstream>
#include <map>
#include <regex>
#include <set>
#include <sstream>
#include <string>
#include <vector>

namespace {

namespace fs = std::filesystem;

const fs::path source{QUILLMARCH_SOURCE_DIR};

/// A room's floor times ten, plus its order on a floor whose rooms may include each other downwards.
const std::map<std::string, int> rooms = {
    {"platform/base", 10},     {"platform/services", 20}, {"platform/notify", 21},  {"platform/store", 22},
    {"platform/database", 23}, {"platform/media", 24},    {"platform/effects", 25}, {"edit/project", 30},
    {"edit/model", 40},        {"edit/persist", 50},      {"edit/graph", 50},       {"edit/material", 50},
    {"edit/manager", 60},      {"edit/effects", 60},      {"edit/editing", 70},     {"edit/inspect", 70},
    {"interchange", 70},       {"tools/qmedit", 80},
};

std::string roomOf(const std::string& file) {
    for (const auto& [room, floor] : rooms) {
        if (file.rfind(room + "/", 0) == 0) {
            return room;
        }
    }
    return {};
}

/// Why a file of one room may not include `included`; empty if it may.
std::string objection(const std::string& file, const std::string& included) {
    const std::string from = roomOf(file);
    const std::string to = roomOf(included);
    if (to.empty()) {
        return "names no room of the house";
    }
    if (from == to) {
        return {};
    }
    if (included.find("/detail/") != std::string::npos) {
        return "reaches into the private headers of another room";
    }
    const int fromFloor = rooms.at(from);
    const int toFloor = rooms.at(to);
    if (toFloor > fromFloor) {
        return "climbs a floor";
    }
    return toFloor == fromFloor ? "enters a neighbour on the same floor" : "";
}

std::vector<std::string> includesOf(const std::string& text) {
    static const std::regex form("^[ \t]*#[ \t]*include[ \t]*\"([^\"]+)\"", std::regex::multiline);
    std::vector<std::string> found;
    for (std::sregex_iterator it(text.begin(), text.end(), form), end; it != end; ++it) {
        found.push_back((*it)[1]);
    }
    return found;
}

std::string contents(const fs::path& path) {
    std::ifstream in(path, std::ios::binary);
    std::ostringstream all;
    all << in.rdbuf();
    return all.str();
}

std::vector<std::string> sourceFiles() {
    std::vector<std::string> files;
    for (const auto& [room, floor] : rooms) {
        if (!fs::exists(source / room)) {
            continue;
        }
        for (const auto& entry : fs::recursive_directory_iterator(source / room)) {
            const std::string extension = entry.path().extension().string();
            if (extension == ".h" || extension == ".cpp") {
                files.push_back(fs::relative(entry.path(), source).generic_string());
            }
        }
    }
    return files;
}

/// The headers that the rooms list for installation.
std::set<std::string> publicHeaders() {
    std::set<std::string> headers;
    for (const auto& [room, floor] : rooms) {
        const std::string list = contents(source / room / "CMakeLists.txt");
        const size_t from = list.find("HEADERS");
        std::istringstream words(from == std::string::npos ? "" : list.substr(from + 7));
        for (std::string word; words >> word;) {
            const std::string name = word.substr(0, word.find(')'));
            if (name.size() > 2 && name.ends_with(".h")) {
                headers.insert(room + "/" + name);
            }
        }
    }
    return headers;
}

TEST(Floors, IncludesGoOnlyDownwards) {
    size_t seen = 0;
    for (const std::string& file : sourceFiles()) {
        for (const std::string& included : includesOf(contents(source / file))) {
            EXPECT_EQ(objection(file, included), "") << file << " includes " << included;
            ++seen;
        }
    }
    EXPECT_GT(seen, 50u) << "the includes were not found";
}

TEST(Floors, TheRulesRefuseWhatClimbs) {
    const std::vector<std::array<std::string, 3>> cases = {
        {"edit/model/edit.cpp", "edit/persist/edit_file.h", "climbs a floor"},
        {"platform/services/files.cpp", "platform/store/pstream.h", "climbs a floor"},
        {"edit/persist/a.cpp", "edit/graph/b.h", "enters a neighbour on the same floor"},
        {"interchange/a.cpp", "edit/editing/editor.h", "enters a neighbour on the same floor"},
        {"edit/persist/a.cpp", "platform/store/detail/b.h",
         "reaches into the private headers of another room"},
        {"edit/model/a.cpp", "somewhere/b.h", "names no room of the house"},
        {"edit/model/a.cpp", "edit/model/detail/b.h", ""},
        {"platform/store/a.cpp", "platform/services/files.h", ""},
        {"tools/qmedit/a.cpp", "interchange/b.h", ""},
    };
    for (const auto& [file, included, expected] : cases) {
        EXPECT_EQ(objection(file, included), expected) << file << " includes " << included;
    }
    EXPECT_EQ(includesOf("  #  include \"a/b.h\"\n#include <c>\n#include \"d.h\""),
              (std::vector<std::string>{"a/b.h", "d.h"}));
}

TEST(PublicHeaders, NeedOnlyPublicHeaders) {
    const std::set<std::string> headers = publicHeaders();
    ASSERT_GT(headers.size(), 30u);
    for (const std::string& header : headers) {
        ASSERT_TRUE(fs::exists(source / header)) << header << " is listed but missing";
        EXPECT_EQ(header.find("/detail/"), std::string::npos) << header << " is private";
        for (const std::string& included : includesOf(contents(source / header))) {
            EXPECT_TRUE(headers.count(included))
                << header << " needs " << included << ", which is not installed";
        }
    }
}

TEST(PublicHeaders, EveryHeaderOfTheLibraryIsListedOrPrivate) {
    const std::set<std::string> headers = publicHeaders();
    for (const std::string& file : sourceFiles()) {
        const bool library = file.rfind("platform/", 0) == 0 || file.rfind("edit/", 0) == 0;
        if (library && file.ends_with(".h") && file.find("/detail/") == std::string::npos) {
            EXPECT_TRUE(headers.count(file)) << file << " is neither listed under HEADERS nor in detail/";
        }
    }
}

} // namespace
