#pragma once

#include "edit/model/cel.h"

#include <algorithm>
#include <cmath>
#include <string>
#include <vector>

/// A channel as one number a frame, and what is done to it as anybody would do it by hand: knows nothing of
/// events.
namespace rows {

/// A gap, black, or the source's number times 10 000 and the frame of it that plays.
using Row = std::vector<int>;
constexpr int kGap = -1;
constexpr int kBlack = 0;

inline int lengthOf(const Row& row) {
    return static_cast<int>(row.size());
}

/// Makes a row at least so long, of `nothing`.
inline void reach(Row& row, int end, int nothing) {
    if (lengthOf(row) < end) {
        row.resize(static_cast<size_t>(end), nothing);
    }
}

/// What a row shows in [from, from + length), with `nothing` where there is a gap or no row.
inline Row part(const Row& row, int from, int length, int nothing = kGap) {
    Row taken;
    for (int i = from; i < from + length; ++i) {
        const int frame = i < lengthOf(row) ? row[static_cast<size_t>(i)] : kGap;
        taken.push_back(frame == kGap ? nothing : frame);
    }
    return taken;
}

inline void insert(Row& row, int at, const Row& laid, int nothing = kGap) {
    reach(row, at, nothing);
    row.insert(row.begin() + at, laid.begin(), laid.end());
}

inline void remove(Row& row, int from, int to) {
    const int end = lengthOf(row);
    if (from < end) {
        row.erase(row.begin() + from, row.begin() + std::min(to, end));
    }
}

/// Lays over what is there. With `materialOnly` a gap that comes over something makes it black.
inline void put(Row& row, int at, const Row& laid, bool materialOnly, int nothing = kGap) {
    const int end = lengthOf(row);
    reach(row, at + lengthOf(laid), nothing);
    for (int i = 0; i < lengthOf(laid); ++i) {
        int& frame = row[static_cast<size_t>(at + i)];
        const bool there = at + i < end && frame != kGap;
        const int with = laid[static_cast<size_t>(i)];
        frame = materialOnly && there && with == kGap ? kBlack : with;
    }
}

/// The row that a cel shows; says in `problem` if an event lies off the frames.
inline Row rowOf(const cel& its, double frameDuration, std::string& problem) {
    const auto frameAt = [&](double seconds) {
        const auto frame = static_cast<int>(std::lround(seconds / frameDuration));
        if (std::abs(seconds - frame * frameDuration) > 1e-6) {
            problem = "off the frames at " + std::to_string(seconds);
        }
        return frame;
    };
    Row row;
    for (int i = 0; i + 1 < its.numEvents(); i += 2) {
        const channel_event& in = *its.getChanEventPtr(i);
        const int from = frameAt(in.editTime);
        const int to = frameAt(its.getChanEventPtr(i + 1)->editTime);
        const int shown = static_cast<int>(in.strip.word(0)) * 10000 + frameAt(in.stripTime);
        row.resize(static_cast<size_t>(from), kGap);
        for (int frame = from; frame < to; ++frame) {
            row.push_back(in.strip.isBlack() ? kBlack : shown + (frame - from));
        }
    }
    return row;
}

} // namespace rows
