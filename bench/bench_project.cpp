// Measures of what is felt in a project of 10 000 edits, and the limits beside them: the same files as the
// system's calls see them.

#include "bench/measuring.h"
#include "bench/projects.h"
#include "bench/work_folder.h"
#include "edit/manager/edit_manager.h"
#include "platform/services/current_project.h"

#define XXH_INLINE_ALL
#include <xxhash.h>

#include <cstdlib>
#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

using namespace bench;

namespace {

constexpr size_t kNumOpened = 1000;
constexpr size_t kNumFlushed = 100;

String fileOf(const cookie& item) {
    return folderOf(Project::Many) + "/" + item.asString() + ".qme";
}

/// Runs the command line on the project.
void command(benchmark::State& state, const String& words) {
    enterProject(Project::Many);
    edit_manager::update_projdb();
    edit_manager::close_all_edits();
    const String line = String(BENCH_QMEDIT) + " " + words + " --project " + folderOf(Project::Many) + " > " +
                        workPath("words") + " 2>&1";
    for (auto _ : state) {
        int status = 0;
        state.SetIterationTime(secondsOf([&] { status = std::system(line.c_str()); }));
        if (failed(state, status != 0, "this failed: " + line)) {
            break;
        }
    }
}

void listProject(benchmark::State& state) {
    command(state, "list");
}
BENCHMARK(listProject)->Name("list_project")->UseManualTime();

void showOne(benchmark::State& state) {
    command(state, "show " + manyItems().front().asString());
}
BENCHMARK(showOne)->Name("show_one")->UseManualTime();

/// The first opening of an edit after a start.
void openFirst(benchmark::State& state) {
    const std::vector<cookie>& items = manyItems();
    for (auto _ : state) {
        edit_manager::theEditManager(nullptr);
        bool opened = false;
        state.SetIterationTime(secondsOf([&] {
            edit_manager::theEditManager(new edit_manager);
            opened = EditPtr(items.back(), eOpenExisting).valid();
        }));
        if (failed(state, !opened, "the edit did not open")) {
            break;
        }
    }
}
BENCHMARK(openFirst)->Name("open_first")->UseManualTime();

/// Edits that are opened for the first time, as a sequence of many shots opens them.
void openMany(benchmark::State& state) {
    const std::vector<cookie>& items = manyItems();
    for (auto _ : state) {
        edit_manager::close_all_edits();
        size_t opened = 0;
        state.SetIterationTime(secondsOf([&] {
            for (size_t i = 0; i < kNumOpened; ++i) {
                opened += EditPtr(items[i], eOpenExisting).valid() ? 1U : 0U;
            }
        }));
        if (failed(state, opened != kNumOpened, "an edit did not open")) {
            break;
        }
    }
}
BENCHMARK(openMany)->Name("open_many")->UseManualTime();

void flushMany(benchmark::State& state) {
    const std::vector<cookie>& items = manyItems();
    settleDisk();
    for (auto _ : state) {
        for (size_t i = 0; i < kNumFlushed; ++i) {
            const EditPtr edit(items[i], eOpenExisting);
            edit->setName(edit->getName() == "one" ? "another" : "one");
        }
        bool flushed = false;
        state.SetIterationTime(secondsOf([&] { flushed = edit_manager::flush_changes(); }));
        if (failed(state, !flushed, "an edit was not written")) {
            break;
        }
    }
}
BENCHMARK(flushMany)->Name("flush_many")->UseManualTime();

/// Making sure that the project's records say what its files say, when they do.
void updateRecords(benchmark::State& state) {
    enterProject(Project::Many);
    edit_manager::update_projdb();
    for (auto _ : state) {
        bool updated = false;
        state.SetIterationTime(secondsOf([&] { updated = edit_manager::update_projdb(); }));
        if (failed(state, !updated, "the records were not brought up to date")) {
            break;
        }
    }
}
BENCHMARK(updateRecords)->Name("update_records")->UseManualTime();

void enter(benchmark::State& state) {
    enterProject(Project::Many);
    for (auto _ : state) {
        enterProject(Project::Few);
        state.SetIterationTime(secondsOf([&] { enterProject(Project::Many); }));
    }
}
BENCHMARK(enter)->Name("enter_project")->UseManualTime();

// ---- limits

void listAndExamine(benchmark::State& state) {
    enterProject(Project::Many);
    const String folder = folderOf(Project::Many);
    for (auto _ : state) {
        DIR* const listing = ::opendir(folder.c_str());
        if (failed(state, listing == nullptr, "the folder could not be listed: " + folder)) {
            break;
        }
        uint64_t bytes = 0;
        while (const dirent* const entry = ::readdir(listing)) {
            struct stat status {};
            if (::fstatat(::dirfd(listing), entry->d_name, &status, AT_SYMLINK_NOFOLLOW) == 0) {
                bytes += static_cast<uint64_t>(status.st_size);
            }
        }
        ::closedir(listing);
        benchmark::DoNotOptimize(bytes);
    }
}
BENCHMARK(listAndExamine)->Name("limit/list_and_stat");

/// Reads and checksums as many small files.
void readSmall(benchmark::State& state, size_t count) {
    const std::vector<cookie>& items = manyItems();
    std::vector<std::byte> bytes(size_t{1} << 16);
    bool done = true;
    for (auto _ : state) {
        for (size_t i = 0; i < count; ++i) {
            const int file = ::open(fileOf(items[i]).c_str(), O_RDONLY);
            const ssize_t size = ::read(file, bytes.data(), bytes.size());
            done = ::close(file) == 0 && size > 0 && done;
            benchmark::DoNotOptimize(XXH3_64bits(bytes.data(), size > 0 ? static_cast<size_t>(size) : 0));
        }
    }
    failed(state, !done, "an edit file could not be read");
}
BENCHMARK_CAPTURE(readSmall, one, size_t{1})->Name("limit/read_small");
BENCHMARK_CAPTURE(readSmall, many, kNumOpened)->Name("limit/read_small_many");

/// Writes as many small files for good, one by one.
void writeSmall(benchmark::State& state) {
    const std::vector<char> bytes(2048, 'q');
    bool done = true;
    settleDisk();
    for (auto _ : state) {
        for (size_t i = 0; i < kNumFlushed; ++i) {
            const String path = workPath("small" + std::to_string(i));
            const int file = ::open((path + ".new").c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0644);
            done = ::write(file, bytes.data(), bytes.size()) == static_cast<ssize_t>(bytes.size()) &&
                   ::fsync(file) == 0 && done;
            done = ::close(file) == 0 && ::rename((path + ".new").c_str(), path.c_str()) == 0 && done;
        }
    }
    failed(state, !done, "a file could not be written");
}
BENCHMARK(writeSmall)->Name("limit/write_small_many")->UseRealTime();

} // namespace
