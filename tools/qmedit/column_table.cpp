#include "tools/qmedit/column_table.h"

#include "tools/qmedit/safe_text.h"

#include <algorithm>

namespace {

/// The last column is left this much however narrow the terminal is.
constexpr int kLeastLast = 12;
constexpr std::string_view kBetween = "  ";

} // namespace

ColumnTable::ColumnTable(std::vector<String> heading, std::span<const bool> rightAligned)
    : m_rightAligned(rightAligned.begin(), rightAligned.end()) {
    add(std::move(heading), Console::Ink::Dim);
}

void ColumnTable::add(std::vector<String> row, Console::Ink ink) {
    m_rows.push_back({std::move(row), ink});
}

String ColumnTable::text(const Console& console, bool fitLast) const {
    const size_t last = m_rightAligned.size() - 1;
    std::vector<int> widths(last);
    for (const Row& row : m_rows) {
        for (size_t i = 0; i < last; ++i) {
            widths[i] = std::max(widths[i], safe_text::columns(row.cells[i]));
        }
    }
    String out;
    for (const Row& row : m_rows) {
        String line;
        int used = 0;
        for (size_t i = 0; i < last; ++i) {
            line += safe_text::padded(row.cells[i], widths[i], "", m_rightAligned[i]);
            line += kBetween;
            used += widths[i] + static_cast<int>(kBetween.size());
        }
        line += fitLast && console.fitted()
                    ? safe_text::fitted(row.cells[last], std::max(console.width() - used, kLeastLast),
                                        console.ellipsis())
                    : row.cells[last];
        out += console.inked(row.ink, line) + "\n";
    }
    return out;
}
