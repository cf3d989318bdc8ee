// A packed level envelope, as it lies in an edit file.

#include "platform/media/level_store.h"
#include "platform/store/pstream.h"

#include <cstdlib>

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    using Aud::DynamicLevelControl::Store;
    PStream stream(std::as_bytes(std::span(data, size)));
    Store levels;
    levels.unpack(stream);
    if (!stream.good()) {
        return levels.empty() ? 0 : (std::abort(), 0);
    }
    PStream packed;
    levels.pack(packed);
    PStream again{std::span<const std::byte>(packed.bytes())};
    Store second;
    second.unpack(again);
    if (!again.good() || second != levels) {
        std::abort();
    }
    levels.replace(second, {0, 5}, 2);
    levels.insert(second, {1, 3}, 4);
    levels.remove({3, 6});
    levels.simplify();
    for (size_t i = 1; i < levels.size(); ++i) {
        if (!(levels[i - 1].time < levels[i].time)) {
            std::abort();
        }
    }
    return 0;
}
