#include "edit/model/cel.h"

#include "edit/model/detail/cel_events.h"

using namespace cel_detail;

namespace {

bool isUsableRange(const cel::Range& range) {
    return isUsableTime(range.start()) && isUsableTime(range.end()) && range.length() > kTolerance;
}

/// A region of one cel, by its cuts.
struct Region {
    Cut from;
    Cut to;

    Region(const EventArray& events, double start, double end)
        : from(cutAt(events, start)), to(cutAt(events, end)) {}
    [[nodiscard]] double length() const { return to.time - from.time; }
    /// Number of pairs that reach into it.
    [[nodiscard]] size_t numPairs() const { return to.pair + (to.inside ? 1 : 0) - from.pair; }
    /// True if a pair reaches out of it on either side, so that cutting the region out leaves two pieces.
    [[nodiscard]] bool splitsOnePair() const { return from.inside && to.inside && from.pair == to.pair; }
};

/// Gives the events of a part fresh stamps and notes which stamp became which.
void refresh(Events& events, size_t first, cel::IdMap& ids) {
    for (size_t i = first; i < events.size(); ++i) {
        const IdStamp fresh = channel_event::newId();
        ids.insert_or_assign(events[i].id, fresh);
        events[i].id = fresh;
    }
}

void noteSplit(cel::IdMap* splits, const IdStamp& old, const IdStamp& fresh) {
    if (splits != nullptr) {
        splits->insert_or_assign(old, fresh);
    }
}

/// Appends what is left of the pair before a cut. With `split` the rest of the pair survives elsewhere, so
/// the new out point has a stamp of its own.
void appendLeft(Events& block, const EventArray& events, const Cut& cut, bool split) {
    const channel_event& in = events[2 * cut.pair];
    channel_event out = cutOut(in, events[2 * cut.pair + 1], cut.time);
    if (split) {
        out.id = channel_event::newId();
    }
    block.push_back(in);
    block.push_back(out);
}

/// Appends what is left of the pair after a cut, so that it begins at `at`; its end moves by `shift` as all
/// that follows does.
void appendRight(Events& block, const EventArray& events, const Cut& cut, bool split, double at, double shift,
                 cel::IdMap* splits) {
    channel_event in = cutIn(events[2 * cut.pair], events[2 * cut.pair + 1], cut.time);
    channel_event out = events[2 * cut.pair + 1];
    if (split) {
        const IdStamp old = in.id;
        in.id = channel_event::newId();
        noteSplit(splits, old, in.id);
    }
    in.editTime = at;
    out.editTime = std::max(out.editTime + shift, at);
    block.push_back(in);
    block.push_back(out);
}

/// Puts `block` in the place of the events [first, last) and moves all that follow by `shift`. What then
/// counts as one with `joint`, the end of the block's span, lies at it exactly.
void splice(EventArray& events, size_t first, size_t last, const Events& block, double shift, double joint) {
    events.splice(first, last, block, shift);
    for (size_t i = first + block.size(); i < events.size() && events[i].editTime <= joint + kTolerance;
         ++i) {
        events.setTime(i, joint);
    }
}

/// Lays the material of some pairs under the events of a region: writes the region's events as they are to
/// be.
class MaterialLayer {
public:
    MaterialLayer(Events& block, const Events& laid, cel::IdMap& ids, cel::IdMap* splits)
        : m_block(block), m_laid(laid), m_ids(ids), m_splits(splits) {}

    /// What lies between two pairs of the destination is laid as it is.
    void gap(double from, double to) {
        double now = from;
        while (now < to - kTolerance && seek(now)) {
            const channel_event& in = m_laid[m_next];
            const channel_event& out = m_laid[m_next + 1];
            const double start = in.editTime <= now + kTolerance ? now : in.editTime;
            const double end = out.editTime >= to - kTolerance ? to : out.editTime;
            if (start >= to - kTolerance) {
                break;
            }
            const size_t first = m_block.size();
            m_block.push_back(start > in.editTime + kTolerance ? cutIn(in, out, start) : in);
            m_block.push_back(end < out.editTime - kTolerance ? cutOut(in, out, end) : out);
            m_block[first].editTime = start;
            m_block[first + 1].editTime = end;
            refresh(m_block, first, m_ids);
            now = end;
        }
    }

