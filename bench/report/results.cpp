#include "bench/report/results.h"

#include "bench/report/text.h"

#include <nlohmann/json.hpp>

#include <algorithm>
#include <array>
#include <cerrno>
#include <charconv>
#include <cmath>
#include <cstring>
#include <fstream>
#include <optional>
#include <set>

namespace report {

namespace {

using Json = nlohmann::json;

constexpr size_t kMostBytes = size_t{64} << 20;

/// What can be measured, divided by and shown in a column. As nanoseconds: a hundredth of one to a day.
constexpr double kLeast = 0.01;
constexpr double kGreatest = 1e14;

bool isUsable(double value) {
    return value >= kLeast && value <= kGreatest;
}

constexpr const char* kRemedy =
    "; run the benchmarks with --benchmark_out=FILE --benchmark_out_format=json and give that file";

/// Google Benchmark writes NaN and Infinity, which JSON does not know, for example as the variation of a
/// counter that is always 0. They become null: no number.
std::string withoutNonFinite(std::string_view text) {
    std::string out;
    out.reserve(text.size());
    bool quoted = false;
    while (!text.empty()) {
        size_t length = 1;
        if (quoted) {
            length = text[0] == '\\' ? std::min<size_t>(2, text.size()) : 1;
            quoted = text[0] != '"';
        } else {
            quoted = text[0] == '"';
            for (const std::string_view word : {"NaN", "-NaN", "Infinity", "-Infinity"}) {
                if (text.starts_with(word)) {
                    out += "null";
                    text.remove_prefix(word.size());
                    length = 0;
                    break;
                }
            }
        }
        out += text.substr(0, length);
        text.remove_prefix(length);
    }
    return out;
}

std::string textOf(const Json& object, const char* member) {
    const auto found = object.find(member);
    return found != object.end() && found->is_string() ? found->get<std::string>() : std::string();
}

double numberOf(const Json& object, const char* member) {
    const auto found = object.find(member);
    return found != object.end() && found->is_number() ? found->get<double>() : 0;
}

/// The real time of an entry in nanoseconds; 0 if it has no usable one.
double timeOf(const Json& entry) {
    const std::map<std::string, double> units = {{"ns", 1}, {"us", 1e3}, {"ms", 1e6}, {"s", 1e9}};
    const auto unit = units.find(textOf(entry, "time_unit"));
    const double time = unit == units.end() ? 0 : numberOf(entry, "real_time") * unit->second;
    return isUsable(time) ? time : 0;
}

double medianOf(std::vector<double> values) {
    std::sort(values.begin(), values.end());
    const size_t half = values.size() / 2;
    return values.size() % 2 == 1 ? values[half] : (values[half - 1] + values[half]) / 2;
}

/// What the entries of one benchmark hold.
struct Samples {
    std::vector<double> times;
    std::map<std::string, std::vector<double>> counters;
    bool seen = false;

    void add(const Json& entry) {
        static const std::set<std::string> known = {
            "real_time",   "cpu_time",         "iterations",   "threads",
            "repetitions", "repetition_index", "family_index", "per_family_instance_index"};
        seen = true;
        if (const double time = timeOf(entry); time > 0) {
            times.push_back(time);
        }
        for (const auto& [name, value] : entry.items()) {
            if (value.is_number() && std::isfinite(value.get<double>()) && known.count(name) == 0) {
                counters[name].push_back(value.get<double>());
            }
        }
    }

