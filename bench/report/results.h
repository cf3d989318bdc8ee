#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace report {

/// What one benchmark measured: the median over its repetitions.
struct Result {
    double nanoseconds = 0; ///< real time of one iteration; 0 if the file has no usable one
    std::map<std::string, double> counters;

    /// A counter's value; 0 if the file has no usable one.
    [[nodiscard]] double counter(std::string_view name) const;
};

/// The results of one run of the benchmarks, read from the JSON that Google Benchmark writes.
struct Results {
    /// A benchmark's name without its size, and the size: its clips. 0 clips for a name without a size.
    using Key = std::pair<std::string, uint64_t>;

    std::map<Key, Result> all;
    std::vector<std::string> faults; ///< a sentence for each entry of the file that gave no result
    std::string machine;             ///< when and on what it ran, as far as the file tells; may be empty

    /// The result of a benchmark at a size, else its result without a size, else `all.end()`.
    [[nodiscard]] std::map<Key, Result>::const_iterator find(std::string_view measure, uint64_t clips) const;
};

/// "find/10000", or "find" for a key without a size.
[[nodiscard]] std::string nameOf(const Results::Key& key);

/// A benchmark's name in the file taken apart. What Google Benchmark appends to say how it was run is dropped
/// ("/real_time", "/iterations:5" and their like), but for a number of threads other than one, which becomes
/// part of the name: "cached_open/10000/threads:8" is "cached_open_8" at 10000.
[[nodiscard]] Results::Key keyOf(std::string_view name);

/// Reads results from JSON. Where there are aggregates the median is taken, else the median of the iterations
/// is worked out. False, leaving `results` and with one sentence in `why`, for a text that is not JSON, not a
/// result of Google Benchmark or without any measurement.
[[nodiscard]] bool readResults(std::string_view json, Results& results, std::string& why);

/// `readResults` of a file of at most 64 MiB. A sentence in `why` names the file and what to do.
[[nodiscard]] bool readResultsFile(const std::string& path, Results& results, std::string& why);

} // namespace report
