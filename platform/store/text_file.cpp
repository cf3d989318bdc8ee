#include "platform/store/text_file.h"

#include "platform/base/text_lines.h"
#include "platform/services/atomic_file.h"
#include "platform/services/files.h"

namespace {

constexpr std::string_view kUtf8Mark = "\xEF\xBB\xBF";

/// A file of more lines than this is no text of ours; each line takes memory of its own.
constexpr size_t kMaxLines = size_t{1} << 24;

/// So much text is gathered before it goes to the file.
constexpr size_t kPieceSize = size_t{1} << 20;

std::string_view withoutMark(std::string_view text) {
    return text.starts_with(kUtf8Mark) ? text.substr(kUtf8Mark.size()) : text;
}

/// Exactly as many as `Qx::takeLine` finds.
size_t countLines(std::string_view text) {
    size_t ends = 0;
    for (size_t i = 0; i + 1 < text.size(); ++i) {
        ends += text[i] == '\n' || (text[i] == '\r' && text[i + 1] != '\n') ? 1 : 0;
    }
    // The last line needs no end, and none follows the last end.
    return text.empty() ? 0 : ends + 1;
}

std::vector<String> linesOf(std::string_view text, size_t count) {
    std::vector<String> lines;
    lines.reserve(count);
    while (!text.empty()) {
        lines.emplace_back(Qx::takeLine(text));
    }
    return lines;
}

} // namespace

Qx::Status TextFile::load(const String& path, uint64_t limit) {
    String text;
    if (const Qx::FileError error = Qx::readWholeFile(path, text, limit)) {
        return error.status();
    }
    const std::string_view content = withoutMark(text);
    const size_t count = countLines(content);
    if (count > kMaxLines) {
        return Qx::Status::failure(Qx::StatusCode::Damaged, path + " has more than " +
                                                                std::to_string(kMaxLines) +
                                                                " lines; it is no text file of this program");
    }
    m_lines = linesOf(content, count);
    m_path = path;
    return {};
}

void TextFile::setText(std::string_view text) {
    m_lines = linesOf(withoutMark(text), countLines(withoutMark(text)));
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
    String piece;
    Qx::FileError error;
    for (size_t i = 0; i < m_lines.size() && !error; ++i) {
        piece += m_lines[i];
        piece += '\n';
        if (piece.size() >= kPieceSize || i + 1 == m_lines.size()) {
            error = file.write(piece);
            piece.clear();
        }
    }
    if (!error) {
        error = file.commit();
    }
    return error.status();
}

const String& TextFile::operator[](unsigned line) const {
    // Never destroyed: files are written while the process ends.
    static const String& none = *new String;
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
