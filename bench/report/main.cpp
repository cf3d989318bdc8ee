// Reads the results of the benchmarks and prints what they mean: each measure beside the least that the
// machine could do it in, and whether the goal set for it is met.

#include "bench/report/chart.h"
#include "bench/report/table.h"

#include <charconv>
#include <cstdio>
#include <exception>
#include <fstream>

namespace {

constexpr const char* kHelp =
    R"(Usage: report RESULTS.json [--svg FILE] [--n CLIPS] [--check]

Prints how fast the edit library is against what the machine allows. RESULTS.json comes from the benchmarks:

    quillmarch_bench --benchmark_repetitions=5 --benchmark_out=RESULTS.json \
        --benchmark_out_format=json

For each measure the table tells its time, the time of its limit (the least that the machine must do for the
same bytes, measured in the same run), their ratio, and whether the goal is met. A sentence for each goal that
is not met, the measures at three sizes, and whatever else the file holds follow.

    --svg FILE   also draw the goals into FILE, as SVG
    --n CLIPS    judge at this size instead of 10000 clips, for which the goals are set
    --check      end with exit code 1 if a goal is missed or was not measured
    -h, --help   print this and exit

Exit codes: 0 the report was made, 1 a goal is missed (with --check), 2 wrong usage or no report.
)";

enum ExitCode { kMade = 0, kGoalMissed = 1, kNoReport = 2 };

struct Options {
    std::string results;
    std::string svg;
    uint64_t clips = report::kGoalClips;
    bool check = false;
    bool help = false;
};

int fail(const std::string& sentence) {
    std::fprintf(stderr, "report: %s\n", sentence.c_str());
    return kNoReport;
}

bool readClips(const std::string& text, uint64_t& clips) {
    const char* end = text.data() + text.size();
    const auto [stop, error] = std::from_chars(text.data(), end, clips);
    return error == std::errc() && stop == end && clips > 0;
}

/// The command line's options. False with a sentence in `why` for a wrong one.
bool readOptions(const std::vector<std::string>& arguments, Options& options, std::string& why) {
    for (size_t i = 0; i < arguments.size(); ++i) {
        const std::string& argument = arguments[i];
        if (argument == "-h" || argument == "--help") {
            options.help = true;
        } else if (argument == "--check") {
            options.check = true;
        } else if (argument == "--svg" || argument == "--n") {
            if (++i == arguments.size() || arguments[i].empty()) {
                why = argument + " lacks its value";
                return false;
            }
            if (argument == "--svg") {
                options.svg = arguments[i];
            } else if (!readClips(arguments[i], options.clips)) {
                why = "--n takes a number of clips, 1 or more, not '" + arguments[i] + "'";
                return false;
            }
        } else if (argument.empty() || argument[0] == '-' || !options.results.empty()) {
            why = "'" + argument + "' is not understood";
            return false;
        } else {
            options.results = argument;
        }
    }
    why = options.results.empty() ? "name the file of results" : "";
    return options.help || why.empty();
}

int run(const Options& options) {
    report::Results results;
    std::string why;
    if (!report::readResultsFile(options.results, results, why)) {
        return fail(why);
    }
    const report::Judgement judgement = report::judge(results, options.clips);
    const std::string text = report::reportText(results, judgement, options.clips);
    if (std::fwrite(text.data(), 1, text.size(), stdout) != text.size() || std::fflush(stdout) != 0) {
        return fail("cannot write standard output");
    }
    if (!options.svg.empty()) {
        std::ofstream out(options.svg, std::ios::binary | std::ios::trunc);
        out << report::chartSvg(judgement, options.clips);
        out.close();
        if (!out) {
            return fail("cannot write the drawing to " + options.svg +
                        "; name a file in a folder that can be written");
        }
    }
    return options.check && judgement.met < judgement.goals ? kGoalMissed : kMade;
}

} // namespace

int main(int count, char** arguments) {
    try {
        Options options;
        std::string why;
        if (!readOptions({arguments + 1, arguments + count}, options, why)) {
            return fail(why + "; see report --help");
        }
        if (options.help) {
            std::fputs(kHelp, stdout);
            return kMade;
        }
        return run(options);
    } catch (const std::exception& error) {
        return fail(std::string("unexpected failure: ") + error.what());
    }
}
