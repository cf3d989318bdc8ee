#pragma once

#include "platform/base/export.h"

#include <cstdint>
#include <span>
#include <string_view>

/// The code of a wipe as an older edit or a list holds it, whatever numbering it is of.
enum class WipePattern : uint32_t {};

/// Which way a wipe runs. The numbers live in files: do not change them.
enum class Wipe_Direction : uint8_t { Forward = 0, Reverse = 1 };

/// The patterns of wipes.
namespace Wipe {

namespace Patterns {
/// A pattern, by its code in SMPTE 258M; `kInfo` of wipe.cpp holds every one. Those that programs name have
/// names here. The numbers live in files and lists: do not change them.
enum Pattern : uint32_t {
    BarLeftToRight = 1,
    BarTopToBottom = 2,
    BoxTopLeft = 3,
    FourBoxCornersIn = 7,
    BarnDoorVertical = 21,
    BarnDoorHorizontal = 22,
    DiagonalTopLeft = 41,
    IrisRectangle = 101,
    IrisDiamond = 102,
    EllipseCircle = 119,
    ClockFromTwelve = 201
};

/// A pattern's code and its name as users read it.
struct Info {
    Pattern code;
    std::string_view name;
};

/// Every pattern, in the order of the codes.
[[nodiscard]] QM_API std::span<const Info> all();
/// The name; empty for a code that is none.
[[nodiscard]] QM_API std::string_view name(Pattern pattern);
/// True for a code of the standard.
[[nodiscard]] QM_API bool isKnown(uint32_t code);
} // namespace Patterns

/// The pattern that is drawn for the code of an older edit or a list: the one with that code. A code that no
/// pattern has is drawn as a plain wipe from left to right. `direction`, if not null, is set to the way in
/// which the pattern runs.
[[nodiscard]] QM_API Patterns::Pattern remapPattern(WipePattern pattern, Wipe_Direction* direction = nullptr);

} // namespace Wipe
