#include "tools/qmedit/edit_place.h"

#include "platform/media/timecode.h"

#include <algorithm>
#include <cmath>

namespace {

/// Times in texts are those of a feature, not of the universe.
constexpr double kGreatest = 1e8;

bool isDigits(std::string_view text) {
    return !text.empty() && text.size() <= 12 &&
           std::all_of(text.begin(), text.end(), [](char c) { return c >= '0' && c <= '9'; });
}

/// True for what is meant as times, or left out where they should stand.
bool beginsTime(const String& text) {
    return text.empty() || text.front() == '-' || isDigits(text.substr(0, 1));
}

} // namespace

Qx::Status parsePlace(const String& text, EditPlace& place) {
    place = {};
    const size_t at = text.rfind('@');
    if (at == String::npos || !beginsTime(text.substr(at + 1))) {
        place.name = text;
        return {};
    }
    place.name = text.substr(0, at);
    const String times = text.substr(at + 1);
    const size_t dash = times.find('-');
    place.in = times.substr(0, dash);
    place.out = dash == String::npos ? String() : String(times.substr(dash + 1));
    if ((place.in.empty() && place.out.empty()) || (dash != String::npos && place.out.empty())) {
        return Qx::Status::failure("'" + text +
                                   "' lacks a time; write COOKIE@IN, COOKIE@IN-OUT or COOKIE@-OUT");
    }
    return {};
}

Qx::Status parseEditTime(const String& text, const EditReport& report, double& seconds) {
    const String digits = text.substr(0, text.empty() ? 0 : text.size() - 1);
    double number = 0;
    // A shot's times are those of its material's clock; what users count begins with the shot.
    const double begin = report.type == kLogShot ? report.start : 0;
    if (!text.empty() && text.back() == 'f' && isDigits(digits) && Qx::textToDouble(digits, number)) {
        seconds = begin + report.rate.toSeconds(static_cast<int64_t>(number));
    } else if (!text.empty() && text.back() == 's' && Qx::textToDouble(digits, number) && number >= 0) {
        seconds = begin + number;
    } else {
        Qx::TimecodeFields fields;
        if (const Qx::Status read = Qx::parseTimecode(text, report.rate, fields); !read) {
            return Qx::Status::failure("'" + text + "' is no time (" + read.reason() +
                                       "); write timecode (10:00:05:00), frames (125f) or seconds (5s)");
        }
        const int64_t frames = Qx::timecodeFrames(fields, report.rate, report.dropFrame);
        seconds = report.rate.toSeconds(frames - report.frames(report.origin));
        if (seconds < 0) {
            return Qx::Status::failure("'" + text + "' lies before the edit's start, " +
                                       report.recordTimecode(0));
        }
    }
    return std::isfinite(seconds) && seconds <= kGreatest
               ? Qx::Status()
               : Qx::Status::failure("'" + text + "' is too great a time");
}

const ChannelReport* findChannel(const EditReport& report, const String& place) {
    for (const ChannelReport& channel : report.channels) {
        if (!channel.isLevels() && String::equalNoCase(channel.place, place)) {
            return &channel;
        }
    }
    return nullptr;
}