    /// The part [from, to] of a pair of the destination stays, cut where the material changes.
    void pair(const channel_event& in, const channel_event& out, double from, double to) {
        double now = from;
        do {
            const channel_event* material = nullptr;
            double end = to;
            if (seek(now)) {
                const bool plays = m_laid[m_next].editTime <= now + kTolerance;
                material = plays ? &m_laid[m_next] : nullptr;
                end = m_laid[m_next + (plays ? 1 : 0)].editTime;
            }
            end = end >= to - kTolerance ? to : end;
            piece(in, out, now, end, material);
            now = end;
        } while (now < to);
    }

private:
    /// Moves to the first laid pair that ends after a time; false if there is none.
    bool seek(double time) {
        while (m_next < m_laid.size() && m_laid[m_next + 1].editTime <= time + kTolerance) {
            m_next += 2;
        }
        return m_next < m_laid.size();
    }

    void piece(const channel_event& in, const channel_event& out, double from, double to,
               const channel_event* material) {
        channel_event first = from > in.editTime ? cutIn(in, out, from) : in;
        channel_event second = to < out.editTime ? cutOut(in, out, to) : out;
        if (from > in.editTime) {
            first.id = channel_event::newId();
            noteSplit(m_splits, in.id, first.id);
        }
        if (to < out.editTime) {
            second.id = channel_event::newId();
        }
        first.strip = second.strip = material != nullptr ? material->strip : black_cookie;
        first.velocity = second.velocity = material != nullptr ? material->velocity : 1;
        first.stripTime = material != nullptr ? stripAt(*material, from) : 0;
        second.stripTime = stripAt(first, to);
        m_block.push_back(first);
        m_block.push_back(second);
    }

    Events& m_block;
    const Events& m_laid;
    size_t m_next = 0;
    cel::IdMap& m_ids;
    cel::IdMap* m_splits;
};

/// The events of a region of `events` with the material of `laid` under them.
void layMaterial(Events& block, const EventArray& events, const Region& region, const Events& laid,
                 cel::IdMap& ids, cel::IdMap* splits) {
    MaterialLayer layer(block, laid, ids, splits);
    double now = region.from.time;
    const size_t end = region.from.pair + region.numPairs();
    for (size_t pair = region.from.pair; pair < end; ++pair) {
        const channel_event& in = events[2 * pair];
        const channel_event& out = events[2 * pair + 1];
        const double from = std::max(in.editTime, region.from.time);
        const double to = std::min(out.editTime, region.to.time);
        layer.gap(now, from);
        layer.pair(in, out, from, to);
        now = to;
    }
    layer.gap(now, region.to.time);
}

} // namespace

namespace cel_detail {

void appendPart(Events& part, const EventArray& source, const Cut& first, const Cut& last, double from,
                double to) {
    const auto moved = [&](double time) {
        if (time <= first.time) {
            return from;
        }
        return time >= last.time ? to : std::clamp(from + (time - first.time), from, to);
    };
    const size_t end = last.pair + (last.inside ? 1 : 0);
    for (size_t pair = first.pair; pair < end; ++pair) {
        const channel_event& in = source[2 * pair];
        const channel_event& out = source[2 * pair + 1];
        part.push_back(pair == first.pair && first.inside ? cutIn(in, out, first.time) : in);
        part.push_back(pair == last.pair && last.inside ? cutOut(in, out, last.time) : out);
        part[part.size() - 2].editTime = moved(part[part.size() - 2].editTime);
        part.back().editTime = moved(part.back().editTime);
    }
}

} // namespace cel_detail

std::unique_ptr<cel> cel::extract(double from, double to, unsigned flags) const {
    if (!isUsableTime(from) || !isUsableTime(to) || !(to - from > kTolerance) || m_events.size() % 2 != 0) {
        return nullptr;
    }
    const Region region(m_events, from, to);
    const double start = (flags & KeepTimes) != 0 ? region.from.time : 0;
    auto part = std::make_unique<cel>();
    part->m_resolution = m_resolution;
    Events events;
    events.reserve(2 * region.numPairs());
    appendPart(events, m_events, region.from, region.to, start, start + region.length());
    part->m_events.assign(std::move(events));
    part->changedNow();
    return part;
}

