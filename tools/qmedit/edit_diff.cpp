#include "tools/qmedit/edit_diff.h"

#include "platform/base/num_range.h"
#include "tools/qmedit/edit_json.h"
#include "tools/qmedit/track_picture.h"

#include <algorithm>
#include <cmath>
#include <map>
#include <nlohmann/json.hpp>

namespace {

using Json = nlohmann::ordered_json;
using Qx::kTimeTolerance;

/// The pair that plays at a time that is no cut; null where none does.
const PairReport* playing(const std::vector<PairReport>& pairs, double time) {
    const auto next = std::upper_bound(pairs.begin(), pairs.end(), time,
                                       [](double at, const PairReport& pair) { return at < pair.in; });
    return next != pairs.begin() && time < std::prev(next)->out ? &*std::prev(next) : nullptr;
}

bool playsTheSame(const EditReport& before, const PairReport* a, const EditReport& after, const PairReport* b,
                  double time) {
    if (a == nullptr || b == nullptr) {
        return a == b;
    }
    if (before.sources[a->source].strip != after.sources[b->source].strip) {
        return false;
    }
    if (after.sources[b->source].kind == SourceKind::Black) {
        return true;
    }
    const auto strip = [time](const PairReport& pair) {
        return pair.stripIn + (time - pair.in) * pair.velocity;
    };
    return std::abs(strip(*a) - strip(*b)) <= 1e-5 && a->velocity == b->velocity;
}

double endOf(const ChannelReport& channel) {
    return channel.pairs.empty() ? 0 : channel.pairs.back().out;
}

std::vector<ChannelDiff::Span> spansOf(const EditReport& before, const ChannelReport& a,
                                       const EditReport& after, const ChannelReport& b) {
    std::vector<double> cuts;
    for (const auto* pairs : {&a.pairs, &b.pairs}) {
        for (const PairReport& pair : *pairs) {
            cuts.push_back(pair.in);
            cuts.push_back(pair.out);
        }
    }
    std::sort(cuts.begin(), cuts.end());
    std::vector<ChannelDiff::Span> spans;
    for (size_t i = 0; i + 1 < cuts.size(); ++i) {
        const double from = cuts[i];
        const double to = cuts[i + 1];
        const double middle = from + (to - from) / 2;
        if (to - from <= kTimeTolerance ||
            playsTheSame(before, playing(a.pairs, middle), after, playing(b.pairs, middle), middle)) {
            continue;
        }
        if (!spans.empty() && from - spans.back().to <= kTimeTolerance) {
            spans.back().to = to;
        } else {
            spans.push_back({from, to});
        }
    }
    return spans;
}

bool isSamePair(const EditReport& before, const PairReport& a, const EditReport& after, const PairReport& b) {
    const auto near = [](double x, double y) { return std::abs(x - y) <= 1e-5; };
    return near(a.in, b.in) && near(a.out, b.out) && near(a.stripIn, b.stripIn) && near(a.fadeIn, b.fadeIn) &&
           near(a.fadeOut, b.fadeOut) && a.velocity == b.velocity &&
           before.sources[a.source].strip == after.sources[b.source].strip;
}

/// Fills in which pairs only one of the two channels has, walking both in order of time.
void comparePairs(const EditReport& before, const ChannelReport* a, const EditReport& after,
                  const ChannelReport* b, ChannelDiff& diff) {
    static const std::vector<PairReport> none;
    const std::vector<PairReport>& was = a != nullptr ? a->pairs : none;
    const std::vector<PairReport>& now = b != nullptr ? b->pairs : none;
    size_t i = 0;
    size_t j = 0;
    while (i < was.size() || j < now.size()) {
        const bool both = i < was.size() && j < now.size();
        if (both && isSamePair(before, was[i], after, now[j])) {
            ++i;
            ++j;
        } else if (j == now.size() || (both && was[i].in <= now[j].in + kTimeTolerance)) {
            diff.removed.push_back(was[i++]);
        } else {
            diff.added.push_back(now[j++]);
        }
    }
}

/// The channels by their letter and place; levels channels, which have no pairs, are left out.
std::vector<std::pair<String, const ChannelReport*>> placesOf(const EditReport& report) {
    std::map<std::string, int> count;
    std::vector<std::pair<String, const ChannelReport*>> places;
    for (const ChannelReport& channel : report.channels) {
        if (channel.isLevels()) {
            continue;
        }
        const bool effects = channel.subtype == Edit_Chan_SubType::ALIAS;
        const String kind = effects ? String("FX") : String(std::string(1, channel.letter()));
        places.emplace_back(kind + std::to_string(++count[kind]), &channel);
    }
    return places;
}

const ChannelReport* find(const std::vector<std::pair<String, const ChannelReport*>>& places,
                          const String& name) {
    for (const auto& [place, channel] : places) {
        if (place == name) {
            return channel;
        }
    }
    return nullptr;
}

bool sameCues(const EditReport& before, const EditReport& after) {
    return std::equal(before.cues.begin(), before.cues.end(), after.cues.begin(), after.cues.end(),
                      [](const CueReport& a, const CueReport& b) {
                          return std::abs(a.time - b.time) <= kTimeTolerance && a.text == b.text &&
                                 a.code == b.code && a.channel == b.channel;
                      });
}

const char* kindText(ChannelDiff::Kind kind) {
    return kind == ChannelDiff::Added ? "added" : kind == ChannelDiff::Removed ? "removed" : "changed";
}

} // namespace

