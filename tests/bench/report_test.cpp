#include "bench/report/chart.h"
#include "bench/report/table.h"
#include "bench/report/text.h"
#include "support/run_program.h"
#include "support/temporary_folder.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <regex>

using namespace report;

namespace {

/// A file of entries, each a name, a time in its unit and more members: "find@ 30us; ~find/100 7ns, "c": 4".
/// "~" makes it a median, "@" stands for "/10000".
std::string fileOf(const std::string& shorthand) {
    const std::pair<const char*, const char*> steps[] = {
        {"~([^;]*)", R"($1, "run_type": "aggregate", "aggregate_name": "median")"},
        {"@ ", "/10000 "},
        {" *([^ ;]+) ([^;,]*?)([hmnsu]+)(,[^;]*)?(;|$)",
         R"({"run_name": "$1", "real_time": $2, "time_unit": "$3"$4},)"}};
    std::string entries = shorthand;
    for (const auto& [form, replacement] : steps) {
        entries = std::regex_replace(entries, std::regex(form), replacement);
    }
    // The last is of a kind that is passed over.
    return R"({"context": {}, "benchmarks": [)" + entries + R"({"run_name": "a", "run_type": "aggregate"}]})";
}

void expectParts(const std::string& text, const std::vector<std::string>& parts) {
    for (const std::string& part : parts) {
        EXPECT_NE(text.find(part), std::string::npos) << part << "\nis not in:\n" << text;
    }
}

Results resultsOf(const std::string& shorthand) {
    Results results;
    std::string why;
    EXPECT_TRUE(readResults(fileOf(shorthand), results, why)) << why;
    return results;
}

/// What remains of an XML text without its escaped characters and its elements, from the innermost outwards.
std::string remainderOf(std::string xml) {
    static const std::regex sound(R"(&(amp|lt|gt|quot);|<\?[^<>]*\?>\n|<[^<>]*/>|<(\w+)[^<>]*>[^<>&]*</\2>)");
    for (std::string before; before != xml;) {
        before = xml;
        xml = std::regex_replace(before, sound, "");
    }
    return xml;
}

} // namespace

TEST(Report, ReadsNamesTimesAndCounters) {
    const struct {
        const char* entries;
        Results::Key key;
        double nanoseconds;
    } cases[] = {
        {"find/100 30ns", {"find", 100}, 30},
        {"a 9ns; a 1ns; a 2ns", {"a", 0}, 2},
        {"a/1 1ns; a/1 4ns", {"a", 1}, 2.5},
        {"a/1 1ns; ~a/1 7ns; a/1 2ns", {"a", 1}, 7},
        {"limit/x/10/iterations:5/real_time 1ns", {"limit/x", 10}, 1},
        {"a/10/manual_time/threads:1 1ns", {"a", 10}, 1},
        {"a/10/threads:8 1ns", {"a_8", 10}, 1},
        {"a_8/real_time/threads:8 1ns", {"a_8", 0}, 1},
        {"a/10x 1ns", {"a/10x", 0}, 1},
        {"a 2.5us", {"a", 0}, 2.5e3},
        {"a 2.5ms", {"a", 0}, 2.5e6},
        {"a 2.5s", {"a", 0}, 2.5e9},
        {"a 2.5h", {"a", 0}, 0},
        {"a 0ns; a -1ns; a \"1\"ns; a 1e300ns; a -NaNns", {"a", 0}, 0},
        {R"(a 3ns, "b": Infinity, "c": "\"NaN")", {"a", 0}, 3},
    };
    for (const auto& c : cases) {
        const Results results = resultsOf(c.entries);
        ASSERT_EQ(results.all.size(), 1u) << c.entries;
        EXPECT_EQ(results.all.begin()->first, c.key) << c.entries;
        EXPECT_EQ(results.all.begin()->second.nanoseconds, c.nanoseconds) << c.entries;
    }
    const Results counted = resultsOf(R"(a 1ns, "c": 9; ~a 1ns, "c": 4)");
    EXPECT_EQ(counted.all.begin()->second.counter("c"), 4);
}

TEST(Report, RefusesWhatIsNoResult) {
    const std::pair<std::string, const char*> cases[] = {
        {"", "not JSON"},
        {std::string(200000, '['), "not JSON"},
        {"[1, 2]", "no result of Google Benchmark"},
        {R"({"context": [], "benchmarks": []})", "no result of Google Benchmark"},
        {fileOf(""), "no measurement"},
        {R"({"context": {}, "benchmarks": [7, {}]})", "no object"},
        {R"({"context": {}, "benchmarks": [{"run_name": 5, "name": ["a"]}]})", "no name"},
        {fileOf(R"(a 1ns, "run_type": 5)"), "neither an iteration"},
        {fileOf(R"(a 1ns, "error_occurred": true, "error_message": "no disk\u001b")"), "a failed: no disk?"},
    };
    for (const auto& [text, part] : cases) {
        Results results;
        std::string why;
        EXPECT_FALSE(readResults(text, results, why)) << part;
        expectParts(why, {part});
    }
}

