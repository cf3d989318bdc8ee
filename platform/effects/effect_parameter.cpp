#include "platform/effects/effect_parameter.h"

#include "platform/store/pstream.h"

#include <algorithm>
#include <cmath>

namespace Fx {

namespace {

constexpr double kGreatestNumber = 1e12;
constexpr size_t kLongestText = size_t{16} << 20;
/// A time, an interpolation and a switch.
constexpr size_t kLeastKeyframe = 8 + 1 + 1;
/// How many keyframes beyond a span values inside it depend on: the one that it is reached from and, for the
/// slope there, the one beyond.
constexpr size_t kOutside = 2;

bool isText(ParameterKind kind) {
    return kind == ParameterKind::Text || kind == ParameterKind::File;
}

/// How many numbers a value of a kind has.
size_t numNumbers(ParameterKind kind) {
    return kind == ParameterKind::Colour ? 4 : kind == ParameterKind::Point ? 2 : isText(kind) ? 0 : 1;
}

/// True where there are values between two values.
bool isContinuous(ParameterKind kind) {
    return kind == ParameterKind::Number || kind == ParameterKind::Colour || kind == ParameterKind::Point;
}

/// True for the times of two keyframes in order, at least as far apart as rounding leaves those that were set.
bool isApart(double a, double b) {
    return b - a >= EffectParameter::kLeastGap / 10;
}

bool isKeyframeTime(double time) {
    return std::abs(time) <= EffectParameter::kGreatestTime;
}

double slope(const Keyframe& a, const Keyframe& b, size_t i) {
    return (b.value.sample().numbers[i] - a.value.sample().numbers[i]) / (b.time - a.time);
}

/// The slope of the smooth curve at a keyframe: level at the ends and where the values turn, else the weighted
/// harmonic mean of the slopes on either side. So the curve never leaves the range of its two ends.
double tangent(std::span<const Keyframe> keys, size_t at, size_t i) {
    if (at == 0 || at + 1 == keys.size()) {
        return 0;
    }
    const double before = slope(keys[at - 1], keys[at], i);
    const double after = slope(keys[at], keys[at + 1], i);
    if (!(before * after > 0)) {
        return 0;
    }
    const double lengthBefore = keys[at].time - keys[at - 1].time;
    const double lengthAfter = keys[at + 1].time - keys[at].time;
    const double a = 2 * lengthAfter + lengthBefore;
    const double b = lengthAfter + 2 * lengthBefore;
    return (a + b) / (a / before + b / after);
}

/// The curve between two keyframes at `part`, 0 to 1, of the way.
double smooth(std::span<const Keyframe> keys, size_t from, size_t i, double part) {
    const double a = keys[from].value.sample().numbers[i];
    const double b = keys[from + 1].value.sample().numbers[i];
    const double length = keys[from + 1].time - keys[from].time;
    const double rest = 1 - part;
    return rest * rest * (1 + 2 * part) * a + part * part * (3 - 2 * part) * b +
           length * part * rest * (rest * tangent(keys, from, i) - part * tangent(keys, from + 1, i));
}

/// The first keyframe at or after a time.
template <typename Keys>
auto firstFrom(Keys& keys, double time) {
    return std::lower_bound(keys.begin(), keys.end(), time,
                            [](const Keyframe& key, double t) { return key.time < t; });
}

/// The keyframe that counts as being at a time; the end if there is none.
template <typename Keys>
auto keyAt(Keys& keys, double time) {
    const auto found = firstFrom(keys, time - EffectParameter::kLeastGap);
    return found != keys.end() && found->time < time + EffectParameter::kLeastGap ? found : keys.end();
}

} // namespace

ParameterValue::ParameterValue(const Sample& sample) : m_kind(sample.kind) {
    if (isText(m_kind)) {
        m_content = String(sample.text);
    } else {
        m_content = sample.numbers;
    }
}

ParameterValue ParameterValue::ofNumber(double value) {
    return ParameterValue(Sample{ParameterKind::Number, {value}, {}});
}

ParameterValue ParameterValue::ofSwitch(bool isOn) {
    return ParameterValue(Sample{ParameterKind::Switch, {isOn ? 1.0 : 0.0}, {}});
}

ParameterValue ParameterValue::ofChoice(uint32_t value) {
    return ParameterValue(Sample{ParameterKind::Choice, {double{1} * value}, {}});
}

ParameterValue ParameterValue::ofColour(const Colour& value) {
    return ParameterValue(
        Sample{ParameterKind::Colour, {value.red, value.green, value.blue, value.opacity}, {}});
}

ParameterValue ParameterValue::ofPoint(const Point& value) {
    return ParameterValue(Sample{ParameterKind::Point, {value.x, value.y}, {}});
}

ParameterValue ParameterValue::ofText(String value) {
    ParameterValue made;
    made.m_kind = ParameterKind::Text;
    made.m_content = std::move(value);
    return made;
}

ParameterValue ParameterValue::ofFile(String path) {
    ParameterValue made = ofText(std::move(path));
    made.m_kind = ParameterKind::File;
    return made;
}

Sample ParameterValue::sample() const {
    if (const auto* const numbers = std::get_if<std::array<double, 4>>(&m_content)) {
        return {m_kind, *numbers, {}};
    }
    return {m_kind, {}, *std::get_if<String>(&m_content)};
}

bool ParameterValue::isUsable() const {
    const Sample its = sample();
    if ((m_kind == ParameterKind::Choice && its.numbers[0] != double{1} * its.choice()) ||
        (m_kind == ParameterKind::Switch && its.numbers[0] != (its.isOn() ? 1 : 0))) {
        return false;
    }
    return std::all_of(its.numbers.begin(), its.numbers.end(),
                       [](double number) { return std::abs(number) <= kGreatestNumber; }) &&
           its.text.size() <= kLongestText && its.text.find('\0') == std::string_view::npos;
}

void ParameterValue::pack(PStream& stream) const {
    const Sample its = sample();
    if (isText(m_kind)) {
        stream.setString(its.text);
    } else if (m_kind == ParameterKind::Switch) {
        stream.setCookedChar(its.isOn() ? 1 : 0);
    } else if (m_kind == ParameterKind::Choice) {
        stream.setUnsignedLong(its.choice());
    } else {
        for (size_t i = 0; i < numNumbers(m_kind); ++i) {
            stream.setDouble(its.numbers[i]);
        }
    }
}

ParameterValue ParameterValue::unpack(ParameterKind kind, PStream& stream) {
    Sample its;
    its.kind = kind;
    String text;
    if (isText(kind)) {
        text = stream.getString();
        its.text = text;
    } else if (kind == ParameterKind::Switch) {
        const uint8_t value = stream.getCookedChar();
        its.numbers[0] = value;
        if (value > 1) {
            stream.fail();
        }
    } else if (kind == ParameterKind::Choice) {
        its.numbers[0] = stream.getUnsignedLong();
    } else {
        for (size_t i = 0; i < numNumbers(kind); ++i) {
            its.numbers[i] = stream.getDouble();
        }
    }
    ParameterValue value(its);
    if (!value.isUsable()) {
        stream.fail();
    }
    return value;
}

Sample EffectParameter::at(double time) const {
    if (m_keyframes.empty()) {
        return m_value.sample();
    }
    const std::span<const Keyframe> keys = m_keyframes;
    const auto next = std::upper_bound(keys.begin(), keys.end(), time,
                                       [](double t, const Keyframe& key) { return t < key.time; });
    if (next == keys.begin() || next == keys.end()) {
        // So is what no time compares with.
        return (next == keys.begin() ? keys.front() : keys.back()).value.sample();
    }
    const auto from = static_cast<size_t>(next - keys.begin()) - 1;
    Sample its = keys[from].value.sample();
    const Interpolation how = keys[from].interpolation;
    if (how == Interpolation::Hold || !isContinuous(its.kind)) {
        return its;
    }
    const double part = (time - keys[from].time) / (next->time - keys[from].time);
    const std::array<double, 4> to = next->value.sample().numbers;
    for (size_t i = 0; i < numNumbers(its.kind); ++i) {
        its.numbers[i] = how == Interpolation::Smooth ? smooth(keys, from, i, part)
                                                      : its.numbers[i] + (to[i] - its.numbers[i]) * part;
    }
    return its;
}

bool EffectParameter::setConstant(const ParameterValue& value) {
    if (value.kind() != kind() || !value.isUsable()) {
        return false;
    }
    m_value = value;
    m_keyframes.clear();
    return true;
}

bool EffectParameter::setKeyframe(const Keyframe& keyframe) {
    if (keyframe.value.kind() != kind() || !keyframe.value.isUsable() || !isKeyframeTime(keyframe.time)) {
        return false;
    }
    if (const auto there = keyAt(m_keyframes, keyframe.time); there != m_keyframes.end()) {
        there->value = keyframe.value;
        there->interpolation = keyframe.interpolation;
    } else {
        m_keyframes.insert(firstFrom(m_keyframes, keyframe.time), keyframe);
    }
    return true;
}

bool EffectParameter::removeKeyframe(double time) {
    const auto there = keyAt(m_keyframes, time);
    if (there == m_keyframes.end()) {
        return false;
    }
    m_value = std::move(there->value);
    m_keyframes.erase(there);
    return true;
}

void EffectParameter::keepSpan(double from, double to) {
    if (m_keyframes.empty() || !isKeyframeTime(from) || !isKeyframeTime(to)) {
        return;
    }
    const auto inside = static_cast<size_t>(firstFrom(m_keyframes, from) - m_keyframes.begin());
    const auto behind = static_cast<size_t>(firstFrom(m_keyframes, to) - m_keyframes.begin());
    const size_t last = std::min(m_keyframes.size(), std::max(inside, behind) + kOutside);
    const size_t first = inside > kOutside ? inside - kOutside : 0;
    m_keyframes.erase(m_keyframes.begin() + static_cast<std::ptrdiff_t>(last), m_keyframes.end());
    m_keyframes.erase(m_keyframes.begin(), m_keyframes.begin() + static_cast<std::ptrdiff_t>(first));
    for (Keyframe& key : m_keyframes) {
        key.time -= from;
    }
    // Times are rounded, and none may leave what can be read again.
    double before = -2 * kGreatestTime;
    ParameterValue left = m_keyframes.front().value;
    std::erase_if(m_keyframes, [&](const Keyframe& key) {
        const bool stays = isKeyframeTime(key.time) && isApart(before, key.time);
        before = stays ? key.time : before;
        return !stays;
    });
    m_value = m_keyframes.empty() ? std::move(left) : m_value;
}

void EffectParameter::pack(PStream& stream) const {
    stream.setString(m_name);
    stream.setCookedChar(static_cast<uint8_t>(kind()));
    stream.setUnsignedLong(static_cast<uint32_t>(m_keyframes.size()));
    if (m_keyframes.empty()) {
        m_value.pack(stream);
    }
    for (const Keyframe& key : m_keyframes) {
        stream.setDouble(key.time);
        stream.setCookedChar(static_cast<uint8_t>(key.interpolation));
        key.value.pack(stream);
    }
}

EffectParameter EffectParameter::unpack(PStream& stream) {
    EffectParameter read(stream.getString(), {});
    const uint8_t kind = stream.getCookedChar();
    const uint32_t count = stream.getCount(kLeastKeyframe);
    if (read.m_name.empty() || read.m_name.size() > Fx::kLongestParameterName || !Qx::isUtf8(read.m_name) ||
        kind < static_cast<uint8_t>(ParameterKind::Number) ||
        kind > static_cast<uint8_t>(ParameterKind::File)) {
        stream.fail();
        return read;
    }
    const auto its = static_cast<ParameterKind>(kind);
    if (count == 0) {
        read.m_value = ParameterValue::unpack(its, stream);
        return read;
    }
    read.m_keyframes.reserve(count);
    for (uint32_t i = 0; i < count && stream.good(); ++i) {
        Keyframe key;
        key.time = stream.getDouble();
        const uint8_t how = stream.getCookedChar();
        key.interpolation = static_cast<Interpolation>(how);
        key.value = ParameterValue::unpack(its, stream);
        const bool isInOrder = read.m_keyframes.empty() || isApart(read.m_keyframes.back().time, key.time);
        if (how > static_cast<uint8_t>(Interpolation::Smooth) || !isKeyframeTime(key.time) || !isInOrder) {
            stream.fail();
        }
        read.m_keyframes.push_back(std::move(key));
    }
    read.m_value = ParameterValue(Sample{its, {}, {}});
    return read;
}

bool ParameterForm::accepts(const ParameterValue& value) const {
    const Sample its = value.sample();
    if (value.kind() != kind || !value.isUsable()) {
        return false;
    }
    const auto isWithin = [&](double number) { return number >= least && number <= greatest; };
    switch (kind) {
    case ParameterKind::Number:
    case ParameterKind::Choice:
        return isWithin(its.numbers[0]);
    case ParameterKind::Point:
        return isWithin(its.numbers[0]) && isWithin(its.numbers[1]);
    case ParameterKind::Colour:
        return std::all_of(its.numbers.begin(), its.numbers.begin() + 3, isWithin) && its.numbers[3] >= 0 &&
               its.numbers[3] <= 1;
    default:
        return true;
    }
}

} // namespace Fx
