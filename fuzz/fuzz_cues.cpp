// Feeds bytes to the reader of a packed cue list: they are refused, or make a list that reads back as itself.

#include "edit/model/cue_list.h"

#include <cstdlib>

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    PStream stream(std::as_bytes(std::span(data, size)));
    cue_list list;
    list.unpack(stream);
    if (!stream.good()) {
        return 0;
    }
    PStream packed;
    list.pack(packed);
    PStream again(packed.bytes());
    cue_list read;
    read.unpack(again);
    PStream repacked;
    read.pack(repacked);
    if (!again.good() || repacked.bytes() != packed.bytes()) {
        std::abort();
    }
    return 0;
}
