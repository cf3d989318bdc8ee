#pragma once

#include "platform/store/pstream.h"

#include <cstdlib>
#include <span>

/// Feeds bytes to the reader of a packed form: they are refused, or make an object that packs, reads back and
/// packs again as the same bytes.
template <typename Form>
int readPackedForm(const uint8_t* data, size_t size) {
    PStream stream(std::as_bytes(std::span(data, size)));
    Form form;
    form.unpack(stream);
    if (!stream.good()) {
        return 0;
    }
    PStream packed;
    form.pack(packed);
    PStream again(packed.bytes());
    Form read;
    read.unpack(again);
    PStream repacked;
    read.pack(repacked);
    if (!again.good() || repacked.bytes() != packed.bytes()) {
        std::abort();
    }
    return 0;
}