TEST(Report, JudgesAtTheBoundary) {
    using enum Verdict;
    const struct {
        std::string entries;
        std::string what; ///< the beginning of its name
        Verdict verdict;
        const char* reason; ///< a part of it
    } cases[] = {
        {"load@ 4ms; limit/read_cached@ 0.75ms; limit/xxh3@ 250us", "open an", Met, ""},
        {"load@ 4.0001s; limit/read_cached@ 0.5s; limit/xxh3@ 0.5s", "open an", Missed,
         "4.0001 times its limit"},
        {"load@ 1ns; limit/xxh3@ 9ns", "open an", NotMeasured, "lack limit/read_cached/10000."},
        {"walk@ 1s; limit/linear_read@ 0s", "walk", NotMeasured, "usable time of limit/linear_read"},
        {"cached_open 2s; limit/lock_map_find 1s", "open by cookie, already", Met, ""},
        {"redo@ 9s; limit/read_write_fsync@ 1s", "redo", NoGoal, ""},
        {R"(~memory@ 0s, "bytes_per_event": 72)", "memory", Met, ""},
        {R"(~memory@ 0s, "bytes_per_event": 72.5)", "memory", Missed, "takes 72.5 bytes; the goal is 72"},
        {R"(~memory@ 0s, "bytes_per_event": "")", "memory", NotMeasured, "bytes_per_event"},
        {"find@ 39.9ns; find/100 10ns", "find, 100", Met, ""},
        {"find@ 40ns; find/100 10ns", "find, 100", Missed, "takes 4 times as long; the goal is under 4."},
        {"find 40ns", "find, 100", NotMeasured, "lack find/10000 and find/100."},
        {"load@ 125ns; load/1000 10ns", "open, 1 000", Met, ""},
    };
    for (const auto& c : cases) {
        const Judgement judgement = judge(resultsOf(c.entries));
        const auto row = std::find_if(judgement.rows.begin(), judgement.rows.end(),
                                      [&c](const Judged& one) { return one.what.starts_with(c.what); });
        ASSERT_NE(row, judgement.rows.end()) << c.what;
        EXPECT_EQ(row->verdict, c.verdict) << c.entries;
        expectParts(row->reason, {c.reason});
        EXPECT_EQ(judgement.met, c.verdict == Verdict::Met ? 1u : 0u) << c.entries;
    }
}

TEST(Report, LosesNothingAndKeepsItsWidth) {
    std::string entries =
        "never/heard/of 1.2us; load/7 999.6ns; <&\\u001b>/3 1s; " + std::string(999, 'n') + " 1ns";
    for (const SpeedRow& row : kSpeedRows) {
        for (const uint64_t size : kSizes) {
            entries += ";" + nameOf({std::string(row.measure), size}) + " 99999s";
            entries += ";limit/" + nameOf({std::string(row.limits[0]), size}) + " 0.012345ns";
        }
    }
    const Results results = resultsOf(entries);
    const String text = reportText(results, judge(results), kGoalClips);
    expectParts(text, {"  never/heard/of  ", "1.20 µs\n", "  load/7  ", "1.00 µs\n", "  <&?>/3  ",
                       "nnn...  1.00 ns\n"});
    expectParts(text,
                {" of 15 goals met.\n", "\n  build an edit, clip after clip  ", "lack limit/xxh3/10000."});
    for (const String& line : text.split('\n')) {
        EXPECT_LE(columns(line), 110u) << line;
    }
}

TEST(Report, DrawsSoundXml) {
    Judgement judgement =
        judge(resultsOf("find@ 99999s; find/100 0.01ns; walk@ 0.01ns; limit/linear_read@ 9999s"));
    judgement.rows.front().what = "<script> & \"it\"";
    const std::string svg = chartSvg(judgement, kGoalClips);
    EXPECT_EQ(remainderOf(svg), "\n");
    expectParts(svg, {"&lt;script&gt; &amp; &quot;it&quot;", "n = 10 000</text>"});
    expectParts(svg, {", met (", ", MISSED (", "not measured ("});
    EXPECT_EQ(svg.find("\"-"), std::string::npos) << "a length below zero";
}

TEST(Report, ProgramAnswersWithItsExitCode) {
    const test::TemporaryFolder folder;
    const String good = folder.write("good.json", fileOf("load@ 1ns"));
    const struct {
        std::vector<std::string> arguments;
        int code;
        const char* words;
    } cases[] = {
        {{good}, 0, "0 of 15 goals met."},
        {{good, "--check"}, 1, "0 of 15 goals met."},
        {{good, "--n", "100", "--svg", folder.path("chart.svg")}, 0, "n = 100\n"},
        {{"--help"}, 0, "Usage: report"},
        {{good, "--n", "0"}, 2, "--n takes"},
        {{good, "--svg", folder.path("no/chart.svg")}, 2, "cannot write the drawing"},
        {{folder.path("none.json")}, 2, "none.json cannot be read: No such file"},
        {{folder.path("")}, 2, "cannot be read: Is a directory"},
        {{folder.write("bad.json", "{")}, 2, "bad.json is not JSON"},
    };
    for (const auto& c : cases) {
        const test::ProgramResult result = test::runProgram(REPORT_PROGRAM, c.arguments, {});
        EXPECT_EQ(result.code, c.code) << c.words;
        expectParts(c.code == 2 ? result.err : result.out, {c.words});
    }
    EXPECT_EQ(folder.read("chart.svg").substr(0, 5), "<?xml");
}
