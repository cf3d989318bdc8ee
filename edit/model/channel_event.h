#pragma once

#include "platform/base/cookie.h"
#include "platform/base/export.h"
#include "platform/base/id_stamp.h"

#include <cstdint>

/// Kinds of event, as bits so that a set of kinds can be asked for. Where a set is asked for, a plain number
/// does as well.
enum ce_info : uint8_t {
    CE_IN_POINT = 1,
    CE_RESERVED = 2, ///< no event is of this kind
    CE_OUT_POINT = 4,
    CE_ANY = 7
};

[[nodiscard]] constexpr ce_info operator|(ce_info a, ce_info b) {
    return static_cast<ce_info>(int{a} | int{b});
}

/// One event of a cel: it places a moment of a source item (its strip) at a moment of edit time. 64 bytes,
/// kept in the file in exactly this order, little-endian: do not change it.
struct QM_API channel_event {
    double editTime = 0;      ///< seconds on the channel's time line
    double stripTime = 0;     ///< seconds inside the source
    double velocity = 1;      ///< seconds of strip a second of edit: 1 normal, 0 a freeze, below 0 reverse
    float level = 1;          ///< gain or opacity, 1 is unity
    int32_t code = 0;         ///< the `dmod` code: free for the application, carried along
    cookie strip;             ///< the source
    IdStamp id;               ///< the event's identity, and that of the effect graph bound to it
    uint16_t rampQFrames = 0; ///< length of the fade at this event, quarter-frames
    uint8_t rampCurve = 0;    ///< `Aud::GainCurve::eCurveType` of that fade
    ce_info kind = CE_IN_POINT;
    uint32_t reserved = 0; ///< 0

    channel_event() = default;
    channel_event(double editTime_, double stripTime_, const cookie& strip_, float level_, ce_info kind_,
                  const IdStamp& id_, int code_)
        : editTime(editTime_), stripTime(stripTime_), level(level_), code(code_), strip(strip_), id(id_),
          kind(kind_) {}

    /// A fresh stamp for an event, of magic type 1. Safe on any thread.
    [[nodiscard]] static IdStamp newId();
    /// Whole quarter-frames of the current project's rate in `seconds`, rounded to nearest, 0 for what is
    /// negative or not a number, at most 65535.
    [[nodiscard]] static unsigned timeToQFrames(double seconds);

    bool operator==(const channel_event&) const = default;
};

static_assert(sizeof(channel_event) == 64, "events are stored as they lie in memory");