bool cel::insert(const cel* source, const Range& sourceRange, double at, IdMap& ids, IdMap* splits) {
    if (source == nullptr || !isUsableRange(sourceRange) || !isUsableTime(at) || m_events.size() % 2 != 0 ||
        source->m_events.size() % 2 != 0) {
        return false;
    }
    const Region part(source->m_events, sourceRange.start(), sourceRange.end());
    const Cut cut = cutAt(m_events, at);
    const double length = part.length();
    const double joint = cut.time + length;
    if (!isUsableTime(std::max(get_end_time(), cut.time) + length)) {
        return false;
    }
    Events block;
    block.reserve(2 * part.numPairs() + 4);
    if (cut.inside) {
        appendLeft(block, m_events, cut, true);
    }
    const size_t first = block.size();
    appendPart(block, source->m_events, part.from, part.to, cut.time, joint);
    refresh(block, first, ids);
    if (cut.inside) {
        appendRight(block, m_events, cut, true, joint, length, splits);
    }
    splice(m_events, 2 * cut.pair, 2 * (cut.pair + (cut.inside ? 1 : 0)), block, length, joint);
    changedNow();
    return true;
}

bool cel::remove(const Range& range, IdMap* splits) {
    if (!isUsableRange(range) || m_events.size() % 2 != 0) {
        return false;
    }
    const Region region(m_events, range.start(), range.end());
    Events block;
    block.reserve(4);
    if (region.from.inside) {
        appendLeft(block, m_events, region.from, region.splitsOnePair());
    }
    if (region.to.inside) {
        appendRight(block, m_events, region.to, region.splitsOnePair(), region.from.time, -region.length(),
                    splits);
    }
    const size_t last = region.from.pair + region.numPairs();
    if (region.numPairs() > 0 || 2 * last < m_events.size()) {
        splice(m_events, 2 * region.from.pair, 2 * last, block, -region.length(), region.from.time);
        changedNow();
    }
    return true;
}

bool cel::replace(const cel* source, const Range& sourceRange, double at, IdMap& ids, bool materialOnly,
                  IdMap* splits) {
    if (source == nullptr || !isUsableRange(sourceRange) || !isUsableTime(at) ||
        !isUsableTime(at + sourceRange.length()) || m_events.size() % 2 != 0 ||
        source->m_events.size() % 2 != 0) {
        return false;
    }
    const Region part(source->m_events, sourceRange.start(), sourceRange.end());
    const Region region(m_events, at, at + sourceRange.length());
    if (part.length() <= kTolerance || region.length() <= kTolerance) {
        return false;
    }
    Events block;
    block.reserve(2 * (part.numPairs() + (materialOnly ? 2 * region.numPairs() : 0)) + 4);
    const bool apart = materialOnly || region.splitsOnePair();
    if (region.from.inside) {
        appendLeft(block, m_events, region.from, apart);
    }
    if (materialOnly) {
        Events laid;
        laid.reserve(2 * part.numPairs());
        appendPart(laid, source->m_events, part.from, part.to, region.from.time, region.to.time);
        layMaterial(block, m_events, region, laid, ids, splits);
    } else {
        const size_t first = block.size();
        appendPart(block, source->m_events, part.from, part.to, region.from.time, region.to.time);
        refresh(block, first, ids);
    }
    if (region.to.inside) {
        appendRight(block, m_events, region.to, apart, region.to.time, 0, splits);
    }
    splice(m_events, 2 * region.from.pair, 2 * (region.from.pair + region.numPairs()), block, 0,
           region.to.time);
    changedNow();
    return true;
}

bool cel::weld(const cel* other, double at) {
    if (other == nullptr || !isUsableTime(at) || m_events.size() % 2 != 0 ||
        other->m_events.size() % 2 != 0) {
        return false;
    }
    const double end = get_end_time();
    const double start = at + other->get_start_time();
    if (!isUsableTime(start) || !isUsableTime(at + other->get_end_time()) ||
        (!m_events.empty() && !other->m_events.empty() && start < end - kTolerance)) {
        return false;
    }
    std::vector<IdStamp> taken;
    taken.reserve(m_events.size());
    for (const channel_event& event : m_events) {
        taken.push_back(event.id);
    }
    std::sort(taken.begin(), taken.end());
    const size_t count = other->m_events.size();
    m_events.reserve(m_events.size() + count);
    const double least = m_events.empty() ? -kGreatestTime : start < end + kTolerance ? end : start;
    for (size_t i = 0; i < count; ++i) {
        channel_event event = other->m_events[i];
        event.editTime += at;
        if (event.editTime < least || event.editTime <= end + kTolerance) {
            event.editTime = std::max(event.editTime, least);
        }
        if (std::binary_search(taken.begin(), taken.end(), event.id)) {
            event.id = channel_event::newId();
        }
        m_events.append(event);
    }
    if (count > 0) {
        changedNow();
    }
    return true;
}
