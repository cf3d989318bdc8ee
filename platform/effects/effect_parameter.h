#pragma once

#include "platform/base/export.h"
#include "platform/base/qx_string.h"

#include <array>
#include <cstdint>
#include <span>
#include <variant>
#include <vector>

class PStream;

/// The parameters of effects: values, their courses over time, and the forms that kinds of effect give them.
namespace Fx {

/// Bytes in the name of a parameter, at most.
inline constexpr size_t kLongestParameterName = 256;

/// The numbers live in files: do not change them.
enum class ParameterKind : uint8_t {
    Number = 1,
    Switch = 2, ///< off or on
    Choice = 3, ///< one of several, by its number
    Colour = 4, ///< red, green, blue, opacity: 0 to 1, beyond it for what is brighter than white
    Point = 5,  ///< x to the right and y downwards
    Text = 6,
    File = 7 ///< the path of a file, UTF-8
};

/// How a keyframe leads to the one after it. Only numbers, colours and points have anything between two
/// keyframes; the other kinds hold. The numbers live in files: do not change them.
enum class Interpolation : uint8_t {
    Hold = 0,   ///< the value stays until the next keyframe
    Linear = 1, ///< straight to the next
    Smooth = 2  ///< on a curve without corners, which does not leave the range between the two values
};

struct Colour {
    double red = 0;
    double green = 0;
    double blue = 0;
    double opacity = 1;
    bool operator==(const Colour&) const = default;
};

struct Point {
    double x = 0;
    double y = 0;
    bool operator==(const Point&) const = default;
};

/// What a parameter is at a moment, without memory of its own: `text` points into what was asked and is good
/// until that changes. What does not belong to the kind is zero or empty.
struct Sample {
    ParameterKind kind = ParameterKind::Number;
    std::array<double, 4> numbers{};
    std::string_view text;

    [[nodiscard]] double number() const { return numbers[0]; }
    [[nodiscard]] bool isOn() const { return numbers[0] != 0; }
    [[nodiscard]] uint32_t choice() const {
        return numbers[0] >= 0 && numbers[0] <= UINT32_MAX ? static_cast<uint32_t>(numbers[0]) : 0;
    }
    [[nodiscard]] Colour colour() const { return {numbers[0], numbers[1], numbers[2], numbers[3]}; }
    [[nodiscard]] Point point() const { return {numbers[0], numbers[1]}; }
};

/// A value of a parameter. A plain value; only texts and paths have memory of their own.
class QM_API ParameterValue {
public:
    /// The number 0.
    ParameterValue() = default;
    /// The value of a sample, with a copy of its text.
    explicit ParameterValue(const Sample& sample);
    [[nodiscard]] static ParameterValue ofNumber(double value);
    [[nodiscard]] static ParameterValue ofSwitch(bool isOn);
    [[nodiscard]] static ParameterValue ofChoice(uint32_t value);
    [[nodiscard]] static ParameterValue ofColour(const Colour& value);
    [[nodiscard]] static ParameterValue ofPoint(const Point& value);
    [[nodiscard]] static ParameterValue ofText(String value);
    [[nodiscard]] static ParameterValue ofFile(String path);

    [[nodiscard]] ParameterKind kind() const { return m_kind; }
    /// The text points into this value.
    [[nodiscard]] Sample sample() const;
    /// False for a number that is not finite, or beyond 1e12 either way, a choice that is no whole number of 32
    /// bits, and a text of more than 16 MiB or with a zero byte.
    [[nodiscard]] bool isUsable() const;
    bool operator==(const ParameterValue&) const = default;

    /// Packed without its kind: Number f64, Switch u8 0 or 1, Choice u32, Colour four f64, Point two f64, Text
    /// and File a string. Lives in files: do not change it.
    void pack(PStream& stream) const;
    /// A value of a kind. One that is not usable puts the stream into its error state.
    [[nodiscard]] static ParameterValue unpack(ParameterKind kind, PStream& stream);

private:
    ParameterKind m_kind = ParameterKind::Number;
    std::variant<std::array<double, 4>, String> m_content;
};

/// A value at a moment, in seconds from the start of the effect's event; negative before it.
struct Keyframe {
    double time = 0;
    Interpolation interpolation = Interpolation::Linear;
    ParameterValue value;
    bool operator==(const Keyframe&) const = default;
};

/// A parameter that was set: its name and kind, and either one value for all time or keyframes in order of
/// time, at least `kLeastGap` apart. Before the first keyframe it has the value of the first, after the last
/// that of the last. A plain value.
class QM_API EffectParameter {
public:
    /// Keyframes closer than this, in seconds, are one.
    static constexpr double kLeastGap = 1e-6;
    /// The greatest absolute time of a keyframe, seconds.
    static constexpr double kGreatestTime = 1e9;

