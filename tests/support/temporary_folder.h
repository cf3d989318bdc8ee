#pragma once

#include "platform/base/qx_string.h"

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <sstream>
#include <stdexcept>
#include <string>

namespace test {

/// A fresh folder of a test's own, removed with all that is in it.
class TemporaryFolder {
public:
    TemporaryFolder() {
        std::string form = (std::filesystem::temp_directory_path() / "quillmarch-test-XXXXXX").string();
        if (::mkdtemp(form.data()) == nullptr) {
            throw std::runtime_error("cannot make a temporary folder");
        }
        m_path = form;
    }
    ~TemporaryFolder() {
        std::error_code ignored;
        std::filesystem::remove_all(m_path.string(), ignored);
    }
    TemporaryFolder(const TemporaryFolder&) = delete;
    TemporaryFolder& operator=(const TemporaryFolder&) = delete;

    [[nodiscard]] String path() const { return m_path.string(); }
    /// The path of a name in the folder.
    [[nodiscard]] String path(const std::string& name) const { return (m_path / name).string(); }

    /// Writes a file's bytes and returns its path.
    String write(const std::string& name, const std::string& bytes) const {
        std::filesystem::create_directories((m_path / name).parent_path());
        std::ofstream(m_path / name, std::ios::binary) << bytes;
        return path(name);
    }
    /// A file's bytes; "(missing)" when it cannot be read.
    [[nodiscard]] std::string read(const std::string& name) const {
        std::ifstream file(m_path / name, std::ios::binary);
        if (!file) {
            return "(missing)";
        }
        std::ostringstream bytes;
        bytes << file.rdbuf();
        return bytes.str();
    }
    /// How many names there are in the folder, not looking into folders in it.
    [[nodiscard]] size_t numNames() const {
        return static_cast<size_t>(std::distance(std::filesystem::directory_iterator(m_path), {}));
    }

private:
    std::filesystem::path m_path;
};

} // namespace test
