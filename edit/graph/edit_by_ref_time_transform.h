#pragma once

#include "platform/base/val_equals.h"

/// The mapping of times from an edit to what one of its events shows: a linear one, met on the way down through a
/// reference to another edit. Seconds.
struct EditByRefTimeTransform {
    double destStart = 0; ///< time inside that corresponds to `srcStart`
    double srcStart = 0;  ///< time outside
    float velocity = 0;   ///< seconds inside a second outside; below 0 in reverse, 0 for a still

    constexpr EditByRefTimeTransform() = default;
    constexpr EditByRefTimeTransform(double dest, double src, float speed)
        : destStart(dest), srcStart(src), velocity(speed) {}

    /// The time inside for a time outside.
    [[nodiscard]] constexpr double applyTo(double t) const {
        return (t - srcStart) * static_cast<double>(velocity) + destStart;
    }
    /// The time outside for a time inside; not finite for a velocity of 0.
    [[nodiscard]] constexpr double inverseApplyTo(double t) const {
        return (t - destStart) / static_cast<double>(velocity) + srcStart;
    }
    /// Within the tolerance of `valEqualsVal`.
    bool operator==(const EditByRefTimeTransform& other) const {
        return valEqualsVal(destStart, other.destStart) && valEqualsVal(srcStart, other.srcStart) &&
               valEqualsVal(static_cast<double>(velocity), static_cast<double>(other.velocity));
    }
};
