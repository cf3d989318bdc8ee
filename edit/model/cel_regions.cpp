#include "edit/model/cel.h"

#include "edit/model/detail/cel_events.h"

using namespace cel_detail;

namespace {

/// The stamp of what was copied or cut from an event. One that shows a channel has that channel's; any other
/// gets a fresh one, of one that shows an effect a node's again.
IdStamp freshLike(const IdStamp& old) {
    if (old.valid() && old.getMagicType() == IdStampMagic::Channel) {
        return old;
    }
    const bool isEffect = old.valid() && old.getMagicType() == IdStampMagic::EffectNode;
    return IdStamp::fresh(isEffect ? IdStampMagic::EffectNode : IdStampMagic::Material);
}

/// Gives the events of a part fresh stamps and notes which stamp became which.
void refresh(Events& events, size_t first, cel::IdMap& ids) {
    for (size_t i = first; i < events.size(); ++i) {
        const IdStamp fresh = freshLike(events[i].id);
        ids.insert_or_assign(events[i].id, fresh);
        events[i].id = fresh;
    }
}

void noteSplit(cel::Splits* splits, const IdStamp& old, const IdStamp& fresh) {
    if (splits != nullptr) {
        splits->emplace(old, fresh);
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
                 cel::Splits* splits) {
    channel_event in = cutIn(events[2 * cut.pair], events[2 * cut.pair + 1], cut.time);
    channel_event out = events[2 * cut.pair + 1];
    in.editTime = at;
    out.editTime += shift;
    if (isNotPast(out.editTime, at)) {
        return; // rounding left nothing of it
    }
    if (split) {
        const IdStamp old = in.id;
        in.id = freshLike(old);
        noteSplit(splits, old, in.id);
    }
    block.push_back(in);
    block.push_back(out);
}

/// Lays the material of some pairs under the events of a region: writes the region's events as they are to
/// be.
class MaterialLayer {
public:
    MaterialLayer(Events& block, const Events& laid, cel::IdMap& ids, cel::Splits* splits)
        : m_block(block), m_laid(laid), m_ids(ids), m_splits(splits) {}

    /// What lies between two pairs of the destination is laid as it is.
    void gap(double from, double to) {
        double now = from;
        while (!isNotPast(to, now) && seek(now)) {
            const channel_event& in = m_laid[m_next];
            const channel_event& out = m_laid[m_next + 1];
            const double start = isNotPast(in.editTime, now) ? now : in.editTime;
            const double end = isNotPast(to, out.editTime) ? to : out.editTime;
            if (isNotPast(to, start)) {
                break;
            }
            const size_t first = m_block.size();
            m_block.push_back(isNotPast(start, in.editTime) ? in : cutIn(in, out, start));
            m_block.push_back(isNotPast(out.editTime, end) ? out : cutOut(in, out, end));
            m_block[first].editTime = start;
            m_block[first + 1].editTime = end;
            giveStamps(first);
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
                const bool plays = isNotPast(m_laid[m_next].editTime, now);
                material = plays ? &m_laid[m_next] : nullptr;
                end = m_laid[m_next + (plays ? 1 : 0)].editTime;
            }
            end = isNotPast(to, end) ? to : end;
            piece(in, out, now, end, material);
            now = end;
        } while (now < to);
    }

private:
    /// Moves to the first laid pair that ends after a time; false if there is none.
    bool seek(double time) {
        while (m_next < m_laid.size() && isNotPast(m_laid[m_next + 1].editTime, time)) {
            m_next += 2;
        }
        return m_next < m_laid.size();
    }

    /// The stamps of the pair of the source that was just laid. The first piece of it counts as its copy;
    /// what is laid of it in further gaps, as split from that.
    void giveStamps(size_t first) {
        if (m_copied == m_next + 1) {
            m_block[first].id = freshLike(m_copy);
            m_block[first + 1].id = channel_event::newId();
            noteSplit(m_splits, m_copy, m_block[first].id);
            return;
        }
        refresh(m_block, first, m_ids);
        m_copied = m_next + 1;
        m_copy = m_block[first].id;
    }

    void piece(const channel_event& in, const channel_event& out, double from, double to,
               const channel_event* material) {
        channel_event first = from > in.editTime ? cutIn(in, out, from) : in;
        channel_event second = to < out.editTime ? cutOut(in, out, to) : out;
        if (from > in.editTime) {
            first.id = freshLike(in.id);
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
    size_t m_copied = 0; ///< 1 + place of the laid pair that was copied last
    IdStamp m_copy;      ///< and the stamp of the copy's in point
    cel::IdMap& m_ids;
    cel::Splits* m_splits;
};

/// The events of a region of `events` with the material of `laid` under them.
void layMaterial(Events& block, const EventArray& events, const Region& region, const Events& laid,
                 cel::IdMap& ids, cel::Splits* splits) {
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

namespace {

/// Lays all times anew.
void settle(Events& events) {
    Events settled;
    settled.reserve(events.size());
    TimeLayer layer;
    for (size_t i = 0; i < events.size(); i += 2) {
        channel_event in = events[i];
        channel_event out = events[i + 1];
        const bool hadLength = in.editTime < out.editTime;
        in.editTime = layer.lay(in.editTime);
        out.editTime = layer.lay(out.editTime);
        appendLaid(settled, in, out, hadLength);
    }
    events.swap(settled);
}

} // namespace

void appendPart(Events& part, const EventArray& source, const Region& region, double from, double to) {
    TimeLayer layer(from, to);
    const auto moved = [&](double time) {
        return layer.lay(from == region.from.time ? time : from + (time - region.from.time));
    };
    const Cut& first = region.from;
    const Cut& last = region.to;
    for (size_t pair = first.pair; pair < first.pair + region.numPairs(); ++pair) {
        const channel_event& wholeIn = source[2 * pair];
        const channel_event& wholeOut = source[2 * pair + 1];
        channel_event in =
            pair == first.pair && first.inside ? cutIn(wholeIn, wholeOut, first.time) : wholeIn;
        channel_event out =
            pair == last.pair && last.inside ? cutOut(wholeIn, wholeOut, last.time) : wholeOut;
        const bool hadLength = in.editTime < out.editTime;
        in.editTime = moved(in.editTime);
        out.editTime = out.editTime < last.time ? moved(out.editTime) : to;
        appendLaid(part, in, out, hadLength);
    }
}

void spliceShifted(EventArray& events, size_t first, size_t last, std::span<const channel_event> block,
                   double shift, double joint) {
    bool apart = events.splice(first, last, block, shift);
    size_t next = first + block.size();
    if (next < events.size() && isNotPast(events[next].editTime, joint)) {
        const double rounded = events[next].editTime;
        for (; next < events.size() && events[next].editTime == rounded; ++next) {
            events.setTime(next, joint);
        }
    }
    if (next > 0 && next < events.size()) {
        const double ahead = events[next - 1].editTime;
        apart = apart && (events[next].editTime == ahead || !isNotPast(events[next].editTime, ahead));
    }
    if (!apart) {
        settle(EventArray::Rewrite(events).events());
    }
}

} // namespace cel_detail

std::unique_ptr<cel> cel::extract(double from, double to, unsigned flags) const {
    if (!isUsableTime(from) || !isUsableTime(to) || isNotPast(to, from) || m_events.size() % 2 != 0) {
        return nullptr;
    }
    const Region region(m_events, from, to);
    if (region.empty()) {
        return nullptr;
    }
    const bool stays = (flags & KeepTimes) != 0;
    auto part = std::make_unique<cel>();
    part->m_resolution = m_resolution;
    Events events;
    events.reserve(2 * region.numPairs());
    appendPart(events, m_events, region, stays ? region.from.time : 0,
               stays ? region.to.time : region.length());
    if (!events.empty() && !isUsableTime(events.back().editTime)) {
        return nullptr;
    }
    part->m_events.assign(std::move(events));
    part->changedNow();
    return part;
}

bool cel::insert(const cel* source, const Range& sourceRange, double at, IdMap& ids, Splits* splits) {
    if (source == nullptr || !isUsableRange(sourceRange) || !isUsableTime(at) || m_events.size() % 2 != 0 ||
        source->m_events.size() % 2 != 0) {
        return false;
    }
    const Region part(source->m_events, sourceRange.start(), sourceRange.end());
    const Cut cut = cutAt(m_events, at);
    const double length = part.length();
    const double joint = cut.time + length;
    if (part.empty() || isNotPast(joint, cut.time) ||
        !isUsableTime(std::max(get_end_time(), cut.time) + length)) {
        return false;
    }
    Events block;
    block.reserve(2 * part.numPairs() + 4);
    if (cut.inside) {
        appendLeft(block, m_events, cut, true);
    }
    const size_t first = block.size();
    appendPart(block, source->m_events, part, cut.time, joint);
    refresh(block, first, ids);
    if (cut.inside) {
        appendRight(block, m_events, cut, true, joint, length, splits);
    }
    spliceShifted(m_events, 2 * cut.pair, 2 * (cut.pair + (cut.inside ? 1 : 0)), block, length, joint);
    changedNow();
    return true;
}

bool cel::remove(const Range& range, Splits* splits) {
    if (!isUsableRange(range) || m_events.size() % 2 != 0) {
        return false;
    }
    const Region region(m_events, range.start(), range.end());
    if (region.empty()) {
        return false;
    }
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
        spliceShifted(m_events, 2 * region.from.pair, 2 * last, block, -region.length(), region.from.time);
        changedNow();
    }
    return true;
}

bool cel::replace(const cel* source, const Range& sourceRange, double at, IdMap& ids, bool materialOnly,
                  Splits* splits) {
    if (source == nullptr || !isUsableRange(sourceRange) || !isUsableTime(at) ||
        !isUsableTime(at + sourceRange.length()) || m_events.size() % 2 != 0 ||
        source->m_events.size() % 2 != 0) {
        return false;
    }
    const Region part(source->m_events, sourceRange.start(), sourceRange.end());
    const Region region(m_events, at, at + sourceRange.length());
    if (part.empty() || region.empty()) {
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
        appendPart(laid, source->m_events, part, region.from.time, region.to.time);
        layMaterial(block, m_events, region, laid, ids, splits);
    } else {
        const size_t first = block.size();
        appendPart(block, source->m_events, part, region.from.time, region.to.time);
        refresh(block, first, ids);
    }
    if (region.to.inside) {
        appendRight(block, m_events, region.to, apart, region.to.time, 0, splits);
    }
    spliceShifted(m_events, 2 * region.from.pair, 2 * (region.from.pair + region.numPairs()), block, 0,
                  region.to.time);
    changedNow();
    return true;
}

bool cel::weld(const cel* other, double at) {
    if (other == nullptr || !isUsableTime(at) || m_events.size() % 2 != 0 ||
        other->m_events.size() % 2 != 0) {
        return false;
    }
    const double end = timeBefore(m_events.size());
    const double start = at + other->get_start_time();
    if (!isUsableTime(start) || !isUsableTime(at + other->get_end_time()) ||
        (!other->m_events.empty() && !isNotPast(end, start))) {
        return false;
    }
    Events block;
    block.reserve(other->m_events.size());
    TimeLayer layer(end);
    for (size_t i = 0; i < other->m_events.size(); i += 2) {
        channel_event in = other->m_events[i];
        channel_event out = other->m_events[i + 1];
        const bool hadLength = in.editTime < out.editTime;
        in.editTime = layer.lay(in.editTime + at);
        out.editTime = layer.lay(out.editTime + at);
        appendLaid(block, in, out, hadLength);
    }
    if (!block.empty()) {
        m_stamps.follow(m_events, m_changeCount);
        for (channel_event& event : block) {
            event.id = m_stamps.contains(m_events, event.id) ? freshLike(event.id) : event.id;
        }
        m_events.splice(m_events.size(), m_events.size(), block);
        changedNow();
        m_stamps.appended(m_changeCount);
    }
    return true;
}
