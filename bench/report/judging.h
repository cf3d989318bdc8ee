#pragma once

#include "bench/report/goals.h"
#include "bench/report/results.h"

#include <set>
#include <string>
#include <vector>

namespace report {

enum class Verdict { NoGoal, Met, Missed, NotMeasured };

/// What a row's values are.
enum class Unit { Nanoseconds, Bytes };

/// A row of the report: a value, its limit and what came of it.
struct Judged {
    Group group = Group::File;
    Unit unit = Unit::Nanoseconds;
    std::string what;
    double value = 0; ///< 0 if it was not measured
    std::string limit;
    double limitValue = 0; ///< 0 if there is none or it was not measured
    double ratio = 0;      ///< 0 if either is
    double goal = 0;       ///< the greatest ratio; 0 if there is no goal
    std::string goalText;  ///< "≤ 4"; empty if there is no goal
    Verdict verdict = Verdict::NoGoal;
    /// For a goal that was not met: the sentences that say by how much and why.
    std::string reason;
};

/// The report on a run.
struct Judgement {
    std::vector<Judged> rows;    ///< every goal, and every other known measure that the results hold
    std::set<Results::Key> used; ///< the results that `rows` show in full
    size_t goals = 0;
    size_t met = 0;
};

/// Judges results at a size in clips. What has no result at that size is judged by its result without a size;
/// a goal whose measure or limit is missing counts as not met.
[[nodiscard]] Judgement judge(const Results& results, uint64_t clips = kGoalClips);

/// A value in its unit: "12.3 µs", "68.2 B"; "-" for 0, a value that was not measured.
[[nodiscard]] std::string valueText(double value, Unit unit);
/// The ratio of a row; "-" if there is none. Where the ratio misses the goal by so little that three digits
/// do not show it, there are more.
[[nodiscard]] std::string ratioText(const Judged& row);

} // namespace report
