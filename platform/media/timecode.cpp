#include "platform/media/timecode.h"

#include <algorithm>
#include <cstdlib>

namespace Qx {

namespace {

// Labels that drop frame skips at the start of a minute whose number is not a multiple of ten.
int droppedLabels(FrameRate rate) {
    return rate.nominal() / 15;
}

bool drops(FrameRate rate, bool dropFrame) {
    return dropFrame && rate.hasDropFrame();
}

struct Label {
    int64_t hours;
    int minutes;
    int seconds;
    int frames;
};

// The label of a count that is not negative; hours do not wrap.
Label labelOf(int64_t frames, FrameRate rate, bool dropFrame) {
    const int64_t nominal = rate.nominal();
    if (drops(rate, dropFrame)) {
        const int64_t dropped = droppedLabels(rate);
        const int64_t perMinute = 60 * nominal - dropped;
        const int64_t perTenMinutes = 600 * nominal - 9 * dropped;
        const int64_t tens = frames / perTenMinutes;
        const int64_t within = frames % perTenMinutes;
        // The first minute of the ten keeps all its labels.
        const int64_t minutesWithin = within < 60 * nominal ? 0 : 1 + (within - 60 * nominal) / perMinute;
        frames += dropped * (9 * tens + minutesWithin);
    }
    const int64_t seconds = frames / nominal;
    return {seconds / 3600, static_cast<int>(seconds / 60 % 60), static_cast<int>(seconds % 60),
            static_cast<int>(frames % nominal)};
}

void appendTwoDigits(String& text, int number) {
    text += static_cast<char>('0' + number / 10);
    text += static_cast<char>('0' + number % 10);
}

// Without `printf`: reports and lists show a timecode or four in every line.
String labelText(const Label& label, bool dropFrame) {
    String text;
    if (label.hours < 100) {
        appendTwoDigits(text, static_cast<int>(label.hours));
    } else {
        text += std::to_string(label.hours);
    }
    text += ':';
    appendTwoDigits(text, label.minutes);
    text += ':';
    appendTwoDigits(text, label.seconds);
    text += dropFrame ? ';' : ':';
    appendTwoDigits(text, label.frames);
    return text;
}

// Reads at most two digits at `at` and moves past them.
bool readField(std::string_view text, size_t& at, int& field) {
    const size_t first = at;
    field = 0;
    while (at < text.size() && at < first + 2 && text[at] >= '0' && text[at] <= '9') {
        field = field * 10 + (text[at] - '0');
        ++at;
    }
    return at > first;
}

bool isSeparator(char c) {
    return c == ':' || c == ';' || c == ',' || c == '.';
}

// Text from outside, made fit for a message of one line.
String quoted(std::string_view text) {
    String shown;
    for (const char c : text.substr(0, 40)) {
        shown += c >= ' ' && c <= '~' ? c : '?';
    }
    return "\"" + shown + (text.size() > 40 ? "...\"" : "\"");
}

Status readFields(std::string_view text, TimecodeFields& fields) {
    size_t at = 0;
    int* const parts[] = {&fields.hours, &fields.minutes, &fields.seconds, &fields.frames};
    bool good = true;
    for (int part = 0; part < 4 && good; ++part) {
        good = readField(text, at, *parts[part]);
        if (good && part < 3) {
            good = at < text.size() && isSeparator(text[at]);
            if (good && part == 2) {
                fields.dropSeparator = text[at] == ';' || text[at] == ',';
                fields.nonDropSeparator = text[at] == '.';
            }
            ++at;
        }
    }
    if (!good || at != text.size()) {
        return Status::failure(StatusCode::BadArgument,
                               quoted(text) + " is not a timecode of the form hh:mm:ss:ff");
    }
    return {};
}

} // namespace

String timecodeText(int64_t frames, FrameRate rate, bool dropFrame) {
    if (!rate.valid()) {
        return {};
    }
    const int64_t day = framesPerDay(rate, dropFrame);
    const int64_t within = (frames % day + day) % day;
    return labelText(labelOf(within, rate, dropFrame), drops(rate, dropFrame));
}

String durationText(int64_t frames, FrameRate rate, bool dropFrame) {
    if (!rate.valid()) {
        return {};
    }
    constexpr int64_t greatest = int64_t{1} << 53;
    const int64_t length = frames < -greatest ? greatest : std::min(std::abs(frames), greatest);
    return (frames < 0 ? "-" : "") + labelText(labelOf(length, rate, dropFrame), drops(rate, dropFrame));
}

Status parseTimecode(std::string_view text, FrameRate rate, TimecodeFields& fields) {
    TimecodeFields read;
    if (Status status = readFields(text, read); !status) {
        return status;
    }
    const auto outOfRange = [text](const String& what, StatusCode code = StatusCode::BadArgument) {
        return Status::failure(code, what + " in timecode " + quoted(text));
    };
    if (read.hours > 23) {
        return outOfRange(String::format("hour %d above 23", read.hours));
    }
    if (read.minutes > 59) {
        return outOfRange(String::format("minute %d above 59", read.minutes));
    }
    if (read.seconds > 59) {
        return outOfRange(String::format("second %d above 59", read.seconds));
    }
    if (read.frames >= rate.nominal()) {
        return outOfRange(String::format("frame %d at %s frames a second", read.frames,
                                         rate.valid() ? rate.asString().c_str() : "an unknown number of"),
                          StatusCode::Unsupported);
    }
    fields = read;
    return {};
}

Status parseDuration(std::string_view text, FrameRate rate, bool dropFrame, int64_t& frames) {
    constexpr int mostHours = 10'000'000;
    const bool negative = text.starts_with('-');
    const std::string_view label = text.substr(negative ? 1 : 0);
    const std::string_view hours = label.substr(0, label.find(':'));
    TimecodeFields fields;
    int count = 0;
    if (hours.size() == label.size() || hours.starts_with('-') || !textToInt(hours, count) ||
        count > mostHours) {
        return Status::failure(StatusCode::BadArgument,
                               quoted(text) + " is not a length of the form hh:mm:ss:ff");
    }
    if (Status status = parseTimecode("00" + String(label.substr(hours.size())), rate, fields); !status) {
        return status;
    }
    fields.hours = count;
    frames = (negative ? -1 : 1) * timecodeFrames(fields, rate, dropFrame);
    return {};
}

int64_t timecodeFrames(const TimecodeFields& fields, FrameRate rate, bool dropFrame, bool* skipped) {
    const int64_t nominal = rate.nominal();
    const int64_t minutes = int64_t{60} * fields.hours + fields.minutes;
    int64_t labelFrames = fields.frames;
    bool moved = false;
    int64_t dropped = 0;
    if (drops(rate, dropFrame)) {
        const int perMinute = droppedLabels(rate);
        if (fields.seconds == 0 && fields.minutes % 10 != 0 && fields.frames < perMinute) {
            labelFrames = perMinute;
            moved = true;
        }
        dropped = perMinute * (minutes - minutes / 10);
    }
    if (skipped != nullptr) {
        *skipped = moved;
    }
    return (60 * minutes + fields.seconds) * nominal + labelFrames - dropped;
}

int64_t framesPerDay(FrameRate rate, bool dropFrame) {
    const int64_t all = int64_t{24} * 3600 * rate.nominal();
    return drops(rate, dropFrame) ? all - int64_t{droppedLabels(rate)} * 24 * 54 : all;
}

} // namespace Qx
