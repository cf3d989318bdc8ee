// A packed cel, as it lies in an edit file: what is read is consistent and packs to what reads again.

#include "edit/model/cel.h"
#include "platform/store/pstream.h"

#include <cstdlib>

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);

namespace {

void read(std::span<const std::byte> bytes, uint8_t revision) {
    PStream stream(bytes);
    cel its;
    its.revisionMajor(revision);
    its.unpack(stream);
    if (!stream.good()) {
        if (its.numEvents() != 0) {
            std::abort();
        }
        return;
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
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    for (const uint8_t revision : {uint8_t{1}, uint8_t{2}}) {
        read(std::as_bytes(std::span(data, size)), revision);
    }
    return 0;
}
