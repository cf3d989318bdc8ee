#pragma once

#include <filesystem>
#include <fstream>
#include <iterator>
#include <map>
#include <string>

namespace test {

/// Every name below a folder with its bytes, so that two moments of a tree can be compared. Folders
/// stand with "(folder)", links with their target; a folder that does not exist gives an empty snapshot.
inline std::map<std::string, std::string> treeSnapshot(const std::string& folder) {
    namespace fs = std::filesystem;
    std::map<std::string, std::string> tree;
    if (!fs::exists(fs::path(folder))) {
        return tree;
    }
    tree["."] = "(folder)";
    for (const fs::directory_entry& entry : fs::recursive_directory_iterator(fs::path(folder))) {
        std::string& bytes = tree[entry.path().lexically_relative(folder).string()];
        if (entry.is_symlink()) {
            bytes = "-> " + fs::read_symlink(entry.path()).string();
        } else if (entry.is_directory()) {
            bytes = "(folder)";
        } else {
            std::ifstream file(entry.path(), std::ios::binary);
            bytes.assign(std::istreambuf_iterator<char>(file), {});
        }
    }
    return tree;
}

} // namespace test
