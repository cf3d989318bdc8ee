#pragma once

#include "edit/model/cel.h"

#include <cmath>
#include <set>
#include <string>
#include <string_view>

/// Cels drawn as text: one character a second, a letter a source, '.' black, ' ' a gap. A change of character
/// is a cut; '|' is a cut between two seconds of one source.
namespace layout {

inline cookie sourceOf(char letter) {
    return letter == '.' ? black_cookie : cookie(Cookie_Type::Material, letter, 7);
}

inline char letterOf(const cookie& source) {
    return source.isBlack() ? '.' : static_cast<char>(source.word(0));
}

/// Appends the drawn pairs to a cel, the drawing's start at 0. A pair of material plays its source from
/// `offset` seconds after the edit time.
inline void build(cel& its, std::string_view drawing, double offset = 0) {
    double time = 0;
    for (size_t i = 0; i < drawing.size();) {
        const char letter = drawing[i];
        if (letter == '|') {
            ++i;
            continue;
        }
        double length = 0;
        for (; i < drawing.size() && drawing[i] == letter; ++i) {
            ++length;
        }
        if (letter != ' ') {
            its.appendEventPair(sourceOf(letter), letter == '.' ? 0 : time + offset, time, length);
        }
        time += length;
    }
}

inline cel make(std::string_view drawing, double offset = 0) {
    cel made;
    build(made, drawing, offset);
    return made;
}

/// Draws a cel whose cuts lie on whole seconds from 0 on; "off second t" for one whose do not.
inline std::string draw(const cel& its) {
    std::string drawing;
    long end = 0;
    for (int i = 0; i + 1 < its.numEvents(); i += 2) {
        const channel_event in = its.get_event(i);
        const channel_event out = its.get_event(i + 1);
        const long from = std::lround(in.editTime);
        const long to = std::lround(out.editTime);
        for (const channel_event& event : {in, out}) {
            if (std::abs(event.editTime - std::round(event.editTime)) > 1e-5) {
                return "off second " + std::to_string(event.editTime);
            }
        }
        if (from == end && !drawing.empty() && drawing.back() == letterOf(in.strip)) {
            drawing += '|';
        }
        drawing.append(static_cast<size_t>(from - end), ' ');
        drawing.append(static_cast<size_t>(to - from), letterOf(in.strip));
        end = to;
    }
    return drawing;
}

/// What is wrong with a cel, or nothing: inconsistent, a stamp used twice, a pair or a gap of less than
/// `leastStep` seconds (a pair of no length too), strip times that do not agree with the velocity.
inline std::string faultOf(const cel& its, double leastStep = Qx::kTimeTolerance) {
    if (its.is_good_cel() == 0) {
        return "not a good cel";
    }
    std::set<IdStamp> stamps;
    for (int i = 0; i < its.numEvents(); ++i) {
        const channel_event event = its.get_event(i);
        const channel_event before = i > 0 ? its.get_event(i - 1) : channel_event();
        const double step = event.editTime - before.editTime;
        const bool isOut = i % 2 != 0;
        if (!stamps.insert(event.id).second) {
            return "the stamp of event " + std::to_string(i) + " is used twice";
        }
        if (i > 0 && (isOut || step != 0) && step < leastStep) {
            return "a sliver before event " + std::to_string(i) + " at " + std::to_string(event.editTime);
        }
        if (isOut && std::abs(before.stripTime + step * before.velocity - event.stripTime) > 1e-3) {
            return "strip times of the pair of event " + std::to_string(i) + " disagree";
        }
    }
    return "";
}

/// The last digit of the strip second that each second plays, '.' for black, ' ' for a gap.
inline std::string drawStrips(const cel& its) {
    std::string drawing;
    for (double time = 0; time < its.get_end_time() - 0.5; ++time) {
        const cookie source = its.get_strip_cookie(time);
        if (!source.is_valid() || source.isBlack()) {
            drawing += source.isBlack() ? '.' : ' ';
        } else {
            const long second = std::lround(its.get_strip_time(time));
            drawing += static_cast<char>('0' + ((second % 10) + 10) % 10);
        }
    }
    return drawing;
}

} // namespace layout
