// Values, their courses over time and their texts.

#include "platform/effects/effect_kinds.h"
#include "platform/store/pstream.h"
#include "support/memory_meter.h"

#include <cmath>
#include <gtest/gtest.h>
#include <limits>
#include <random>

namespace {

using Fx::Interpolation;
using Fx::ParameterKind;
using Fx::ParameterValue;

ParameterValue number(double value) {
    return ParameterValue::ofNumber(value);
}

Fx::EffectParameter course(std::initializer_list<Fx::Keyframe> keys) {
    Fx::EffectParameter made("x", keys.begin()->value);
    for (const Fx::Keyframe& key : keys) {
        EXPECT_TRUE(made.setKeyframe(key));
    }
    return made;
}

TEST(EffectParameter, ValueBetweenKeyframes) {
    const Fx::EffectParameter its = course({{4, Interpolation::Smooth, number(20)},
                                            {0, Interpolation::Hold, number(1)},
                                            {2, Interpolation::Linear, number(10)},
                                            {6, Interpolation::Linear, number(0)}});
    const struct {
        double time;
        double value;
    } cases[] = {{-1, 1}, {0, 1}, {1.999, 1}, {2, 10}, {3, 15}, {4, 20}, {5, 10}, {6, 0}, {99, 0}, {NAN, 0}};
    const test::MemoryMeter meter;
    for (const auto& [time, value] : cases) {
        EXPECT_NEAR(its.at(time).number(), value, 1e-12) << time;
    }
    EXPECT_EQ(meter.numAllocations(), 0u);

    // What has nothing between two values holds.
    Fx::EffectParameter text("t", ParameterValue::ofText("a long text that has memory of its own"));
    EXPECT_TRUE(text.setKeyframe({1, Interpolation::Smooth, ParameterValue::ofText("one")}));
    EXPECT_TRUE(text.setKeyframe({2, Interpolation::Smooth, ParameterValue::ofText("two")}));
    EXPECT_EQ(text.at(1.9).text, "one");
    EXPECT_TRUE(text.removeKeyframe(1));
    EXPECT_TRUE(text.removeKeyframe(2));
    EXPECT_FALSE(text.removeKeyframe(2));
    EXPECT_EQ(text.at(0).text, "two") << "constant at the last one";
}

/// Courses of random keyframes: a smooth one stays between its keyframes, any part looks as the whole did, also
/// when it is cut again and again, and what was cut can be read again.
TEST(EffectParameter, PartsLookAsTheWholeDid) {
    constexpr unsigned kSeed = 20;
    SCOPED_TRACE("seed " + std::to_string(kSeed));
    std::mt19937 random(kSeed);
    std::uniform_real_distribution<double> where(-5, 15);
    for (int round = 0; round < 300; ++round) {
        Fx::EffectParameter whole("x", number(0));
        for (unsigned i = 0; i <= random() % 9; ++i) {
            whole.setKeyframe(
                {where(random), static_cast<Interpolation>(random() % 3), number(where(random))});
        }
        const auto keys = whole.keyframes();
        for (size_t i = 0; i + 1 < keys.size(); ++i) {
            const double a = keys[i].value.sample().number();
            const double b = keys[i + 1].value.sample().number();
            for (double part = 0.05; part < 1; part += 0.1) {
                const double value = whole.at(std::lerp(keys[i].time, keys[i + 1].time, part)).number();
                EXPECT_GE(value, std::min(a, b) - 1e-9);
                EXPECT_LE(value, std::max(a, b) + 1e-9);
            }
        }
        double from = 0;
        double to = 10;
        Fx::EffectParameter cut = whole;
        for (int i = 0; i < 4; ++i) {
            const double at = from + (to - from) * 0.25;
            const double end = from + (to - from) * 0.75;
            cut.keepSpan(at - from, end - from);
            from = at;
            to = end;
            for (double t = from; t < to; t += (to - from) / 50) {
                ASSERT_NEAR(cut.at(t - from).number(), whole.at(t).number(), 1e-6) << "round " << round;
            }
        }
        PStream packed;
        cut.pack(packed);
        PStream stream(packed.bytes());
        EXPECT_EQ(Fx::EffectParameter::unpack(stream), cut);
        EXPECT_TRUE(stream.good());
    }
    // Keyframes at the edge of what can be held, and closer than times that far out can tell apart.
    Fx::EffectParameter far = course({{1e9, Interpolation::Linear, number(1)},
                                      {0, Interpolation::Linear, number(2)},
                                      {1e-6, Interpolation::Linear, number(3)}});
    far.keepSpan(-9e8, 9e8);
    far.keepSpan(-9e8, 9e8);
    PStream packed;
    far.pack(packed);
    PStream stream(packed.bytes());
    EXPECT_EQ(Fx::EffectParameter::unpack(stream), far);
    EXPECT_TRUE(stream.good());
}

TEST(EffectParameter, BytesThatAreNoneAreRefused) {
    Fx::EffectParameter its =
        course({{0, Interpolation::Linear, number(1)}, {1, Interpolation::Smooth, number(2)}});
    PStream packed;
    its.pack(packed);
    // A name of one letter, kind and count, then time, interpolation and value of each keyframe.
    const struct {
        size_t at;
        int value;
    } broken[] = {{0, 0},  {4, 0xFF},  {5, 0},     {5, 8},  {6, 3},    {17, 0x7F},
                  {18, 3}, {26, 0x7F}, {34, 0xC0}, {35, 3}, {43, 0x7F}};
    for (const auto& [at, value] : broken) {
        std::vector<std::byte> bytes = packed.bytes();
        bytes[at] = static_cast<std::byte>(value);
        PStream stream(bytes);
        static_cast<void>(Fx::EffectParameter::unpack(stream));
        EXPECT_FALSE(stream.good() && stream.remaining() == 0) << at;
    }
}

TEST(ParameterText, ValuesComeBackFromTheirTexts) {
    const struct {
        const char* kind;
        const char* parameter;
        const char* text;
        const char* shown; ///< null if it is refused
    } cases[] = {
        {"QxDip", "colour", "#ff0000", "1 0 0"},
        {"QxDip", "colour", "0.5, 0.25 0", "0.5 0.25 0"},
        {"QxDip", "colour", "0 0 0 0.5", "0 0 0 0.5"},
        {"QxDip", "colour", "#ff000", nullptr},
        {"QxDip", "colour", "1 2", nullptr},
        {"QxDip", "colour", "0 0 0 2", nullptr},
        {"QxDVE", "position", "-0.5 0.25", "-0.5 0.25"},
        {"QxDVE", "rotation", "1e3", "1000"},
        {"QxDVE", "rotation", "nan", nullptr},
        {"QxDVE", "rotation", "36001", nullptr},
        {"QxCrossFade", "curve", "Constant Power", "constant power"},
        {"QxCrossFade", "curve", "2", "s curve"},
        {"QxCrossFade", "curve", "4", nullptr},
        {"QxCrossFade", "curve", "-1", nullptr},
        {"QxWipe", "pattern", "999", "999"},
        {"QxWipe", "reverse", "TRUE", "on"},
        {"QxWipe", "reverse", "perhaps", nullptr},
        {"QxTitle", "file", "/a/b.icg", "/a/b.icg"},
        {"QxMosaic", "opacity", "0.5", "0.5"},
        {"QxMosaic", "opacity", "1.5", nullptr},
    };
    for (const auto& [kind, parameter, text, shown] : cases) {
        const Fx::ParameterForm* const form = Fx::findKind(kind)->findParameter(parameter);
        ASSERT_NE(form, nullptr) << kind << " " << parameter;
        ParameterValue value;
        EXPECT_EQ(Fx::textToValue(text, form->kind, form, value), shown != nullptr) << text;
        if (shown != nullptr) {
            EXPECT_EQ(Fx::valueToText(value.sample(), form), shown) << text;
            ParameterValue again;
            EXPECT_TRUE(Fx::textToValue(shown, form->kind, form, again));
            EXPECT_EQ(again, value);
        }
    }
}

} // namespace
