#include "platform/media/picture_format.h"

#include "platform/media/frame_rate.h"

#include <vector>

namespace {

constexpr int kFormat625 = 1;
constexpr int kFormat525 = 2;
constexpr int kLargestSide = 65536;
constexpr size_t kLetters = 4;

constexpr Qx::OutputFormat kFormats[] = {
    {kFormat625, LineStructure::Interlaced, 720, 576},
    {kFormat625, LineStructure::Progressive, 720, 576},
    {kFormat525, LineStructure::Interlaced, 720, 486},
    {kFormat525, LineStructure::Progressive, 720, 486},
};

const char* linesText(LineStructure lines) {
    return lines == LineStructure::Interlaced ? "interlaced" : "progressive";
}

bool isSide(int pixels) {
    return pixels > 0 && pixels <= kLargestSide;
}

} // namespace

std::span<const Qx::OutputFormat> Qx::outputFormats() {
    return kFormats;
}

LineStructure Qx::projectLineStructure() {
    const int rate = projectFrameRate().nominal();
    return rate == 24 || rate == 48 ? LineStructure::Progressive : LineStructure::Interlaced;
}

String ShotVideoMetadata::asString() const {
    if (!valid()) {
        return {};
    }
    String text = String::format("%dx%d ", width, height) + linesText(lines) + " ";
    for (size_t i = 0; i < kLetters; ++i) {
        text += static_cast<char>(pixelFormat >> (8 * i));
    }
    return text;
}

ShotVideoMetadata ShotVideoMetadata::fromString(std::string_view text) {
    const std::vector<String> words = String(text).split(' ', true);
    if (words.size() != 3 || words[2].size() != kLetters) {
        return {};
    }
    const std::vector<String> sides = words[0].split('x', false);
    ShotVideoMetadata read;
    if (sides.size() != 2 || !Qx::textToInt(sides[0], read.width) || !Qx::textToInt(sides[1], read.height) ||
        !isSide(read.width) || !isSide(read.height)) {
        return {};
    }
    for (const LineStructure lines : {LineStructure::Progressive, LineStructure::Interlaced}) {
        if (words[1] != linesText(lines)) {
            continue;
        }
        read.lines = lines;
        for (size_t i = 0; i < kLetters; ++i) {
            read.pixelFormat |= static_cast<uint32_t>(static_cast<unsigned char>(words[2][i])) << (8 * i);
        }
        return read;
    }
    return {};
}
