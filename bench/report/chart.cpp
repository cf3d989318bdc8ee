#include "bench/report/chart.h"

#include "bench/report/text.h"

#include <algorithm>
#include <array>
#include <cmath>

namespace report {

namespace {

// Pixels.
constexpr double kLabelsEnd = 270;
constexpr double kBarsBegin = 285;
constexpr double kBarsEnd = 760;
constexpr double kWidth = 960;
constexpr double kTop = 96;
constexpr double kRowHeight = 30;
constexpr double kBarHeight = 16;

constexpr const char* kGreen = "#2e7d32";
constexpr const char* kRed = "#c62828";
constexpr const char* kGrey = "#616161";
constexpr const char* kInk = "#1a1a1a";

/// Ratios beyond are drawn at the edge; the text beside the bar tells the number.
constexpr double kLeastDrawn = 0.01;
constexpr double kGreatestDrawn = 1e5;

/// The ratios that may be marked on the axis: each third is a power of ten.
constexpr std::array<double, 22> kMarks = {0.01, 0.02, 0.05,  0.1,   0.2,   0.5,   1,   2,
                                           5,    10,   20,    50,    100,   200,   500, 1000,
                                           2000, 5000, 10000, 20000, 50000, 100000};

/// A coordinate or a length, in tenths of a pixel.
std::string pixels(double value) {
    const long tenths = std::lround(value * 10);
    return std::to_string(tenths / 10) + "." + std::to_string(tenths % 10);
}

std::string text(double x, double y, const std::string& words, const std::string& attributes) {
    return "<text x=\"" + pixels(x) + "\" y=\"" + pixels(y) + "\" " + attributes + ">" + xmlText(words) +
           "</text>\n";
}

std::string line(double x, double from, double to, const std::string& attributes) {
    return "<line x1=\"" + pixels(x) + "\" y1=\"" + pixels(from) + "\" x2=\"" + pixels(x) + "\" y2=\"" +
           pixels(to) + "\" " + attributes + "/>\n";
}

std::string fill(const char* colour) {
    return std::string("fill=\"") + colour + "\"";
}

/// The logarithmic axis: all ratios and goals, and the limit itself at 1.
class Axis {
public:
    explicit Axis(const std::vector<Judged>& rows) {
        for (const Judged& row : rows) {
            for (const double ratio : {row.ratio, row.goal}) {
                if (ratio > 0) {
                    const double drawn = std::clamp(ratio, kLeastDrawn, kGreatestDrawn);
                    m_from = std::min(m_from, drawn);
                    m_to = std::max(m_to, drawn);
                }
            }
        }
        m_from /= 1.1;
        m_to *= 1.1;
    }

    [[nodiscard]] double at(double ratio) const {
        const double part = std::log(std::clamp(ratio, m_from, m_to) / m_from) / std::log(m_to / m_from);
        return kBarsBegin + part * (kBarsEnd - kBarsBegin);
    }

    /// The ratios that are marked: 1, 2, 5, 10 and so on, only the powers of ten on a long axis.
    [[nodiscard]] std::vector<double> marks() const {
        std::vector<double> marks;
        for (size_t i = 0; i < kMarks.size(); ++i) {
            const bool fits = kMarks[i] >= m_from && kMarks[i] <= m_to;
            if (fits && (i % 3 == 0 || m_to / m_from < 1000)) {
                marks.push_back(kMarks[i]);
            }
        }
        return marks;
    }

private:
    double m_from = 0.5;
    double m_to = 15;
};

std::string axisSvg(const Axis& axis, double bottom) {
    std::string out;
    for (const double mark : axis.marks()) {
        const bool limit = mark == 1;
        out +=
            line(axis.at(mark), kTop - 8, bottom,
                 limit ? "stroke=\"#1a1a1a\" stroke-width=\"1.5\"" : "stroke=\"#d9d9d9\" stroke-width=\"1\"");
        out += text(axis.at(mark), bottom + 18, numberText(mark),
                    "text-anchor=\"middle\" font-size=\"12\" " + fill(kInk));
    }
    return out +
           text(axis.at(1), kTop - 14, "the limit", "text-anchor=\"middle\" font-size=\"12\" " + fill(kInk));
}

std::string rowSvg(const Judged& row, const Axis& axis, double top) {
    const double baseline = top + kRowHeight / 2 + 5;
    std::string out = text(kLabelsEnd, baseline, row.what, "text-anchor=\"end\" " + fill(kInk));
    const bool met = row.verdict == Verdict::Met;
    const char* colour = met ? kGreen : row.verdict == Verdict::Missed ? kRed : kGrey;
    if (row.ratio > 0) {
        out += "<rect x=\"" + pixels(kBarsBegin) + "\" y=\"" + pixels(top + (kRowHeight - kBarHeight) / 2) +
               "\" width=\"" + pixels(std::max(axis.at(row.ratio) - kBarsBegin, 1.0)) + "\" height=\"" +
               pixels(kBarHeight) + "\" " + fill(colour) + "/>\n";
    }
    out += line(axis.at(row.goal), top + 3, top + kRowHeight - 3, "stroke=\"#1a1a1a\" stroke-width=\"3\"");
    const std::string measured = row.unit == Unit::Bytes ? valueText(row.value, row.unit) : ratioText(row);
    const std::string outcome = row.ratio == 0 ? "not measured" : measured + (met ? ", met" : ", MISSED");
    return out + text(kBarsEnd + 12, baseline, outcome + " (" + row.goalText + ")", fill(colour));
}

} // namespace

std::string chartSvg(const Judgement& judgement, uint64_t clips) {
    std::vector<Judged> rows;
    std::copy_if(judgement.rows.begin(), judgement.rows.end(), std::back_inserter(rows),
                 [](const Judged& row) { return row.verdict != Verdict::NoGoal; });
    const Axis axis(rows);
    const double bottom = kTop + kRowHeight * static_cast<double>(rows.size());
    const std::string height = pixels(bottom + 54);
    const std::string title = "Speed against the physical limit, n = " + countText(clips);

    std::string out = "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n";
    out += "<svg xmlns=\"http://www.w3.org/2000/svg\" width=\"" + pixels(kWidth) + "\" height=\"" + height +
           "\" viewBox=\"0 0 " + pixels(kWidth) + " " + height +
           "\" role=\"img\" font-family=\"sans-serif\" font-size=\"14\">\n";
    out += "<title>" + xmlText(title) + "</title>\n";
    out += "<rect width=\"100%\" height=\"100%\" fill=\"#ffffff\"/>\n";
    out += text(20, 34, title, "font-size=\"20\" font-weight=\"bold\" " + fill(kInk));
    out += text(20, 58,
                std::to_string(judgement.met) + " of " + std::to_string(judgement.goals) +
                    " goals met. Bars: how many times the limit. Thick ticks: the goals.",
                "font-size=\"13\" " + fill(kGrey));
    out += axisSvg(axis, bottom);
    for (size_t i = 0; i < rows.size(); ++i) {
        out += rowSvg(rows[i], axis, kTop + kRowHeight * static_cast<double>(i));
    }
    return out +
           text((kBarsBegin + kBarsEnd) / 2, bottom + 40, "times the limit (logarithmic)",
                "text-anchor=\"middle\" font-size=\"12\" " + fill(kGrey)) +
           "</svg>\n";
}

} // namespace report
