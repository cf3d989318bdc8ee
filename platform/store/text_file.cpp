#include "platform/store/text_file.h"

#include "platform/base/text_lines.h"
#include "platform/services/atomic_file.h"
#include "platform/services/files.h"

#include <limits>

namespace {

constexpr std::string_view kUtf8Mark = "\xEF\xBB\xBF";

/// A file of more lines than this is no text of ours; each line takes memory of its own.
constexpr size_t kMaxLines = size_t{1} << 24;

std::string_view withoutMark(std::string_view text) {
    return text.starts_with(kUtf8Mark) ? text.substr(kUtf8Mark.size()) : text;
}

size_t countLines(std::string_view text, size_t limit) {
    size_t count = 0;
    while (!text.empty() && count <= limit) {
        Qx::takeLine(text);
        ++count;
    }
    return count;
}

std::vector<String> linesOf(std::string_view text) {
    std::vector<String> lines;
    lines.reserve(countLines(text, std::numeric_limits<unsigned>::max()));
    while (!text.empty()) {
        lines.emplace_back(Qx::takeLine(text));
    }
    return lines;
}

} // namespace

Qx::Status TextFile::load(const String& path, uint64_t limit) {
    String text;
    if (const Qx::FileError error = Qx::readWholeFile(path, text, limit)) {
        return Qx::Status::failure(error.text());
    }
    if (countLines(withoutMark(text), kMaxLines) > kMaxLines) {
        return Qx::Status::failure(path + " has more than " + std::to_string(kMaxLines) +
                                   " lines; it is no text file of this program");
    }
    m_lines = linesOf(withoutMark(text));
    m_path = path;
    return {};
}

void TextFile::setText(std::string_view text) {
    m_lines = linesOf(withoutMark(text));
}

String TextFile::text() const {
    size_t size = 0;
    for (const String& line : m_lines) {
        size += line.size() + 1;
    }
    String whole;
    whole.reserve(size);
    for (const String& line : m_lines) {
        whole += line;
        whole += '\n';
    }
    return whole;
}

Qx::Status TextFile::save(const String& path) const {
    Qx::AtomicFile file(path);
    if (const Qx::FileError error = file.write(text())) {
        return Qx::Status::failure(error.text());
    }
    if (const Qx::FileError error = file.commit()) {
        return Qx::Status::failure(error.text());
    }
    return {};
}

const String& TextFile::operator[](unsigned line) const {
    static const String none;
    return line < m_lines.size() ? m_lines[line] : none;
}

int TextFile::find(std::string_view text, unsigned from, bool atStart) const {
    for (size_t i = from; i < m_lines.size(); ++i) {
        const std::string_view line = m_lines[i];
        if (atStart ? line.starts_with(text) : line.find(text) != std::string_view::npos) {
            return static_cast<int>(i);
        }
    }
    return -1;
}

bool TextFile::changeLine(unsigned line, String text) {
    if (line >= m_lines.size()) {
        return false;
    }
    m_lines[line] = std::move(text);
    return true;
}

bool TextFile::removeLine(unsigned line) {
    if (line >= m_lines.size()) {
        return false;
    }
    m_lines.erase(m_lines.begin() + static_cast<std::ptrdiff_t>(line));
    return true;
}
