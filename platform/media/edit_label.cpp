#include "platform/media/edit_label.h"

#include "platform/base/num_range.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>

namespace {

constexpr std::string_view kRevision = "LABEL_REV:1";

struct KindRow {
    UserLabelType type;
    const char* letters;
};
constexpr KindRow kKinds[] = {{kTimecodeLabelType, "TC"},
                              {kKeyKodeLabelType, "KK"},
                              {kFootFrameLabelType, "FF"},
                              {kInkCodeLabelType, "IN"}};

String scaleText(const label::Scale& scale) {
    String text;
    for (const KindRow& row : kKinds) {
        if (row.type == scale.type) {
            text = row.letters;
        }
    }
    if (scale.type == kTimecodeLabelType) {
        return text + scale.rate.asString() + (scale.dropFrame ? "DF" : "");
    }
    return text + std::to_string(static_cast<int>(scale.gauge));
}

bool scaleFromText(std::string_view text, label::Scale& scale) {
    if (text.size() < 3) {
        return false;
    }
    label::Scale read;
    for (const KindRow& row : kKinds) {
        if (text.substr(0, 2) == row.letters) {
            read.type = row.type;
        }
    }
    std::string_view rest = text.substr(2);
    if (read.type == kTimecodeLabelType) {
        read.dropFrame = rest.ends_with("DF");
        rest.remove_suffix(read.dropFrame ? 2 : 0);
        read.rate = Qx::FrameRate::fromString(rest);
    } else {
        int gauge = 0;
        if (!Qx::textToInt(rest, gauge)) {
            return false;
        }
        read.gauge = static_cast<FilmGauge>(gauge);
    }
    scale = read;
    return read.valid();
}

/// What stands before the next `separator`; moves past that.
std::string_view take(std::string_view& text, char separator) {
    const size_t end = text.find(separator);
    const std::string_view piece = text.substr(0, end);
    text = end == std::string_view::npos ? std::string_view() : text.substr(end + 1);
    return piece;
}

Qx::FrameRate filmRate() {
    return Qx::FrameRate(Qx::FrameRate::Fps24);
}

/// The pulldown between what a label counts and an edit's frames, whichever of the two is the film.
Qx::Pulldown usualPulldown(const label::Scale& scale, Qx::FrameRate rate) {
    const Qx::FrameRate counted = scale.type == kTimecodeLabelType ? scale.rate : filmRate();
    return counted.nominal() <= rate.nominal() ? Qx::Pulldown::between(counted, rate)
                                               : Qx::Pulldown::between(rate, counted);
}

} // namespace

edit_label::edit_label(const MediumRollIdent& roll, const label& first, double at, Qx::FrameRate rate)
    : m_roll(roll), m_first(first), m_at(at), m_rate(rate), m_pulldown(usualPulldown(first.scale(), rate)) {}

edit_label::edit_label(const char* keepString) {
    std::string_view tail = keepString == nullptr ? "" : keepString;
    std::string_view head = take(tail, ',');
    label::Scale scale;
    MediumRollIdent roll;
    double at = 0;
    const bool reads = scaleFromText(take(head, ' '), scale) && Qx::textToInt(take(head, ' '), roll.medium) &&
                       Qx::textToInt(take(head, ' '), roll.number) && Qx::textToDouble(take(head, ' '), at);
    const Qx::FrameRate rate = Qx::FrameRate::fromString(take(head, ' '));
    label first;
    if (!reads || !label::parse(head, scale, first)) {
        return;
    }
    edit_label made(roll, first, at, rate);
    if (tail.starts_with(kRevision)) {
        tail.remove_prefix(std::min(tail.size(), kRevision.size() + 1));
        const String mask(take(tail, ' '));
        char* end = nullptr;
        const unsigned long channels = std::strtoul(mask.c_str(), &end, 16);
        if (!mask.empty() && *end == '\0' && channels <= kAllChannels) {
            made.m_channels = static_cast<uint32_t>(channels);
        }
        static_cast<void>(Qx::Pulldown::fromString(tail, made.m_pulldown));
    }
    if (made.is_valid()) {
        made.m_toBeSaved = false;
        *this = made;
    }
}

bool edit_label::is_valid() const {
    return m_first.valid() && m_rate.valid() && std::isfinite(m_at) && m_roll.medium > kNoMedium &&
           m_roll.number >= 0;
}

String edit_label::make_keep_string() const {
    if (!is_valid()) {
        return {};
    }
    return scaleText(m_first.scale()) + String::format(" %d %d ", m_roll.medium, m_roll.number) +
           Qx::doubleToText(m_at) + " " + m_rate.asString() + " " + m_first.asString() + "," +
           String(kRevision) + String::format(" %08x ", m_channels) + m_pulldown.asString();
}

bool edit_label::labelCountsFilm() const {
    const label::Scale& scale = m_first.scale();
    return scale.type != kTimecodeLabelType || scale.rate.nominal() <= m_rate.nominal();
}

label edit_label::labelAt(double editTime) const {
    if (!is_valid() || !std::isfinite(editTime)) {
        return {};
    }
    const double passed = (editTime - m_at + Qx::kTimeTolerance) * m_rate.framesPerSecond();
    constexpr double greatest = 9007199254740992.0; // 2^53
    const auto frames = static_cast<int64_t>(std::floor(std::clamp(passed, -greatest, greatest)));
    return m_first.plus(labelCountsFilm() ? m_pulldown.filmFrame(frames) : m_pulldown.videoFrame(frames));
}

std::optional<double> edit_label::timeOf(const label& wanted) const {
    const std::optional<int64_t> frames = is_valid() ? wanted.minus(m_first) : std::nullopt;
    if (!frames) {
        return std::nullopt;
    }
    const int64_t editFrames =
        labelCountsFilm() ? m_pulldown.videoFrame(*frames) : m_pulldown.filmFrame(*frames);
    return m_at + m_rate.toSeconds(editFrames);
}