EditDiff diffOf(const EditReport& before, const EditReport& after) {
    EditDiff diff;
    const auto old = placesOf(before);
    const auto now = placesOf(after);
    for (const auto& [name, channel] : now) {
        const ChannelReport* const was = find(old, name);
        ChannelDiff its;
        its.name = name;
        its.kind = was != nullptr ? ChannelDiff::Changed : ChannelDiff::Added;
        its.endAfter = endOf(*channel);
        comparePairs(before, was, after, channel, its);
        if (was != nullptr) {
            its.spans = spansOf(before, *was, after, *channel);
            its.endBefore = endOf(*was);
        }
        if (was == nullptr || !its.spans.empty() || !its.removed.empty() || !its.added.empty()) {
            diff.channels.push_back(std::move(its));
        }
    }
    for (const auto& [name, channel] : old) {
        if (find(now, name) == nullptr) {
            ChannelDiff its;
            its.name = name;
            its.kind = ChannelDiff::Removed;
            its.endBefore = endOf(*channel);
            comparePairs(before, channel, after, nullptr, its);
            diff.channels.push_back(std::move(its));
        }
    }
    diff.cuesBefore = before.cues.size();
    diff.cuesAfter = after.cues.size();
    diff.cuesDiffer = !sameCues(before, after);
    return diff;
}

namespace {

String channelText(const ChannelDiff& channel, const EditReport& after) {
    String text = channel.name + "  " + kindText(channel.kind);
    for (const ChannelDiff::Span& span : channel.spans) {
        text += "  " + after.recordTimecode(span.from) + "-" + after.recordTimecode(span.to);
    }
    if (channel.kind == ChannelDiff::Added) {
        text += ", " + after.lengthText(channel.endAfter) + " long";
    } else if (channel.kind == ChannelDiff::Changed) {
        if (channel.spans.empty()) {
            text += "  only in its cuts and fades";
        }
        if (std::abs(channel.endAfter - channel.endBefore) > kTimeTolerance) {
            text += "; " + after.lengthText(channel.endBefore) + " long before, " +
                    after.lengthText(channel.endAfter) + " after";
        }
    }
    return text + "\n";
}

String pairText(char sign, const PairReport& pair, const EditReport& report, const Console& console) {
    const SourceReport& source = report.sources[pair.source];
    String text =
        String("  ") + sign + " " + report.recordTimecode(pair.in) + "-" + report.recordTimecode(pair.out);
    if (source.kind != SourceKind::Black) {
        text += "  from " + report.sourceTimecode(source, pair.stripIn);
    }
    return text + "  " + sourceLabel(source, console) + "\n";
}

String cuesText(const EditDiff& diff) {
    return diff.cuesDiffer
               ? String::format("cues  changed; %zu before, %zu after\n", diff.cuesBefore, diff.cuesAfter)
               : String();
}

} // namespace

String diffText(const EditDiff& diff, const EditReport& after) {
    String text;
    for (const ChannelDiff& channel : diff.channels) {
        text += channelText(channel, after);
    }
    return text + cuesText(diff);
}

String diffPairsText(const EditDiff& diff, const EditReport& before, const EditReport& after,
                     const Console& console) {
    String text;
    for (const ChannelDiff& channel : diff.channels) {
        text += channelText(channel, after);
        for (const PairReport& pair : channel.removed) {
            text += pairText('-', pair, before, console);
        }
        for (const PairReport& pair : channel.added) {
            text += pairText('+', pair, after, console);
        }
    }
    return text + cuesText(diff);
}

String diffJson(const EditDiff& diff, const EditReport& before, const EditReport& after) {
    Json json;
    json["same"] = diff.same();
    json["before"] = before.item.asString();
    json["after"] = after.item.asString();
    json["channels"] = Json::array();
    for (const ChannelDiff& channel : diff.channels) {
        Json its;
        its["channel"] = static_cast<const std::string&>(channel.name);
        its["change"] = kindText(channel.kind);
        its["end_before"] = before.frames(channel.endBefore);
        its["end_before_s"] = channel.endBefore;
        its["end_after"] = after.frames(channel.endAfter);
        its["end_after_s"] = channel.endAfter;
        its["spans"] = Json::array();
        for (const ChannelDiff::Span& span : channel.spans) {
            its["spans"].push_back({{"from", after.frames(span.from)},
                                    {"to", after.frames(span.to)},
                                    {"from_s", span.from},
                                    {"to_s", span.to}});
        }
        its["removed"] = Json::array();
        for (const PairReport& pair : channel.removed) {
            its["removed"].push_back(Json::parse(pairJsonText(before, pair)));
        }
        its["added"] = Json::array();
        for (const PairReport& pair : channel.added) {
            its["added"].push_back(Json::parse(pairJsonText(after, pair)));
        }
        json["channels"].push_back(std::move(its));
    }
    json["cues"] = {{"changed", diff.cuesDiffer}, {"before", diff.cuesBefore}, {"after", diff.cuesAfter}};
    return json.dump(1, ' ', false, Json::error_handler_t::replace) + "\n";
}
