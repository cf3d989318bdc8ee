// The physical limits that the measures stand beside: what the machine does with the same bytes, times and
// names when nothing of the library is in between.

#include "bench/fixed_sequence.h"
#include "bench/measuring.h"
#include "bench/open_items.h"
#include "bench/work_folder.h"

#define XXH_INLINE_ALL
#include <xxhash.h>

#include <algorithm>
#include <cstring>
#include <fcntl.h>
#include <map>
#include <mutex>
#include <unistd.h>

using namespace bench;

namespace {

using Bytes = std::vector<std::byte>;

/// As many bytes as the sequence's events take, none of them zero, and touched.
Bytes bytesOf(int64_t n) {
    return Bytes(FixedSequence::of(n).numBytes(), std::byte{0x5A});
}

void moveBytes(benchmark::State& state) {
    const Bytes from = bytesOf(state.range(0));
    Bytes to = from;
    for (auto _ : state) {
        std::memcpy(to.data(), from.data(), from.size());
        benchmark::ClobberMemory();
    }
}
BENCHMARK(moveBytes)->Name("limit/memcpy")->Apply(allSizes);

/// Half of a channel's events moved by one pair, there and back.
void moveHalf(benchmark::State& state, size_t channels) {
    const size_t half = static_cast<size_t>(state.range(0)) * sizeof(channel_event);
    constexpr size_t kPair = 2 * sizeof(channel_event);
    std::vector<Bytes> arrays(channels, Bytes(2 * half + kPair, std::byte{0x5A}));
    bool there = false;
    for (auto _ : state) {
        there = !there;
        for (Bytes& array : arrays) {
            std::byte* const middle = array.data() + half;
            std::memmove(middle + (there ? kPair : 0), middle + (there ? 0 : kPair), half);
        }
        benchmark::ClobberMemory();
    }
}
BENCHMARK_CAPTURE(moveHalf, one, size_t{1})->Name("limit/move_half")->Apply(allSizes);
BENCHMARK_CAPTURE(moveHalf, all, FixedSequence::kNumChannels)->Name("limit/move_half_all")->Apply(allSizes);

/// A number out of each of the records, one after the other.
void linearRead(benchmark::State& state) {
    const std::vector<channel_event> records(FixedSequence::of(state.range(0)).numEvents());
    for (auto _ : state) {
        double sum = 0;
        for (const channel_event& record : records) {
            sum += record.editTime;
        }
        benchmark::DoNotOptimize(sum);
    }
}
BENCHMARK(linearRead)->Name("limit/linear_read")->Apply(allSizes);

void hash(benchmark::State& state) {
    const Bytes bytes = bytesOf(state.range(0));
    for (auto _ : state) {
        benchmark::DoNotOptimize(XXH3_64bits(bytes.data(), bytes.size()));
    }
}
BENCHMARK(hash)->Name("limit/xxh3")->Apply(allSizes);

/// The start times of each channel, packed, and the queries of `find`.
void lowerBound(benchmark::State& state) {
    const FixedSequence& sequence = FixedSequence::of(state.range(0));
    std::vector<double> times[FixedSequence::kNumChannels];
    for (size_t channel = 0; channel < FixedSequence::kNumChannels; ++channel) {
        uint64_t at = 0;
        for (const FixedSequence::Clip& clip : sequence.clips(channel)) {
            times[channel].push_back(static_cast<double>(at) / FixedSequence::kFrameRate);
            at += clip.length;
        }
    }
    const Query* const queries = sequence.queries().data();
    const size_t mask = sequence.queries().size() - 1;
    size_t next = 0;
    for (auto _ : state) {
        const Query& query = queries[next++ & mask];
        const std::vector<double>& channel = times[query.channel];
        benchmark::DoNotOptimize(std::lower_bound(channel.begin(), channel.end(), query.time));
    }
}
BENCHMARK(lowerBound)->Name("limit/lower_bound")->Apply(allSizes);

// ---- files, as the system's calls do them

bool writeBytes(const String& path, const Bytes& bytes, bool sync) {
    const int file = ::open(path.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0644);
    if (file < 0) {
        return false;
    }
    const bool written = ::write(file, bytes.data(), bytes.size()) == static_cast<ssize_t>(bytes.size()) &&
                         (!sync || ::fsync(file) == 0);
    return ::close(file) == 0 && written;
}

bool readBytes(const String& path, Bytes& bytes) {
    const int file = ::open(path.c_str(), O_RDONLY);
    if (file < 0) {
        return false;
    }
    const bool read = ::read(file, bytes.data(), bytes.size()) == static_cast<ssize_t>(bytes.size());
    return ::close(file) == 0 && read;
}

void readCached(benchmark::State& state) {
    Bytes bytes = bytesOf(state.range(0));
    const String path = workPath("limit-read");
    bool done = writeBytes(path, bytes, true);
    settleDisk();
    for (auto _ : state) {
        done = readBytes(path, bytes) && done;
    }
    failed(state, !done, "the system refused to write or read " + path);
}
BENCHMARK(readCached)->Name("limit/read_cached")->Apply(allSizes);

void write(benchmark::State& state) {
    const Bytes bytes = bytesOf(state.range(0));
    const String path = workPath("limit-write");
    bool done = true;
    settleDisk();
    for (auto _ : state) {
        done = writeBytes(path, bytes, false) && done;
    }
    failed(state, !done, "the system refused to write " + path);
}
BENCHMARK(write)->Name("limit/write")->Apply(allSizes)->UseRealTime()->MinTime(0.2);

void writeDurably(benchmark::State& state) {
    const Bytes bytes = bytesOf(state.range(0));
    const String path = workPath("limit-durable");
    bool done = true;
    settleDisk();
    for (auto _ : state) {
        done = writeBytes(path + ".new", bytes, true) &&
               ::rename((path + ".new").c_str(), path.c_str()) == 0 && done;
    }
    failed(state, !done, "the system refused to write " + path);
}
BENCHMARK(writeDurably)->Name("limit/write_fsync_rename")->Apply(allSizes)->UseRealTime()->MinTime(0.2);

void readAndWrite(benchmark::State& state) {
    Bytes bytes = bytesOf(state.range(0));
    const String path = workPath("limit-undo");
    bool done = writeBytes(path, bytes, true);
    settleDisk();
    for (auto _ : state) {
        done = readBytes(path, bytes) && writeBytes(path + ".new", bytes, true) && done;
    }
    failed(state, !done, "the system refused to write or read " + path);
}
BENCHMARK(readAndWrite)->Name("limit/read_write_fsync")->Apply(allSizes)->UseRealTime()->MinTime(0.2);

// ---- the lookup of an open edit

void lockAndFind(benchmark::State& state) {
    static std::recursive_mutex lock;
    static const std::map<cookie, const void*> map = [] {
        std::map<cookie, const void*> made;
        for (int i = 0; i < kNumOpenEdits; ++i) {
            made.emplace(openItem(i), nullptr);
        }
        return made;
    }();
    int next = state.thread_index();
    for (auto _ : state) {
        const cookie item = openItem(next++ % kNumOpenEdits);
        const std::lock_guard<std::recursive_mutex> hold(lock);
        benchmark::DoNotOptimize(map.find(item));
    }
}
BENCHMARK(lockAndFind)->Name("limit/lock_map_find");
BENCHMARK(lockAndFind)->Name("limit/lock_map_find_8")->Threads(8)->UseRealTime();

} // namespace
