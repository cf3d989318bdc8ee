#include "platform/media/pulldown.h"

namespace Qx {

namespace {

int64_t floorDivide(int64_t a, int64_t b) {
    return a / b - (a % b < 0 ? 1 : 0);
}

/// The first video frame of the film frames A to D, and the film frame in the first field of five video
/// frames.
constexpr int64_t kFirstVideo[] = {0, 1, 2, 3};
constexpr int64_t kFirstField[] = {0, 1, 1, 2, 3};

/// Video frames from that of an A to the one that a letter begins the count with.
int64_t videoOf(int64_t film) {
    const int64_t group = floorDivide(film, 4);
    return 5 * group + kFirstVideo[film - 4 * group];
}

int64_t filmOf(int64_t video) {
    const int64_t group = floorDivide(video, 5);
    return 4 * group + kFirstField[video - 5 * group];
}

} // namespace

Pulldown::Pulldown(Kind kind, char phase)
    : m_kind(kind), m_phase(kind == TwoThree && phase >= 'A' && phase <= 'D' ? phase - 'A' : 0) {}

Pulldown Pulldown::between(FrameRate film, FrameRate video) {
    if (film.nominal() * 5 == video.nominal() * 4 && film.valid()) {
        return Pulldown(TwoThree);
    }
    return film.nominal() * 25 == video.nominal() * 24 && film.valid() ? Pulldown(FrameForFrame) : Pulldown();
}

int64_t Pulldown::videoFrame(int64_t filmFrame) const {
    switch (m_kind) {
    case TwoThree:
        return videoOf(filmFrame + m_phase) - videoOf(m_phase);
    case OneHeld:
        return filmFrame + floorDivide(filmFrame, 24);
    default:
        return filmFrame;
    }
}

int64_t Pulldown::filmFrame(int64_t videoFrame) const {
    switch (m_kind) {
    case TwoThree:
        return filmOf(videoFrame + videoOf(m_phase)) - m_phase;
    case OneHeld: {
        const int64_t group = floorDivide(videoFrame, 25);
        const int64_t within = videoFrame - 25 * group;
        return 24 * group + (within < 24 ? within : 23);
    }
    default:
        return videoFrame;
    }
}

bool Pulldown::isMixed(int64_t videoFrame) const {
    if (m_kind != TwoThree) {
        return false;
    }
    const int64_t placed = videoFrame + videoOf(m_phase);
    const int64_t within = placed - 5 * floorDivide(placed, 5);
    return within == 2 || within == 3;
}

String Pulldown::asString() const {
    switch (m_kind) {
    case TwoThree:
        return String("2:3 ") + phase();
    case FrameForFrame:
        return "1:1";
    case OneHeld:
        return "24&1";
    default:
        return "none";
    }
}

bool Pulldown::fromString(std::string_view text, Pulldown& pulldown) {
    for (const Kind kind : {None, FrameForFrame, OneHeld}) {
        if (text == Pulldown(kind).asString()) {
            pulldown = Pulldown(kind);
            return true;
        }
    }
    for (const char phase : {'A', 'B', 'C', 'D'}) {
        if (text == Pulldown(TwoThree, phase).asString()) {
            pulldown = Pulldown(TwoThree, phase);
            return true;
        }
    }
    return false;
}

} // namespace Qx
