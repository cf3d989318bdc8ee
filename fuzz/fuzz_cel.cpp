// A packed cel, as it lies in an edit file: what is read is consistent and packs to what reads again.

#include "edit/model/cel.h"
#include "platform/store/pstream.h"

#include <cstdlib>

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    PStream stream(std::as_bytes(std::span(data, size)));
    cel its;
    its.unpack(stream);
    if (!stream.good()) {
        return its.numEvents() == 0 ? 0 : (std::abort(), 0);
    }
    PStream packed;
    its.pack(packed);
    PStream again{std::span<const std::byte>(packed.bytes())};
    cel second;
    second.unpack(again);
    cel::IdMap ids;
    if (its.is_good_cel() == 0 || !again.good() || second.numEvents() != its.numEvents()) {
        std::abort();
    }
    const double middle = its.get_start_time() / 2 + its.get_end_time() / 2;
    static_cast<void>(its.replace(&second, {middle - 3, middle + 3}, middle - 1, ids));
    static_cast<void>(its.insert(&second, {middle - 3, middle + 3}, middle + 2, ids));
    static_cast<void>(its.remove({middle - 2, middle + 5}));
    static_cast<void>(its.replace(&second, {middle - 3, middle + 3}, middle - 1, ids, true));
    if (its.is_good_cel() == 0) {
        std::abort();
    }
    return 0;
}
