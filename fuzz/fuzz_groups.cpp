// Feeds bytes to the reader of a packed list of channel groups: they are refused, or make a list that reads
// back as itself.

#include "edit/model/channel_group_list.h"

#include <cstdlib>

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    PStream stream(std::as_bytes(std::span(data, size)));
    ChannelGroupList list;
    list.unpack(stream);
    if (!stream.good()) {
        return 0;
    }
    PStream packed;
    list.pack(packed);
    PStream again(packed.bytes());
    ChannelGroupList read;
    read.unpack(again);
    PStream repacked;
    read.pack(repacked);
    if (!again.good() || repacked.bytes() != packed.bytes()) {
        std::abort();
    }
    return 0;
}
