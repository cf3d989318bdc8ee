#include "bench/report/judging.h"

#include "bench/report/text.h"

namespace report {

namespace {

/// A value that is above its goal: three digits, or all of them where three would hide it.
std::string aboveText(double value, double goal) {
    const std::string text = threeDigits(value);
    return text == threeDigits(goal) ? numberText(value) : text;
}

class Judge {
public:
    Judge(const Results& results, uint64_t clips) : m_results(results), m_clips(clips) {}

    [[nodiscard]] Judgement judgement() {
        for (size_t group = 0; group < kGroupNames.size(); ++group) {
            for (const SpeedRow& row : kSpeedRows) {
                if (row.group == static_cast<Group>(group)) {
                    addSpeed(row);
                }
            }
        }
        addMemory(kMemoryRow);
        for (const GrowthRow& row : kGrowthRows) {
            addGrowth(row);
        }
        return std::move(m_judgement);
    }

private:
    /// The time of a measure; 0, and the measure among what is lacking, if it has none. A result without a
    /// size tells nothing of growth, so that one `exactly` of that size can be asked for.
    double timeOf(const std::string& measure, uint64_t clips, bool exactly = false) {
        const auto found = exactly ? m_results.all.find({measure, clips}) : m_results.find(measure, clips);
        if (found == m_results.all.end()) {
            lack(nameOf({measure, clips}));
            return 0;
        }
        m_read.insert(found->first);
        if (found->second.nanoseconds == 0) {
            lack("a usable time of " + nameOf(found->first));
        }
        return found->second.nanoseconds;
    }

    void lack(const std::string& what) { m_lacking += (m_lacking.empty() ? "" : " and ") + what; }

    void addSpeed(const SpeedRow& row) {
        if (row.goal == 0 && m_results.find(row.measure, m_clips) == m_results.all.end()) {
            return;
        }
        Judged judged;
        judged.group = row.group;
        judged.what = row.what;
        judged.limit = row.limitWords;
        judged.value = timeOf(std::string(row.measure), m_clips);
        bool whole = true;
        for (const std::string_view limit : row.limits) {
            if (!limit.empty()) {
                const double time = timeOf("limit/" + std::string(limit), m_clips);
                whole = whole && time > 0;
                judged.limitValue += time;
            }
        }
        judged.limitValue = whole ? judged.limitValue : 0;
        judged.goal = row.goal;
        judged.goalText = row.goal > 0 ? "≤ " + numberText(row.goal) : "";
        compare(judged, false);
        finish(judged, ratioText(judged) + " times its limit; the goal is " + numberText(row.goal) + ".",
               row.whyMissed);
    }

    void addMemory(const MemoryRow& row) {
        Judged judged;
        judged.group = Group::MemoryAndGrowth;
        judged.unit = Unit::Bytes;
        judged.what = row.what;
        judged.limit = row.limitWords;
        const auto found = m_results.find(row.measure, m_clips);
        if (found != m_results.all.end()) {
            m_read.insert(found->first);
            judged.value = found->second.counter(row.counter);
        }
        if (judged.value == 0) {
            lack("a usable counter " + std::string(row.counter) + " of " +
                 nameOf({std::string(row.measure), m_clips}));
        }
        judged.limitValue = row.limit;
        judged.goal = row.goal / row.limit;
        judged.goalText = "≤ " + numberText(row.goal) + " B";
        compare(judged, false);
        finish(judged,
               aboveText(judged.value, row.goal) + " bytes; the goal is " + numberText(row.goal) + " bytes.",
               row.whyMissed);
    }

    void addGrowth(const GrowthRow& row) {
        Judged judged;
        judged.group = Group::MemoryAndGrowth;
        judged.what = row.what;
        judged.limit = "the same at " + countText(row.fromClips) + " clips";
        judged.value = timeOf(std::string(row.measure), row.toClips, true);
        judged.limitValue = timeOf(std::string(row.measure), row.fromClips, true);
        judged.goal = row.goal;
        judged.goalText = (row.under ? "< " : "≤ ") + numberText(row.goal);
        compare(judged, row.under);
        finish(judged,
               ratioText(judged) + " times as long; the goal is " + (row.under ? "under " : "") +
                   numberText(row.goal) + ".",
               row.whyMissed);
    }

    static void compare(Judged& judged, bool under) {
        if (judged.value > 0 && judged.limitValue > 0) {
            judged.ratio = judged.value / judged.limitValue;
        }
        if (judged.goal > 0) {
            const bool met = under ? judged.ratio < judged.goal : judged.ratio <= judged.goal;
            judged.verdict = judged.ratio == 0 ? Verdict::NotMeasured : met ? Verdict::Met : Verdict::Missed;
        }
    }

    void finish(Judged& judged, const std::string& amount, std::string_view whyMissed) {
        if (judged.verdict == Verdict::NotMeasured) {
            judged.reason = judged.what + ": not measured; the results lack " + m_lacking + ".";
        } else if (judged.verdict == Verdict::Missed) {
            judged.reason = judged.what + ": takes " + amount;
            judged.reason += whyMissed.empty() ? "" : " " + std::string(whyMissed);
        }
        m_judgement.goals += judged.verdict != Verdict::NoGoal ? 1 : 0;
        m_judgement.met += judged.verdict == Verdict::Met ? 1 : 0;
        if (judged.ratio > 0 || judged.limit.empty()) {
            m_judgement.used.merge(m_read);
        }
        m_read.clear();
        m_lacking.clear();
        m_judgement.rows.push_back(std::move(judged));
    }

    const Results& m_results;
    uint64_t m_clips;
    std::string m_lacking;         ///< of the row at hand
    std::set<Results::Key> m_read; ///< for the row at hand
    Judgement m_judgement;
};

} // namespace

Judgement judge(const Results& results, uint64_t clips) {
    return Judge(results, clips).judgement();
}

std::string valueText(double value, Unit unit) {
    if (value == 0) {
        return "-";
    }
    return unit == Unit::Bytes ? threeDigits(value) + " B" : timeText(value);
}

std::string ratioText(const Judged& row) {
    if (row.ratio == 0) {
        return "-";
    }
    return row.verdict == Verdict::Missed ? aboveText(row.ratio, row.goal) : threeDigits(row.ratio);
}

} // namespace report
