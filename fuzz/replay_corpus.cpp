// Replays a corpus without libFuzzer: every file of the folders and files named on the command line is handed
// to the entry point once, and so is every truncation of the small ones.

#include <cstdint>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);

namespace {

int replay(const std::filesystem::path& path) {
    std::ifstream in(path, std::ios::binary);
    const std::vector<char> text{std::istreambuf_iterator<char>(in), {}};
    const std::vector<uint8_t> bytes(text.begin(), text.end());
    const size_t first = bytes.size() <= 2048 ? 0 : bytes.size();
    for (size_t size = first; size <= bytes.size(); ++size) {
        // A copy of the exact size, so that a sanitizer sees a read past the end.
        const std::vector<uint8_t> part(bytes.begin(), bytes.begin() + static_cast<std::ptrdiff_t>(size));
        LLVMFuzzerTestOneInput(part.data(), part.size());
    }
    return 1;
}

} // namespace

int main(int count, char** arguments) {
    int replayed = 0;
    for (int i = 1; i < count; ++i) {
        if (!std::filesystem::is_directory(arguments[i])) {
            replayed += replay(arguments[i]);
            continue;
        }
        for (const auto& entry : std::filesystem::directory_iterator(arguments[i])) {
            replayed += replay(entry.path());
        }
    }
    std::printf("%d files replayed\n", replayed);
    return replayed > 0 ? 0 : 1;
}
