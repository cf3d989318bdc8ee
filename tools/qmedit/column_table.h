#pragma once

#include "tools/qmedit/console.h"

#include <span>
#include <vector>

/// Rows of texts in columns as wide as their widest text, two blanks apart. The last column is as wide as
/// each of its texts. What is in them is safe to write.
class ColumnTable {
public:
    /// The heading is the first row; `rightAligned` tells of each column whether its texts stand right.
    ColumnTable(std::vector<String> heading, std::span<const bool> rightAligned);
    void add(std::vector<String> row, Console::Ink ink);
    /// The lines, each in its row's ink. With `fitLast` the last column is cut to what a terminal has left.
    [[nodiscard]] String text(const Console& console, bool fitLast) const;

private:
    struct Row {
        std::vector<String> cells;
        Console::Ink ink;
    };
    std::vector<bool> m_rightAligned;
    std::vector<Row> m_rows;
};
