#include "edit/inspect/edit_diff.h"

#include "edit/inspect/detail/row_diff.h"
#include "platform/base/num_range.h"

#include <algorithm>
#include <cmath>

namespace {

using Qx::kTimeTolerance;

/// The pair that plays at a time that is no cut; null where none does.
const PairReport* playing(const std::vector<PairReport>& pairs, double time) {
    const auto next = std::upper_bound(pairs.begin(), pairs.end(), time,
                                       [](double at, const PairReport& pair) { return at < pair.in; });
    return next != pairs.begin() && time < std::prev(next)->out ? &*std::prev(next) : nullptr;
}

bool isSameSource(const SourceReport& a, const SourceReport& b) {
    return a.strip == b.strip && a.kind == b.kind && a.place == b.place;
}

bool playsTheSame(const EditReport& before, const PairReport* a, const EditReport& after, const PairReport* b,
                  double time) {
    if (a == nullptr || b == nullptr) {
        return a == b;
    }
    if (!isSameSource(before.sources[a->source], after.sources[b->source])) {
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

bool isNear(double x, double y) {
    return std::abs(x - y) <= 1e-5;
}

/// How the pairs of two channels are compared (see `RowComparison`).
struct PairRules {
    const EditReport& before;
    const EditReport& after;
    const std::vector<PairReport>& was;
    const std::vector<PairReport>& now;

    [[nodiscard]] static double begin(const PairReport& pair) { return pair.in; }
    [[nodiscard]] static double end(const PairReport& pair) { return pair.out; }
    [[nodiscard]] bool same(size_t i, size_t j) const { return isNear(was[i].in, now[j].in) && alike(i, j); }
    [[nodiscard]] bool alike(size_t i, size_t j) const {
        const PairReport& a = was[i];
        const PairReport& b = now[j];
        return isNear(a.out - a.in, b.out - b.in) && isNear(a.stripIn, b.stripIn) &&
               isNear(a.stripOut, b.stripOut) && isNear(a.fadeIn, b.fadeIn) && isNear(a.fadeOut, b.fadeOut) &&
               a.velocity == b.velocity && a.begin == b.begin && a.end == b.end &&
               isSameSource(before.sources[a.source], after.sources[b.source]);
    }
    [[nodiscard]] const PairReport& pair(WhichRow row, size_t i) const {
        return row == WhichRow::Was ? was[i] : now[i];
    }
    [[nodiscard]] const SourceReport& sourceOf(WhichRow row, size_t i) const {
        return (row == WhichRow::Was ? before : after).sources[pair(row, i).source];
    }
    [[nodiscard]] size_t hash(WhichRow row, size_t i) const {
        const SourceReport& source = sourceOf(row, i);
        size_t hash = mixedHash(std::hash<cookie>()(source.strip), std::hash<std::string>()(source.place));
        hash = mixedHash(hash, timeHash(pair(row, i).stripIn));
        return mixedHash(hash, timeHash(pair(row, i).out - pair(row, i).in));
    }
    [[nodiscard]] bool isAnchor(WhichRow row, size_t i) const {
        return sourceOf(row, i).kind != SourceKind::Black;
    }
};

/// Fills in which pairs only one of the two channels has, and which have moved.
void comparePairs(const EditReport& before, const ChannelReport* a, const EditReport& after,
                  const ChannelReport* b, ChannelDiff& diff) {
    static const std::vector<PairReport> none;
    const std::vector<PairReport>& was = a != nullptr ? a->pairs : none;
    const std::vector<PairReport>& now = b != nullptr ? b->pairs : none;
    RowDiff<PairReport> found = rowDiffOf(was, now, PairRules{before, after, was, now});
    diff.removed = std::move(found.removed);
    diff.added = std::move(found.added);
    diff.moved = std::move(found.moved);
}

/// The channels by their places; levels channels, which have no pairs, are left out.
std::vector<std::pair<String, const ChannelReport*>> placesOf(const EditReport& report) {
    std::vector<std::pair<String, const ChannelReport*>> places;
    for (const ChannelReport& channel : report.channels) {
        if (!channel.isLevels()) {
            places.emplace_back(channel.place, &channel);
        }
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

String placeOf(const EditReport& report, int channel) {
    const auto index = static_cast<size_t>(channel);
    return channel >= 0 && index < report.channels.size() ? report.channels[index].place : String();
}

/// How the markers of two edits are compared (see `RowComparison`).
struct CueRules {
    const EditReport& before;
    const EditReport& after;

    [[nodiscard]] static double begin(const CueReport& cue) { return cue.time; }
    [[nodiscard]] static double end(const CueReport& cue) { return cue.time + cue.length; }
    [[nodiscard]] bool same(size_t i, size_t j) const {
        return std::abs(before.cues[i].time - after.cues[j].time) <= kTimeTolerance && alike(i, j);
    }
    [[nodiscard]] bool alike(size_t i, size_t j) const {
        const CueReport& a = before.cues[i];
        const CueReport& b = after.cues[j];
        return std::abs(a.length - b.length) <= kTimeTolerance && a.text == b.text && a.code == b.code &&
               a.attached == b.attached && placeOf(before, a.channel) == placeOf(after, b.channel);
    }
    [[nodiscard]] size_t hash(WhichRow row, size_t i) const {
        const CueReport& cue = (row == WhichRow::Was ? before : after).cues[i];
        const size_t hash = mixedHash(std::hash<std::string>()(cue.text), static_cast<size_t>(cue.code));
        return mixedHash(hash, timeHash(cue.length));
    }
    [[nodiscard]] static bool isAnchor(WhichRow, size_t) { return true; }
};

} // namespace

DiffKind diffKind(bool wasThere, bool isThere) {
    return !wasThere ? DiffKind::Added : isThere ? DiffKind::Changed : DiffKind::Removed;
}

EditDiff diffOf(const EditReport& before, const EditReport& after) {
    EditDiff diff;
    const auto old = placesOf(before);
    const auto now = placesOf(after);
    for (const auto& [name, channel] : now) {
        const ChannelReport* const was = find(old, name);
        ChannelDiff found;
        found.name = name;
        found.kind = diffKind(was != nullptr, true);
        found.endAfter = endOf(*channel);
        comparePairs(before, was, after, channel, found);
        if (was != nullptr) {
            found.spans = spansOf(before, *was, after, *channel);
            found.endBefore = endOf(*was);
        }
        if (was == nullptr || !found.spans.empty() || !found.removed.empty() || !found.added.empty() ||
            !found.moved.empty()) {
            diff.channels.push_back(std::move(found));
        }
    }
    for (const auto& [name, channel] : old) {
        if (find(now, name) == nullptr) {
            ChannelDiff found;
            found.name = name;
            found.kind = DiffKind::Removed;
            found.endBefore = endOf(*channel);
            comparePairs(before, channel, after, nullptr, found);
            diff.channels.push_back(std::move(found));
        }
    }
    diff.cuesBefore = before.cues.size();
    diff.cuesAfter = after.cues.size();
    RowDiff<CueReport> cues = rowDiffOf(before.cues, after.cues, CueRules{before, after});
    diff.cuesRemoved = std::move(cues.removed);
    diff.cuesAdded = std::move(cues.added);
    diff.cuesMoved = std::move(cues.moved);
    return diff;
}
