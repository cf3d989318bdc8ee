#pragma once

#include "platform/base/export.h"
#include "platform/base/qx_string.h"
#include "platform/base/status.h"

#include <vector>

/// A text file as a list of lines, read and written whole. Lines are numbered from 0 in the interface and
/// from 1 in messages. Reading takes LF, CRLF and lone CR and an optional UTF-8 mark; writing gives LF.
class QM_API TextFile {
public:
    TextFile() = default;

    /// Reads a file of at most `limit` bytes. On failure the object is as it was.
    Qx::Status load(const String& path, uint64_t limit = uint64_t{1} << 30);
    /// The lines of a text.
    void setText(std::string_view text);
    [[nodiscard]] String text() const;
    /// Writes the lines, atomically and durably.
    Qx::Status save(const String& path) const;

    [[nodiscard]] unsigned numLines() const { return static_cast<unsigned>(m_lines.size()); }
    /// A line without its end; an empty line for a number out of range.
    [[nodiscard]] const String& operator[](unsigned line) const;
    /// The first line at or after `from` that holds `text`, or with `atStart` begins with it; -1 if none.
    [[nodiscard]] int find(std::string_view text, unsigned from = 0, bool atStart = false) const;

    void appendLine(String line) { m_lines.push_back(std::move(line)); }
    /// False, changing nothing, for a number out of range.
    bool changeLine(unsigned line, String text);
    bool removeLine(unsigned line);
    void clear() { m_lines.clear(); }

    /// Where it was read from; empty if it was not.
    [[nodiscard]] const String& path() const { return m_path; }

private:
    std::vector<String> m_lines;
    String m_path;
};
