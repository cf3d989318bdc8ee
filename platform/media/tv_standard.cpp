#include "platform/media/tv_standard.h"

#include "platform/services/current_project.h"

namespace Qx::Ed2Support {

namespace {

struct Standard {
    std::string_view text;
    TVStd codes;
};

constexpr int kFormat625 = 1;
constexpr int kFormat525 = 2;
constexpr int kMediumVideo625 = 1;
constexpr int kMediumVideo525 = 3;
constexpr int kMediumFilm23 = 23;
constexpr int kMediumFilm24 = 24;

constexpr Standard kStandards[] = {
    {"pal", {FrameRate::Fps25, kFormat625, kMediumVideo625}},
    {"ntsc", {FrameRate::Fps29_97, kFormat525, kMediumVideo525}},
    {"ntsc_drop_frame", {FrameRate::Fps29_97, kFormat525, kMediumVideo525}},
    {"pal_24", {FrameRate::Fps24, kFormat625, kMediumFilm24}},
    {"ntsc_24", {FrameRate::Fps24, kFormat525, kMediumFilm24}},
    {"ntsc_drop_frame_24", {FrameRate::Fps24, kFormat525, kMediumFilm24}},
};

// The output image rate of a project that shows 24 frame material on 525 lines.
constexpr int kOutputRate525 = 5;

} // namespace

TVStd tvStdFromText(std::string_view text) {
    const String wanted = String(text).trimmed();
    for (const Standard& standard : kStandards) {
        if (String::equalNoCase(standard.text, wanted)) {
            return standard.codes;
        }
    }
    return {};
}

TVStd getTvStandard(std::string_view text, int frameRateCode) {
    const TVStd named = tvStdFromText(text);
    if (named.known()) {
        return named;
    }
    switch (frameRateCode) {
    case FrameRate::Fps24:
        return tvStdFromText("pal_24");
    case FrameRate::Fps25:
        return tvStdFromText("pal");
    case FrameRate::Fps29_97:
        return tvStdFromText("ntsc");
    default: {
        TVStd other;
        other.frameRateCode = FrameRate(frameRateCode).code();
        return other;
    }
    }
}

String tvStdTextForProject() {
    const CurrentProject project = currentProject();
    switch (project.frameRateCode) {
    case FrameRate::Fps24:
        if (project.outputImageRate != kOutputRate525) {
            return "pal_24";
        }
        return project.dropFrame ? "ntsc_drop_frame_24" : "ntsc_24";
    case FrameRate::Fps25:
        return "pal";
    case FrameRate::Fps29_97:
        return project.dropFrame ? "ntsc_drop_frame" : "ntsc";
    default:
        return {};
    }
}

FrameRate mediumFrameRate(int mediumCode) {
    switch (mediumCode) {
    case kMediumVideo625:
        return FrameRate(FrameRate::Fps25);
    case kMediumVideo525:
        return FrameRate(FrameRate::Fps29_97);
    case kMediumFilm23:
        return FrameRate(FrameRate::Fps23_976);
    case kMediumFilm24:
        return FrameRate(FrameRate::Fps24);
    default:
        return {};
    }
}

bool isFilmMedium(int mediumCode) {
    return mediumCode == kMediumFilm23 || mediumCode == kMediumFilm24;
}

} // namespace Qx::Ed2Support
