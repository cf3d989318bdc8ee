#include "platform/media/label.h"

#include "platform/media/timecode.h"

#include <algorithm>

namespace {

constexpr int64_t kGreatestFrame = int64_t{1} << 53;

void appendPadded(String& text, int64_t number, int digits) {
    char figures[20];
    int length = 0;
    do {
        figures[length++] = static_cast<char>('0' + number % 10);
        number /= 10;
    } while (number > 0 || length < digits);
    while (length > 0) {
        text += figures[--length];
    }
}

} // namespace

bool label::Scale::valid() const {
    switch (type) {
    case kTimecodeLabelType:
        return rate.valid() && (!dropFrame || rate.hasDropFrame());
    case kKeyKodeLabelType:
    case kFootFrameLabelType:
    case kInkCodeLabelType:
        return Qx::perforationsPerFrame(gauge) > 0;
    default:
        return false;
    }
}

label::label(const Scale& scale, int64_t frames) {
    if (scale.valid() && (scale.type == kTimecodeLabelType || scale.type == kFootFrameLabelType)) {
        m_scale = scale;
        *this = plus(frames);
    }
}

Qx::FilmCount label::count() const {
    const auto unit = m_scale.type == kKeyKodeLabelType ? Qx::FilmCount::KeyNumber : Qx::FilmCount::Foot;
    return {m_scale.gauge, unit, m_pattern};
}

int64_t label::countLimit() const {
    return m_scale.type == kInkCodeLabelType && m_digits == 5 ? 100000 : 10000;
}

bool label::isAmbiguous() const {
    if (m_scale.type != kKeyKodeLabelType && m_scale.type != kInkCodeLabelType) {
        return false;
    }
    const int64_t shown = count().countOf(m_frames);
    return shown < 0 || shown >= countLimit();
}

void label::wrapDay() {
    const int64_t day = Qx::framesPerDay(m_scale.rate, m_scale.dropFrame);
    m_frames = (m_frames % day + day) % day;
}

label label::plus(int64_t frames) const {
    label moved = *this;
    if (valid()) {
        // Both are within 2^53, so the sum is exact.
        moved.m_frames = std::clamp(m_frames + std::clamp(frames, -kGreatestFrame, kGreatestFrame),
                                    -kGreatestFrame, kGreatestFrame);
        if (m_scale.type == kTimecodeLabelType) {
            moved.wrapDay();
        }
    }
    return moved;
}

std::optional<int64_t> label::minus(const label& other) const {
    if (!valid() || m_scale != other.m_scale || prefix() != other.prefix() || m_pattern != other.m_pattern) {
        return std::nullopt;
    }
    int64_t distance = m_frames - other.m_frames;
    if (m_scale.type == kTimecodeLabelType) {
        const int64_t day = Qx::framesPerDay(m_scale.rate, m_scale.dropFrame);
        if (distance > day / 2) {
            distance -= day;
        } else if (distance < -(day / 2)) {
            distance += day;
        }
    }
    return distance;
}

void label::appendCount(String& text) const {
    const bool isFootFrame = m_scale.type == kFootFrameLabelType;
    const Qx::FilmCount counted = count();
    const int64_t frames = isFootFrame && m_frames < 0 ? -m_frames : m_frames;
    const int64_t number = counted.countOf(frames);
    const int64_t limit = countLimit();
    const int64_t shown = isFootFrame ? number : (number % limit + limit) % limit;
    if (frames != m_frames) {
        text += '-';
    }
    appendPadded(text, shown, isFootFrame ? 1 : limit == 100000 ? 5 : 4);
    text += '+';
    appendPadded(text, frames - counted.firstFrameOf(number), 2);
    if (m_showsPerforations) {
        text += '.';
        appendPadded(text, m_perforations, 1);
    }
    if (m_showsPlace) {
        text += '(';
        appendPadded(text, counted.placeOf(number), 1);
        text += ')';
    }
}

String label::asString(Style style) const {
    String text;
    switch (m_scale.type) {
    case kTimecodeLabelType:
        return Qx::timecodeText(m_frames, m_scale.rate, m_scale.dropFrame);
    case kKeyKodeLabelType:
        for (size_t i = 0; i < m_prefixLength; ++i) {
            if (style == Spaced && (i == 2 || i == 4)) {
                text += ' ';
            }
            text += m_prefix[i];
        }
        text += ' ';
        break;
    case kInkCodeLabelType:
        text += prefix();
        if (m_spaced) {
            text += ' ';
        }
        break;
    case kFootFrameLabelType:
        break;
    default:
        return text;
    }
    appendCount(text);
    return text;
}

const char* UserLabelType_to_UserString(UserLabelType type) {
    switch (type) {
    case kTimecodeLabelType:
        return "Timecode";
    case kKeyKodeLabelType:
        return "KeyKode";
    case kFootFrameLabelType:
        return "Foot/frame";
    case kInkCodeLabelType:
        return "Inkcode";
    default:
        return "";
    }
}
