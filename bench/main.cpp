// Runs the measures and the limits beside them and writes the figures as JSON. Takes the options of Google
// Benchmark (--benchmark_filter, --benchmark_repetitions, ...); --benchmark_out names the JSON file.

#include "platform/services/log.h"

#include <benchmark/benchmark.h>

#include <cstdio>
#include <set>
#include <string>
#include <thread>
#include <unistd.h>
#include <vector>

namespace {

/// Tells on standard error how far the run is; the figures go to the JSON file.
class Progress : public benchmark::BenchmarkReporter {
public:
    bool ReportContext(const Context&) override { return true; }
    void ReportRuns(const std::vector<Run>& runs) override {
        for (const Run& run : runs) {
            if (run.error_occurred) {
                std::fprintf(stderr, "%s%s: %s\n", m_line ? "\n" : "", run.benchmark_name().c_str(),
                             run.error_message.c_str());
                m_failed = true;
            }
            m_names.insert(run.run_name.str());
        }
        if (::isatty(STDERR_FILENO) != 0) {
            std::fprintf(stderr, "\r\033[KMeasured %zu: %s", m_names.size(),
                         runs.empty() ? "" : runs.front().run_name.str().c_str());
            m_line = true;
        } else if (m_names.size() / 10 > m_told) {
            m_told = m_names.size() / 10;
            std::fprintf(stderr, "Measured %zu\n", m_names.size());
        }
    }
    void Finalize() override {
        if (m_line) {
            std::fputs("\r\033[K", stderr);
        }
    }
    [[nodiscard]] bool anyFailed() const { return m_failed; }

private:
    std::set<std::string> m_names;
    size_t m_told = 0;
    bool m_line = false;
    bool m_failed = false;
};

} // namespace

int main(int argc, char** argv) {
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) {
        return 2;
    }
    // An application has threads, and in a process that never had one locks cost next to nothing.
    std::thread([] {}).join();
    // What the library logs is not what is measured, and would hide the progress.
    Qx::setLogSink([](std::string_view) {});
    Progress progress;
    benchmark::RunSpecifiedBenchmarks(&progress);
    benchmark::Shutdown();
    return progress.anyFailed() ? 1 : 0;
}
