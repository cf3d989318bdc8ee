#pragma once

#include "edit/model/cel.h"
#include "edit/model/cue_list.h"
#include "edit/model/edit.h"

#include <memory>

namespace test {

/// The source number `n`.
inline cookie source(int n) {
    return {Cookie_Type::Material, n, 1};
}

/// A cel of pairs played from strip time 100 of sources `first`, `first` + 1, ..., one after the other.
inline std::unique_ptr<cel> cutList(int first, const std::vector<double>& lengths) {
    auto made = std::make_unique<cel>();
    double at = 0;
    for (const double length : lengths) {
        made->appendEventPair(source(first++), 100, at, length);
        at += length;
    }
    return made;
}

/// A cue of one moment that is attached to nothing.
inline cue_point marker(const char* text, double time, int chan = 0, int flags = CueFlag::kKept) {
    cue_point cue(text, time, chan, 0, {}, false);
    cue.setFlags(flags);
    return cue;
}

/// The texts of a list's cues, in order, each with a blank behind.
inline std::string texts(const cue_list& list) {
    std::string all;
    for (size_t i = 0; i < list.get_num_cue_points(0); ++i) {
        all += list.get_cue_point(i, 0)->text() + " ";
    }
    return all;
}

inline std::vector<std::byte> packed(const Streamable& object) {
    PStream stream;
    object.pack(stream);
    return stream.bytes();
}

/// Unpacks into an object; true for a good stream.
inline bool unpacked(Streamable& object, std::span<const std::byte> bytes) {
    PStream stream(bytes);
    object.unpack(stream);
    return stream.good();
}

} // namespace test