    EffectParameter(String name, ParameterValue value) : m_name(std::move(name)), m_value(std::move(value)) {}

    [[nodiscard]] const String& name() const { return m_name; }
    [[nodiscard]] ParameterKind kind() const { return m_value.kind(); }
    /// Empty for a constant one.
    [[nodiscard]] std::span<const Keyframe> keyframes() const { return m_keyframes; }
    [[nodiscard]] bool isConstant() const { return m_keyframes.empty(); }

    /// The value at a time, in seconds from the start of the event. Allocates nothing; O(log keyframes).
    [[nodiscard]] Sample at(double time) const;

    /// One value for all time: the keyframes go. False, changing nothing, for one of another kind or that is
    /// not usable. So in the setters below.
    bool setConstant(const ParameterValue& value);
    /// Sets a keyframe in its place; one that is there takes the value. The constant value goes.
    bool setKeyframe(const Keyframe& keyframe);
    /// False when there is no keyframe at the time. With the last one the parameter is constant at its value.
    bool removeKeyframe(double time);
    /// The event becomes the part [from, to) of what it was: keyframes move by -from, and those outside go as
    /// far as no value inside depends on them.
    void keepSpan(double from, double to);
    bool operator==(const EffectParameter&) const = default;

    /// Packed: name, kind (u8), a u32 count of keyframes; without any the value, else per keyframe its time
    /// (f64), interpolation (u8) and value. Lives in files: do not change it.
    void pack(PStream& stream) const;
    /// What may not be (an empty name or one of more than 256 bytes, an unknown kind or interpolation, times
    /// not in order) puts the stream into its error state.
    [[nodiscard]] static EffectParameter unpack(PStream& stream);

private:
    String m_name;
    ParameterValue m_value; ///< of a constant one; else of the parameter's kind
    std::vector<Keyframe> m_keyframes;
};

/// A parameter as a kind of effect has it.
struct ParameterForm {
    std::string_view name;
    ParameterKind kind = ParameterKind::Number;
    /// What it is until it is set; a text or path is empty. A parameter that was not set is not in the file, so
    /// that this lives in files: do not change it.
    std::array<double, 4> byDefault{};
    /// The range of a number, a choice, or each of a point's or colour's numbers (a colour's opacity is 0 to 1).
    double least = 0;
    double greatest = 0;
    /// What a number counts: "frame" is a part of the picture's width or height, "degree" is clockwise. Empty
    /// for a bare number and for what has no unit.
    std::string_view unit;
    /// The names of a choice's values from `least` on; empty for other kinds and where a number is shown.
    std::span<const std::string_view> choices;
    /// For a transition's "progress": without a value of its own it rises from 0 at the start of the event to
    /// 1 at its end.
    bool followsLength = false;

    /// The default. Its text, if it is one, is empty.
    [[nodiscard]] Sample defaultSample() const { return {kind, byDefault, {}}; }
    /// True for a usable value of the kind and within the range.
    [[nodiscard]] QM_API bool accepts(const ParameterValue& value) const;
};

/// The names of the kinds as people read them ("number", "colour", ...), and back; false for another text.
[[nodiscard]] QM_API std::string_view parameterKindName(ParameterKind kind);
[[nodiscard]] QM_API std::string_view interpolationName(Interpolation interpolation);
[[nodiscard]] QM_API bool readInterpolation(std::string_view text, Interpolation& interpolation);

/// A value as text: "0.5", "on", a choice's name or number, "0.2 0.4 1" for a colour (and a
/// fourth number if it is not opaque), "0.1 0.2" for a point, a text as it is. `form` gives the names of choices; null where there is none.
[[nodiscard]] QM_API String valueToText(const Sample& sample, const ParameterForm* form);
/// Reads a value of a kind from such a text; a switch reads "on", "off", "true", "false", "1", "0" too, a
/// choice its name (in any case) or number, a colour "#rrggbb" and "#rrggbbaa". False, leaving `value`, for what is none or not within the form.
[[nodiscard]] QM_API bool textToValue(std::string_view text, ParameterKind kind, const ParameterForm* form,
                                      ParameterValue& value);

} // namespace Fx
