#pragma once

#include "platform/base/export.h"
#include "platform/base/qx_string.h"

#include <cstdint>
#include <span>

/// How the lines of a picture are scanned. The numbers live in edit files: do not change them.
enum class LineStructure : int32_t { Progressive = 1, Interlaced = 2 };

namespace Qx {

/// A picture format in which material is put out: the television format it belongs to (1 for 625 lines, 2 for
/// 525), how its lines are scanned, and its size in pixels.
struct OutputFormat {
    int formatCode;
    LineStructure lines;
    int width;
    int height;
};

/// The formats there are, in a fixed order: of several that fit, the first is taken.
QM_API std::span<const OutputFormat> outputFormats();
/// The line structure of the current project's output image: whole frames at the rates of film (24 and 48),
/// two fields at those of television.
QM_API LineStructure projectLineStructure();

} // namespace Qx

/// What is known of the pictures of a shot: size, line structure and how a pixel is stored. A plain value.
struct QM_API ShotVideoMetadata {
    /// 4:2:2, eight bits, packed: the letters 'Y', 'U', 'Y', '2'.
    static constexpr uint32_t kPixelYUY2 = 0x32595559;

    int width = 0;
    int height = 0;
    LineStructure lines = LineStructure::Progressive;
    uint32_t pixelFormat = 0; ///< four letters, the first the least significant

    [[nodiscard]] bool valid() const { return width > 0 && height > 0; }
    /// "720x576 interlaced YUY2"; empty for one that is not valid.
    [[nodiscard]] String asString() const;
    /// The inverse; one that is not valid for any other text.
    [[nodiscard]] static ShotVideoMetadata fromString(std::string_view text);
    bool operator==(const ShotVideoMetadata&) const = default;
};