    [[nodiscard]] Result result() const {
        Result result;
        result.nanoseconds = times.empty() ? 0 : medianOf(times);
        for (const auto& [name, values] : counters) {
            result.counters[name] = medianOf(values);
        }
        return result;
    }
};

struct Repetitions {
    Samples medians;
    Samples iterations;
};

/// Puts an entry where it belongs. A reason if it belongs nowhere.
std::optional<std::string> addEntry(const Json& entry, std::map<Results::Key, Repetitions>& benchmarks) {
    if (!entry.is_object()) {
        return "An entry is no object: it tells nothing of a benchmark.";
    }
    const std::string run = textOf(entry, "run_name");
    const std::string name = run.empty() ? textOf(entry, "name") : run;
    if (name.empty()) {
        return "An entry has no name.";
    }
    if (const auto failed = entry.find("error_occurred"); failed != entry.end() && *failed == true) {
        return plain(name) + " failed: " + plain(textOf(entry, "error_message"));
    }
    // Before there were aggregates there was no run type.
    const std::string type = entry.contains("run_type") ? textOf(entry, "run_type") : "iteration";
    if (type == "iteration") {
        benchmarks[keyOf(name)].iterations.add(entry);
    } else if (type != "aggregate") {
        return plain(name) + " is neither an iteration nor an aggregate.";
    } else if (textOf(entry, "aggregate_name") == "median") {
        benchmarks[keyOf(name)].medians.add(entry);
    }
    return {};
}

std::string machineOf(const Json& context) {
    std::string text;
    if (const std::string date = textOf(context, "date"); !date.empty()) {
        text = "Measured " + plain(date, 40);
        const double cores = numberOf(context, "num_cpus");
        const double megahertz = numberOf(context, "mhz_per_cpu");
        if (cores >= 1 && cores < 1e6 && megahertz >= 1 && megahertz < 1e6) {
            text += " on " + std::to_string(std::lround(cores)) + " processors of " +
                    std::to_string(std::lround(megahertz)) + " MHz";
        }
        text += ".";
    }
    return text;
}

/// What Google Benchmark appends to a name, by how it begins; all else is the name's own.
bool saysHowItRan(std::string_view part) {
    static constexpr std::array<std::string_view, 5> valued = {
        "min_time:", "min_warmup_time:", "iterations:", "repeats:", "threads:"};
    return part == "process_time" || part == "real_time" || part == "manual_time" ||
           std::any_of(valued.begin(), valued.end(),
                       [part](std::string_view begin) { return part.starts_with(begin); });
}

/// The whole number that `text` is; 0 if it is none.
uint64_t wholeNumber(std::string_view text) {
    uint64_t number = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
    return error == std::errc() && end == text.data() + text.size() ? number : 0;
}

} // namespace

std::string nameOf(const Results::Key& key) {
    return key.second == 0 ? key.first : key.first + "/" + std::to_string(key.second);
}

Results::Key keyOf(std::string_view name) {
    uint64_t threads = 1;
    size_t slash = name.rfind('/');
    for (; slash != std::string_view::npos && saysHowItRan(name.substr(slash + 1)); slash = name.rfind('/')) {
        if (const std::string_view part = name.substr(slash + 1); part.starts_with("threads:")) {
            threads = wholeNumber(part.substr(part.find(':') + 1));
        }
        name = name.substr(0, slash);
    }
    const uint64_t clips = slash == std::string_view::npos ? 0 : wholeNumber(name.substr(slash + 1));
    if (clips > 0) {
        name = name.substr(0, slash);
    }
    const std::string suffix = threads > 1 ? "_" + std::to_string(threads) : "";
    return {std::string(name) + (name.ends_with(suffix) ? "" : suffix), clips};
}

double Result::counter(std::string_view name) const {
    const auto found = counters.find(std::string(name));
    return found != counters.end() && isUsable(found->second) ? found->second : 0;
}

std::map<Results::Key, Result>::const_iterator Results::find(std::string_view measure, uint64_t clips) const {
    const auto exact = all.find({std::string(measure), clips});
    return exact != all.end() ? exact : all.find({std::string(measure), 0});
}

bool readResults(std::string_view json, Results& results, std::string& why) {
    Json root;
    try {
        root = Json::parse(withoutNonFinite(json));
    } catch (const Json::exception& error) {
        const std::string_view reason = error.what(); // "[json.exception...] parse error at line 1, ..."
        why = "is not JSON (" + plain(reason.substr(reason.find(' ') + 1), 160) + ")";
        return false;
    }
    const auto context = root.is_object() ? root.find("context") : root.end();
    const auto entries = root.is_object() ? root.find("benchmarks") : root.end();
    if (context == root.end() || entries == root.end() || !context->is_object() || !entries->is_array()) {
        why = "is JSON but no result of Google Benchmark: it lacks \"context\" or \"benchmarks\"";
        return false;
    }
    Results read;
    std::map<Results::Key, Repetitions> benchmarks;
    for (const Json& entry : *entries) {
        if (const auto fault = addEntry(entry, benchmarks)) {
            read.faults.push_back(*fault);
        }
    }
    for (const auto& [key, samples] : benchmarks) {
        read.all[key] = (samples.medians.seen ? samples.medians : samples.iterations).result();
    }
    if (read.all.empty()) {
        why = "holds no measurement" + (read.faults.empty() ? "" : ": " + read.faults.front());
        return false;
    }
    read.machine = machineOf(*context);
    results = std::move(read);
    return true;
}

bool readResultsFile(const std::string& path, Results& results, std::string& why) {
    errno = 0;
    std::ifstream in(path, std::ios::binary);
    std::string text;
    std::array<char, 65536> buffer{};
    while (in.read(buffer.data(), buffer.size()), in.gcount() > 0 && text.size() <= kMostBytes) {
        text.append(buffer.data(), static_cast<size_t>(in.gcount()));
    }
    std::string fault;
    if (!in.eof() && text.size() <= kMostBytes) {
        fault = std::string("cannot be read: ") + std::strerror(errno != 0 ? errno : EIO);
    } else if (text.size() > kMostBytes) {
        fault = "is larger than 64 MiB, too large for results of benchmarks";
    } else if (readResults(text, results, fault)) {
        return true;
    }
    why = path + " " + fault + kRemedy;
    return false;
}

} // namespace report
