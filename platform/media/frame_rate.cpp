#include "platform/media/frame_rate.h"

#include "platform/services/current_project.h"

#include <algorithm>
#include <array>
#include <cmath>

namespace Qx {

namespace {

struct Rate {
    int numerator;
    int denominator;
    int nominal;
    const char* text;
};

// By code.
constexpr std::array<Rate, 11> kRates{{{0, 1, 0, ""},
                                       {24, 1, 24, "24"},
                                       {24000, 1001, 24, "23.976"},
                                       {25, 1, 25, "25"},
                                       {30000, 1001, 30, "29.97"},
                                       {30, 1, 30, "30"},
                                       {48, 1, 48, "48"},
                                       {50, 1, 50, "50"},
                                       {60000, 1001, 60, "59.94"},
                                       {60, 1, 60, "60"},
                                       {48000, 1001, 48, "47.952"}}};

const Rate& rate(int code) {
    return kRates[static_cast<size_t>(code)];
}

// A decimal text, or the quotient of two.
bool readNumber(std::string_view text, double& value) {
    const size_t slash = text.find('/');
    if (slash == std::string_view::npos) {
        return textToDouble(text, value);
    }
    double above = 0;
    double below = 0;
    if (!textToDouble(text.substr(0, slash), above) || !textToDouble(text.substr(slash + 1), below) ||
        !(below > 0)) {
        return false;
    }
    value = above / below;
    return true;
}

// Every whole number up to here is a double.
constexpr int64_t kGreatestCount = int64_t{1} << 53;

} // namespace

FrameRate::FrameRate(int code)
    : m_code(code > Unknown && code < static_cast<int>(kRates.size()) ? code : Unknown) {}

int FrameRate::numerator() const {
    return rate(m_code).numerator;
}

int FrameRate::denominator() const {
    return rate(m_code).denominator;
}

double FrameRate::framesPerSecond() const {
    return static_cast<double>(numerator()) / denominator();
}

double FrameRate::frameDuration() const {
    return valid() ? static_cast<double>(denominator()) / numerator() : 0.0;
}

int FrameRate::nominal() const {
    return rate(m_code).nominal;
}

bool FrameRate::hasDropFrame() const {
    return m_code == Fps29_97 || m_code == Fps59_94;
}

int64_t FrameRate::toFrames(double seconds) const {
    const double frames = std::round(seconds * numerator() / denominator());
    if (std::isnan(frames)) {
        return 0;
    }
    constexpr auto limit = static_cast<double>(kGreatestCount);
    if (frames >= limit) {
        return kGreatestCount;
    }
    return frames <= -limit ? -kGreatestCount : static_cast<int64_t>(frames);
}

double FrameRate::toSeconds(int64_t frames) const {
    if (!valid()) {
        return 0.0;
    }
    const int64_t count = std::clamp(frames, -kGreatestCount, kGreatestCount);
    // Below 2^53 / 1001 frames the product is exact, so that one division rounds once.
    return static_cast<double>(count) * denominator() / numerator();
}

String FrameRate::asString() const {
    return rate(m_code).text;
}

FrameRate FrameRate::fromString(std::string_view text) {
    double wanted = 0;
    if (!readNumber(String(text).trimmed(), wanted)) {
        return {};
    }
    FrameRate best;
    double bestDistance = 0.01 + 1e-9;
    for (int code = 1; code < static_cast<int>(kRates.size()); ++code) {
        const FrameRate candidate(code);
        const double distance = std::abs(candidate.framesPerSecond() - wanted);
        if (distance < bestDistance) {
            best = candidate;
            bestDistance = distance;
        }
    }
    return best;
}

FrameRate projectFrameRate() {
    return FrameRate(currentProject().frameRateCode);
}

double frameRound(double seconds) {
    const FrameRate rate = projectFrameRate();
    return rate.valid() ? rate.toSeconds(rate.toFrames(seconds)) : seconds;
}

} // namespace Qx
