#include "bench/report/table.h"

#include "bench/report/text.h"

#include <algorithm>

namespace report {

namespace {

/// Lines of cells under headings, each column as wide as its widest cell. The first column stands left, as do
/// those named in `left`; all others, numbers, stand right. A line of one cell divides the table.
class Grid {
public:
    Grid(std::vector<std::string> headings, std::vector<size_t> left) : m_left(std::move(left)) {
        m_widths.resize(headings.size());
        add(std::move(headings));
    }

    void add(std::vector<std::string> cells) {
        for (size_t i = 0; cells.size() > 1 && i < cells.size(); ++i) {
            m_widths[i] = std::max(m_widths[i], columns(cells[i]) + (i == 0 ? 2 : 0));
        }
        m_lines.push_back(std::move(cells));
    }

    [[nodiscard]] std::string text() const {
        std::string out;
        for (const auto& cells : m_lines) {
            std::string line;
            for (size_t i = 0; i < cells.size(); ++i) {
                const bool right = std::find(m_left.begin(), m_left.end(), i) == m_left.end();
                const std::string cell = i == 0 && cells.size() > 1 ? "  " + cells[i] : cells[i];
                line += (i == 0 ? "" : "  ") + padded(cell, m_widths[i], right);
            }
            out += line.substr(0, line.find_last_not_of(' ') + 1) + "\n";
        }
        return out;
    }

private:
    std::vector<size_t> m_left;
    std::vector<size_t> m_widths;
    std::vector<std::vector<std::string>> m_lines;
};

std::string verdictText(Verdict verdict) {
    switch (verdict) {
    case Verdict::Met:
        return "met";
    case Verdict::Missed:
        return "MISSED";
    case Verdict::NotMeasured:
        return "not measured";
    case Verdict::NoGoal:
        break;
    }
    return "";
}

std::string groupName(Group group) {
    return std::string(kGroupNames.at(static_cast<size_t>(group)));
}

std::string limitTable(const Judgement& judgement) {
    Grid grid({"what is measured", "time", "limit", "its time", "ratio", "goal", ""}, {0, 2, 6});
    const Judged* before = nullptr;
    for (const Judged& row : judgement.rows) {
        if (before == nullptr || before->group != row.group) {
            grid.add({groupName(row.group)});
        }
        before = &row;
        const bool limited = !row.limit.empty();
        grid.add({row.what, valueText(row.value, row.unit), row.limit,
                  limited ? valueText(row.limitValue, row.unit) : "", limited ? ratioText(row) : "",
                  row.goalText, verdictText(row.verdict)});
    }
    return grid.text();
}

std::string goalsText(const Judgement& judgement) {
    std::string out =
        std::to_string(judgement.met) + " of " + std::to_string(judgement.goals) + " goals met.\n";
    for (const Judged& row : judgement.rows) {
        if (!row.reason.empty()) {
            out += wrapped("  - ", row.reason);
        }
    }
    return out;
}

/// The measures by size. Results that are shown are added to `used`.
class SizeTable {
public:
    SizeTable(const Results& results, std::set<Results::Key>& used)
        : m_results(results), m_used(used), m_grid(headings(), {0}) {}

    [[nodiscard]] std::string text() {
        for (size_t group = 0; group < kGroupNames.size(); ++group) {
            m_heading = kGroupNames.at(group);
            for (const SpeedRow& row : kSpeedRows) {
                if (row.group == static_cast<Group>(group)) {
                    add(row.what, std::string(row.measure));
                }
            }
        }
        add(kMemoryRow.what, std::string(kMemoryRow.measure), kMemoryRow.counter);
        m_heading = "Limits";
        std::set<std::string> limits;
        for (const SpeedRow& row : kSpeedRows) {
            for (const std::string_view limit : row.limits) {
                if (!limit.empty() && limits.insert(std::string(limit)).second) {
                    add(limit, "limit/" + std::string(limit));
                }
            }
        }
        return m_any ? m_grid.text() : "";
    }

private:
    static std::vector<std::string> headings() {
        std::vector<std::string> texts = {"at sizes of"};
        for (const uint64_t size : kSizes) {
            texts.insert(texts.end(), {countText(size), "a clip"});
        }
        return texts;
    }

    /// A line for a measure, or a counter of it in bytes, that was taken at two of the sizes at least.
    void add(std::string_view what, const std::string& measure, std::string_view counter = {}) {
        std::vector<std::string> cells = {std::string(what)};
        std::vector<Results::Key> keys;
        for (const uint64_t size : kSizes) {
            const auto found = m_results.all.find({measure, size});
            const double value = found == m_results.all.end() ? 0
                                 : counter.empty()            ? found->second.nanoseconds
                                                              : found->second.counter(counter);
            cells.push_back(valueText(value, counter.empty() ? Unit::Nanoseconds : Unit::Bytes));
            cells.push_back(counter.empty() ? valueText(value / static_cast<double>(size), Unit::Nanoseconds)
                                            : "");
            if (value > 0) {
                keys.push_back(found->first);
            }
        }
        if (keys.size() < 2) {
            return;
        }
        if (!m_heading.empty()) {
            m_grid.add({m_heading});
            m_heading.clear();
        }
        m_used.insert(keys.begin(), keys.end());
        m_grid.add(std::move(cells));
        m_any = true;
    }

    const Results& m_results;
    std::set<Results::Key>& m_used;
    Grid m_grid;
    std::string m_heading; ///< of the group at hand, until it is written
    bool m_any = false;
};

std::string othersText(const Results& results, const std::set<Results::Key>& used) {
    std::string out;
    for (const auto& [key, result] : results.all) {
        if (used.count(key) == 0) {
            const std::string time =
                result.nanoseconds > 0 ? timeText(result.nanoseconds) : std::string("no usable time");
            out += "  " + padded(plain(nameOf(key)), 40) + "  " + time + "\n";
        }
    }
    return out.empty() ? out : "\nAlso measured:\n" + out;
}

std::string faultsText(const Results& results) {
    constexpr size_t kMost = 20;
    std::string out;
    for (size_t i = 0; i < std::min(kMost, results.faults.size()); ++i) {
        out += wrapped("  - ", results.faults[i]);
    }
    if (results.faults.size() > kMost) {
        out += "  - and " + std::to_string(results.faults.size() - kMost) + " more.\n";
    }
    return out.empty() ? out : "\nEntries of the file without a result:\n" + out;
}

} // namespace

std::string reportText(const Results& results, const Judgement& judgement, uint64_t clips) {
    std::set<Results::Key> used = judgement.used;
    const std::string sizes = SizeTable(results, used).text();
    std::string out = "Speed against the physical limit, n = " + countText(clips) + "\n";
    out += results.machine.empty() ? "" : results.machine + "\n";
    if (clips != kGoalClips) {
        out += "The goals are set for n = " + countText(kGoalClips) + ".\n";
    }
    out += "\n" + limitTable(judgement) + "\n" + goalsText(judgement);
    out += "\n" +
           wrapped("", "A limit is the least that the machine must do for the same bytes, measured in the "
                       "same run. Of a growth, the goal " +
                           threeDigits(kLinear) +
                           " means linear: ten times the clips take at most ten times the time, and a "
                           "quarter of that for the noise of measuring.");
    out += sizes.empty() ? "" : "\n" + sizes;
    return out + othersText(results, used) + faultsText(results);
}

} // namespace report
