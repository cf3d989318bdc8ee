#include "tests/edit/editing/editing_fixture.h"

#include <algorithm>
#include <cmath>
#include <optional>
#include <random>
#include <set>

using namespace test;
using Op = edit_operation;

namespace {

/// Operations in all, and the runs that they are divided into, each from edits of its own.
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr int kOperations = 20000;
#else
constexpr int kOperations = 60000;
#endif
constexpr int kRuns = 20;

constexpr double kFrame = 0.04;
constexpr int kUnset = -1;

/// A channel as one number a frame: -1 nothing, 0 black, else the source and the frame of it that plays.
using Row = std::vector<int>;
constexpr int kGap = -1;
constexpr int kBlack = 0;

struct Channels {
    std::string kinds; ///< 'E', 'V' or 'A' for each row
    std::vector<Row> rows;
    [[nodiscard]] int end() const {
        size_t longest = 0;
        for (const Row& row : rows) {
            longest = std::max(longest, row.size());
        }
        return static_cast<int>(longest);
    }
};

/// One side of an operation, in frames.
struct Side {
    int in = kUnset;
    int out = kUnset;
    int current = 0;
    std::vector<bool> selected;
};

struct Span {
    int from = 0;
    int to = 0;
    [[nodiscard]] int length() const { return to - from; }
};

std::optional<Span> markedSpan(const Side& side) {
    if (side.in == kUnset && side.out == kUnset) {
        return std::nullopt;
    }
    const bool both = side.in != kUnset && side.out != kUnset && side.in != side.out;
    const int one = side.in != kUnset ? side.in : side.out;
    const int other = both ? side.out : side.current;
    return Span{std::min(one, other), std::max(one, other)};
}

/// Where a side is marked in (or out): the earlier (or later) of two marks, else the one, else the current
/// time.
int placeOf(const Side& side, bool out) {
    if (side.in != kUnset && side.out != kUnset) {
        return out ? std::max(side.in, side.out) : std::min(side.in, side.out);
    }
    const int one = out ? side.out : side.in;
    return one != kUnset ? one : side.current;
}

/// The operations as anybody would do them by hand, frame by frame. Knows nothing of events.
class ByHand {
public:
    ByHand(const Channels& source, const Side& from, const Channels& destination, const Side& to, Op op)
        : m_source(source), m_from(from), m_to(to), m_op(op), m_result(destination) {}

    /// Nothing if the operation is to be refused.
    std::optional<Channels> run() {
        const bool done = editOpRequiresSourceAndDest(m_op) ? withSource()
                          : editOpIsInterTrack(m_op)        ? betweenChannels()
                                                            : removeOrLift();
        if (!done) {
            return std::nullopt;
        }
        pad();
        return m_result;
    }

private:
    static bool continuous(char kind) { return kind != 'E'; }
    static int nothing(char kind) { return continuous(kind) ? kBlack : kGap; }

    [[nodiscard]] std::vector<size_t> selected(const Channels& channels, const Side& side, char kind) const {
        std::vector<size_t> found;
        for (size_t i = 0; i < channels.rows.size(); ++i) {
            if (channels.kinds[i] == kind && side.selected[i]) {
                found.push_back(i);
            }
        }
        return found;
    }
    static Row part(const Row& row, char kind, int from, int length) {
        Row taken;
        for (int i = from; i < from + length; ++i) {
            const int frame = i < static_cast<int>(row.size()) ? row[static_cast<size_t>(i)] : kGap;
            taken.push_back(frame == kGap ? nothing(kind) : frame);
        }
        return taken;
    }
    static void reach(Row& row, char kind, int end) {
        if (static_cast<int>(row.size()) < end) {
            row.resize(static_cast<size_t>(end), nothing(kind));
        }
    }
    void put(Row& row, char kind, int at, const Row& laid) const {
        const int end = static_cast<int>(row.size());
        reach(row, kind, at + static_cast<int>(laid.size()));
        for (size_t i = 0; i < laid.size(); ++i) {
            int& frame = row[static_cast<size_t>(at) + i];
            const bool there = at + static_cast<int>(i) < end && frame != kGap;
            const bool blackStays = m_op == Op::ReplaceMaterial && there && laid[i] == kGap;
            frame = blackStays ? kBlack : laid[i];
        }
    }
    static void insert(Row& row, char kind, int at, const Row& laid) {
        reach(row, kind, at);
        row.insert(row.begin() + at, laid.begin(), laid.end());
    }
    static void cut(Row& row, int from, int to) {
        const int end = static_cast<int>(row.size());
        if (from < end) {
            row.erase(row.begin() + from, row.begin() + std::min(to, end));
        }
    }

    bool withSource() {
        const bool marked = m_op == Op::ReplaceMarked || m_op == Op::InsertMarked ||
                            m_op == Op::BackReplaceMarked || m_op == Op::BackInsertMarked;
        const bool back = editOpIsBackwards(m_op);
        Span region;
        int at = 0;
        if (marked) {
            const std::optional<Span> span = markedSpan(m_to);
            if (!span || span->length() == 0) {
                return false;
            }
            const int mark = placeOf(m_from, back) - (back ? span->length() : 0);
            region = {mark, mark + span->length()};
            at = span->from;
        } else {
            region = markedSpan(m_from).value_or(Span{0, m_source.end()});
            if (region.length() == 0 || region.from >= m_source.end()) {
                return false;
            }
            at = placeOf(m_to, back) - (back ? region.length() : 0);
        }
        return lay(region, at);
    }

    bool lay(const Span& region, int at) {
        bool any = false;
        bool laid = false;
        for (const char kind : {'E', 'V', 'A'}) {
            const auto from = selected(m_source, m_from, kind);
            const auto to = selected(m_result, m_to, kind);
            for (size_t i = 0; i < to.size(); ++i) {
                const bool has = i < from.size();
                laid = laid || has;
                const bool inserts = getCoreEditOperation(m_op) == kCoreInsert;
                if (!has && !inserts && m_op != Op::ReplaceToEnd) {
                    break;
                }
                if ((has && region.from < 0) || (at < 0 && (has || inserts))) {
                    return false;
                }
                any =
                    layOne(m_result.rows[to[i]], kind, has ? &m_source.rows[from[i]] : nullptr, region, at) ||
                    any;
            }
        }
        return any && laid;
    }

    bool layOne(Row& row, char kind, const Row* source, const Span& region, int at) {
        const Row laid = source != nullptr ? part(*source, kind, region.from, region.length())
                                           : Row(static_cast<size_t>(region.length()), nothing(kind));
        if (getCoreEditOperation(m_op) == kCoreInsert) {
            insert(row, kind, at, laid);
            return true;
        }
        if (m_op == Op::FillBlack) {
            return fill(row, kind, laid, at);
        }
        bool changed = false;
        if (source != nullptr) {
            put(row, kind, at, laid);
            changed = true;
        }
        if (m_op == Op::ReplaceToEnd && static_cast<int>(row.size()) > at + region.length()) {
            row.resize(static_cast<size_t>(at + region.length()));
            changed = true;
        }
        return changed;
    }

    bool fill(Row& row, char kind, const Row& laid, int at) const {
        int to = at + static_cast<int>(laid.size());
        if (m_to.in != kUnset && m_to.out != kUnset && m_to.in != m_to.out) {
            to = std::min(to, placeOf(m_to, true));
        }
        bool any = false;
        for (int i = at; i < to; ++i) {
            const bool free = i >= static_cast<int>(row.size()) || row[static_cast<size_t>(i)] <= kBlack;
            if (free) {
                reach(row, kind, i + 1);
                row[static_cast<size_t>(i)] = laid[static_cast<size_t>(i - at)];
                any = true;
            }
        }
        return any;
    }

    bool removeOrLift() {
        const std::optional<Span> span = markedSpan(m_to);
        bool any = false;
        for (size_t i = 0; i < m_result.rows.size(); ++i) {
            Row& row = m_result.rows[i];
            const int end = static_cast<int>(row.size());
            if (!m_to.selected[i]) {
                continue;
            }
            if (!span || span->length() == 0) {
                return false;
            }
            if (span->from >= end) {
                continue;
            }
            any = true;
            if (m_op == Op::Remove) {
                cut(row, span->from, span->to);
            } else {
                std::fill(row.begin() + span->from, row.begin() + std::min(span->to, end),
                          nothing(m_result.kinds[i]));
            }
        }
        return any;
    }

    bool betweenChannels() {
        const Channels before = m_result;
        const std::optional<Span> span = markedSpan(m_to);
        bool any = false;
        for (const char kind : {'E', 'V', 'A'}) {
            const auto chans = selected(before, m_to, kind);
            if (chans.size() < 2) {
                continue;
            }
            if ((m_op == Op::SwapTracks && chans.size() > 2) || !span) {
                return false;
            }
            if (!carry(before, chans[0], {chans.begin() + 1, chans.end()}, *span, any) ||
                (m_op == Op::SwapTracks && !carry(before, chans[1], {chans[0]}, *span, any))) {
                return false;
            }
            Row& first = m_result.rows[chans[0]];
            if (m_op == Op::MoveTrack && span->from < static_cast<int>(first.size())) {
                const int end = std::min(span->to, static_cast<int>(first.size()));
                std::fill(first.begin() + span->from, first.begin() + end, nothing(kind));
                any = any || end > span->from;
            }
        }
        return any;
    }

    /// What a channel plays in a span comes into others, as far as they reach; false if more than black is
    /// left.
    bool carry(const Channels& before, size_t from, const std::vector<size_t>& others, Span span, bool& any) {
        const char kind = before.kinds[from];
        const Row all = part(before.rows[from], kind, span.from, span.length());
        for (const size_t to : others) {
            const int reach = static_cast<int>(before.rows[to].size()) - span.from;
            const Row laid(all.begin(), all.begin() + std::clamp(reach, 0, span.length()));
            if (std::any_of(all.begin() + static_cast<int>(laid.size()), all.end(),
                            [](int frame) { return frame > kBlack; })) {
                return false;
            }
            if (!laid.empty()) {
                put(m_result.rows[to], kind, span.from, laid);
                any = true;
            }
        }
        return span.length() > 0;
    }

    void pad() {
        size_t longest = 0;
        for (size_t i = 0; i < m_result.rows.size(); ++i) {
            Row& row = m_result.rows[i];
            while (m_result.kinds[i] == 'E' && !row.empty() && row.back() == kGap) {
                row.pop_back();
            }
            longest = m_result.kinds[i] == 'E' ? longest : std::max(longest, row.size());
        }
        for (size_t i = 0; i < m_result.rows.size() && editOpCanAffectTrackLength(m_op); ++i) {
            if (continuous(m_result.kinds[i])) {
                m_result.rows[i].resize(longest, kBlack);
            }
        }
    }

    const Channels m_source; ///< a copy: it may be the destination
    const Side& m_from;
    const Side& m_to;
    Op m_op;
    Channels m_result;
};

int frameOf(double seconds) {
    return static_cast<int>(std::lround(seconds / kFrame));
}

/// What an edit shows, frame by frame. An event off the frame grid is a failure.
Channels readFrames(const Edit& edit, std::string& problem) {
    Channels channels;
    for (int chan = 0; chan < edit.getNumChans(); ++chan) {
        const cel* const its = edit.get_edit_cel_p(chan);
        if (its == nullptr) {
            continue;
        }
        const bool effects = edit.getChanSubtype(chan) == Edit_Chan_SubType::ALIAS;
        channels.kinds += effects ? 'E' : edit.getChanType(chan) == AudioChan ? 'A' : 'V';
        Row row;
        for (int i = 0; i + 1 < its->numEvents(); i += 2) {
            const channel_event& in = *its->getChanEventPtr(i);
            const channel_event& out = *its->getChanEventPtr(i + 1);
            const int from = frameOf(in.editTime);
            const int to = frameOf(out.editTime);
            const int strip = frameOf(in.stripTime);
            if (std::abs(in.editTime - from * kFrame) > 1e-7 || std::abs(out.editTime - to * kFrame) > 1e-7 ||
                std::abs(in.stripTime - strip * kFrame) > 1e-6) {
                problem = "off the frames at " + std::to_string(in.editTime);
            }
            row.resize(static_cast<size_t>(from), kGap);
            for (int frame = from; frame < to; ++frame) {
                row.push_back(in.strip.isBlack()
                                  ? kBlack
                                  : static_cast<int>(in.strip.word(0)) * 10000 + strip + (frame - from));
            }
        }
        channels.rows.push_back(std::move(row));
    }
    return channels;
}

class RandomRun {
public:
    explicit RandomRun(unsigned seed) : m_random(seed), m_levelsInStep(seed % 2 == 1) {
        m_edits.push_back(build(1));
        m_edits.push_back(build(2));
        m_edits.push_back(build(3));
        Edit& edit = *m_edits[0];
        edit.groupChannels({edit.getId(3), edit.getId(4)}, ChannelGroup::eStereo);
        addCues();
    }

    /// Does one random operation with the editor and by hand; what differs, or nothing.
    std::string step() {
        const EditPtr& edit = m_edits[0];
        std::string problem;
        // `ReplaceMaterial` leaves the levels, so that they no longer tell the material.
        Op op = static_cast<Op>(1 + pick(m_levelsInStep ? 15 : 16));
        if (pick(25) == 0) {
            shorten(*edit);
        }
        const EditPtr& source = m_edits[static_cast<size_t>(pick(5) == 0 ? 0 : 1 + pick(2))];
        const Channels before = readFrames(*edit, problem);
        const int end = before.end();
        Side to = side(end, before.rows.size(), op);
        if (end > 300) {
            op = Op::Remove;
            to = {pick(100), 200 + pick(100), 0, std::vector<bool>(before.rows.size(), true)};
        }
        const Channels from = readFrames(*source, problem);
        const Side of = side(from.end(), from.rows.size(), Op::Replace);
        const auto expected = ByHand(from, of, before, to, op).run();

        const String stateBefore = expected ? String() : contentState(*edit);
        const Editor::Result result =
            Editor::apply(module(source, of), module(edit, to), op, Editor::KeepClipboard);
        const String what = String(editOperationName(op)) + ": " + result.reason();
        if (result.valid() != expected.has_value()) {
            return what + (expected ? " refused" : " done where it should be refused");
        }
        if (!expected) {
            return contentState(*edit) == stateBefore ? "" : what + " refused but changed";
        }
        const Channels after = readFrames(*edit, problem);
        for (size_t i = 0; i < after.rows.size(); ++i) {
            if (shown(after, i) != shown(*expected, i)) {
                return what + " gives another content of channel " + std::to_string(i);
            }
            if (!editOpCanAffectTrackLength(op) && after.rows[i].size() != before.rows[i].size()) {
                return what + " changes the length of channel " + std::to_string(i);
            }
        }
        problem = problem.empty() ? checkInvariants(*edit) : problem;
        return problem.empty() ? "" : what + problem;
    }

    /// Does one operation with whatever marks, channels, rates and flags there are: what must hold all the
    /// same.
    std::string wildStep() {
        const EditPtr& edit = m_edits[0];
        const EditPtr& source = m_edits[static_cast<size_t>(pick(3))];
        source->setFrameRate(Qx::FrameRate(1 + pick(10)));
        source->set_original_material(pick(4) == 0 && source != edit ? 1 : 0);
        if (pick(10) == 0 || edit->getEndTime() > 100) {
            shorten(*edit);
        }
        const Op op = static_cast<Op>(pick(18));
        const EditModule to = wildModule(edit);
        const String before = contentState(*edit);
        std::vector<double> ends;
        for (int i = 0; i < edit->getNumChans(); ++i) {
            const cel* const its = edit->get_edit_cel_p(i);
            ends.push_back(its != nullptr ? its->get_end_time() : 0);
        }
        const Editor::Result result =
            Editor::apply(wildModule(source), to, op, Editor::KeepClipboard | static_cast<unsigned>(pick(2)));
        const std::string what = String(editOperationName(op)) + ": " + result.reason();
        if (!result.valid()) {
            return contentState(*edit) == before && !result.reason().empty() ? ""
                                                                             : what + " refused but changed";
        }
        for (size_t i = 0; i < ends.size() && !editOpCanAffectTrackLength(op); ++i) {
            const cel* const its = edit->get_edit_cel_p(static_cast<int>(i));
            if (its != nullptr && std::abs(its->get_end_time() - ends[i]) > 2e-6) {
                return what + " changes the length of channel " + std::to_string(i);
            }
        }
        const std::string problem = checkInvariants(*edit);
        return problem.empty() ? "" : what + problem;
    }

private:
    EditModule wildModule(const EditPtr& edit) {
        const auto time = [&] {
            const double near = pick(400) * kFrame / 4 + (pick(5) - 2) * 0.9e-6;
            const double others[] = {Qx::kNoTime, std::nan(""), -near, 0, 1e9, 1e300, near * 1000};
            return pick(4) > 0 ? near : others[pick(7)];
        };
        EditModule made = moduleOf(edit, {time(), time(), time()});
        for (int i = 0; i < edit->getNumChans(); ++i) {
            made.selectChan(edit->getId(i), pick(4) > 0);
            if (pick(4) == 0) {
                made.setMarkTime(edit->getId(i), std::pair(time(), time()));
            }
        }
        return made;
    }

    int pick(int below) { return static_cast<int>(m_random() % static_cast<unsigned>(below)); }

    EditPtr build(int number) {
        EditPtr edit(new Edit);
        edit->set_cookie(cookie(Cookie_Type::Edit, number, 4));
        for (const char* row : {"E ", "V ", "V ", "A ", "A ", "A "}) {
            addRows(*edit, {row});
            cel& its = *edit->get_edit_cel_p(edit->getNumChans() - 1);
            int at = 0;
            int kind = 0;
            for (int i = 0; i < 8; ++i) {
                const int length = 1 + pick(20);
                kind = kind == 0 ? 1 + pick(4) : pick(5); // never black after black
                if (kind > 0 || row[0] != 'E') {
                    const cookie strip =
                        kind == 0 ? black_cookie : cookie(Cookie_Type::Material, 1 + pick(9), 0);
                    its.appendEventPair(strip, kind == 0 ? 0 : pick(5000) * kFrame, at * kFrame,
                                        (at + length) * kFrame - at * kFrame);
                }
                at += length;
            }
        }
        for (int chan = 3; chan < 6; ++chan) {
            AudLevelsCel levels = AudLevelsCel::create();
            const cel& its = *edit->get_edit_cel_p(chan);
            for (int i = 0; i < its.numEvents(); ++i) {
                const channel_event& event = *its.getChanEventPtr(i);
                levels.insertNode(event.editTime - (i % 2) * 1e-5, levelOf(event.strip));
            }
            (void)edit->addLevelsChan(edit->getId(chan), levels);
        }
        return edit;
    }

    /// Every source is heard at a level of its own.
    static float levelOf(const cookie& strip) {
        return strip.isBlack() ? 1 : static_cast<float>(strip.word(0)) / 16;
    }
    /// What is seen of a channel: on an effects channel black is nothing.
    static Row shown(const Channels& channels, size_t i) {
        Row row = channels.rows[i];
        if (channels.kinds[i] == 'E') {
            std::replace(row.begin(), row.end(), kBlack, kGap);
            row.resize(1000, kGap);
        }
        return row;
    }
    /// Channels come to differ in length.
    void shorten(Edit& edit) {
        edit.get_cues().delete_all_cues();
        cel& its = *edit.get_edit_cel_p(pick(6));
        its.remove({(pick(100) + 0.0) * kFrame, 1000});
        for (int chan = 0; chan < 6; ++chan) {
            edit.get_edit_cel_p(chan)->simplify(Simplification::MergeBlack); // what the cues kept apart
        }
        addCues();
    }

    void addCues() {
        Edit& edit = *m_edits[0];
        Vector<cel*> cels;
        for (int i = 0; i < edit.getNumChans(); ++i) {
            cels.push_back(edit.get_edit_cel_p(i));
        }
        while (edit.get_cues().get_num_cue_points(0) < 8) {
            edit.get_cues().add_cue_point("cue", pick(100) * kFrame, pick(6), 0, cels, true);
        }
    }

    Side side(int end, size_t channels, Op op) {
        Side made;
        made.current = pick(end + 20);
        const bool needsMarks = !editOpRequiresSourceAndDest(op) || pick(3) > 0;
        if (needsMarks || pick(2) == 0) {
            made.in = pick(end + 20);
        }
        if (needsMarks || pick(2) == 0) {
            made.out = std::max(0, std::max(made.in, 0) + pick(60) - 20);
        }
        for (size_t i = 0; i < channels; ++i) {
            made.selected.push_back(pick(5) > 0);
        }
        return made;
    }

    static EditModule module(const EditPtr& edit, const Side& side) {
        const auto seconds = [](int frame) { return frame == kUnset ? Qx::kNoTime : frame * kFrame; };
        EditModule made = moduleOf(edit, {seconds(side.in), seconds(side.out), side.current * kFrame});
        for (size_t i = 0; i < side.selected.size(); ++i) {
            made.selectChan(edit->getId(static_cast<int>(i)), side.selected[i]);
        }
        return made;
    }

    std::string checkInvariants(const Edit& edit) {
        std::set<IdStamp> stamps;
        size_t events = 0;
        for (int chan = 0; chan < edit.getNumChans(); ++chan) {
            const cel* const its = edit.get_edit_cel_p(chan);
            if (its == nullptr) {
                const auto& nodes = edit.getLevelsCel(edit.getId(chan)).getNodeStore().nodes();
                if (!std::is_sorted(nodes.begin(), nodes.end(),
                                    [](const auto& a, const auto& b) { return a.time < b.time; })) {
                    return "levels out of order";
                }
                continue;
            }
            if (its->is_good_cel() == 0) {
                return "events of channel " + std::to_string(chan) + " are not consistent";
            }
            for (int i = 0; i < its->numEvents(); ++i, ++events) {
                stamps.insert(its->getChanEventPtr(i)->id);
            }
            const bool heard = m_levelsInStep && edit.getChanType(chan) == AudioChan;
            const AudLevelsCel levels =
                heard ? edit.getLevelsCel(edit.getAudCel(edit.getId(chan)).getLevelsChanID())
                      : AudLevelsCel();
            for (int i = 0; i < its->numEvents(); i += 2) {
                const channel_event& in = *its->getChanEventPtr(i);
                if (in.strip.isBlack() && !isMerged(edit, *its, i)) {
                    return "black is followed by black on channel " + std::to_string(chan);
                }
                const double middle = (in.editTime + its->getChanEventPtr(i + 1)->editTime) / 2;
                if (heard && !in.strip.isBlack() &&
                    std::abs(levels.getNodeStore().levelAt(middle) - double{levelOf(in.strip)}) > 1e-4) {
                    return "the level at " + std::to_string(middle) + " is not that of its sound";
                }
            }
        }
        if (stamps.size() != events) {
            return "two events have one stamp";
        }
        if (edit.numGroups() != 1 || edit.getTrackGroup(0)->size() != 2) {
            return "the group is broken";
        }
        for (size_t i = 0; i < edit.get_cues().get_num_cue_points(0); ++i) {
            const cue_point& cue = *edit.get_cues().get_cue_point(i, 0);
            const Range pair = CEHPair(cue.event()).editRange();
            if (cue.attached() && (cue.event().valid() == 0 || (cue.hasFlags(CueFlag::kInside) &&
                                                                (cue.editTime() < pair.start() - 1e-6 ||
                                                                 cue.editTime() > pair.end() + 1e-6)))) {
                return "a cue at " + std::to_string(cue.editTime()) + " is not within its event, " +
                       std::to_string(pair.start()) + " to " + std::to_string(pair.end());
            }
        }
        addCues();
        return "";
    }
    using Range = cel::Range;

    /// False if a pair of black is touched by the next, black too, and no cue is attached to either.
    static bool isMerged(const Edit& edit, const cel& its, int pair) {
        const channel_event* const next = its.getChanEventPtr(pair + 2);
        if (next == nullptr || !next->strip.isBlack() ||
            next->editTime > its.getChanEventPtr(pair + 1)->editTime + 1e-6) {
            return true;
        }
        for (size_t i = 0; i < edit.get_cues().get_num_cue_points(0); ++i) {
            const ce_handle& event = edit.get_cues().get_cue_point(i, 0)->event();
            if (event.get_its_cel() == &its &&
                (event.index() / 2 == pair / 2 || event.index() / 2 == pair / 2 + 1)) {
                return true;
            }
        }
        return false;
    }

    std::mt19937 m_random;
    const bool m_levelsInStep;
    std::vector<EditPtr> m_edits; ///< the destination, then the sources
};

TEST(EditorRandom, OperationsAgreeWithThoseMadeByHand) {
    const RecordingLog quiet;
    for (unsigned seed = 1; seed <= kRuns; ++seed) {
        RandomRun run(seed);
        for (int i = 0; i < kOperations / kRuns; ++i) {
            const std::string problem = run.step();
            ASSERT_EQ(problem, "") << "seed " << seed << ", operation " << i;
        }
    }
}

TEST(EditorRandom, NoMarksWhateverBreakAnEdit) {
    const RecordingLog quiet;
    for (unsigned seed = 1; seed <= kRuns; ++seed) {
        RandomRun run(2 * seed); // levels of its own are not those of a shot's sound
        for (int i = 0; i < kOperations / kRuns / 5; ++i) {
            const std::string problem = run.wildStep();
            ASSERT_EQ(problem, "") << "seed " << seed << ", operation " << i;
        }
    }
}

/// The greatest difference between the material times that the channels play at one edit time.
double greatestDrift(const Edit& edit) {
    const cel& picture = *edit.get_edit_cel_p(0);
    double drift = 0;
    for (int chan = 1; chan < edit.getNumChans(); ++chan) {
        const cel& sound = *edit.get_edit_cel_p(chan);
        for (double time = 0.011; time < picture.get_end_time(); time += 0.37) {
            const cookie seen = picture.get_strip_cookie(time);
            const cookie heard = sound.get_strip_cookie(time);
            // The cut itself may lie between the two by what a time is rounded to.
            if (seen != heard) {
                const cookie later = sound.get_strip_cookie(time + 1e-5);
                const cookie sooner = sound.get_strip_cookie(time - 1e-5);
                drift = seen == later || seen == sooner ? drift : 1e9;
            } else if (!seen.isBlack()) {
                drift = std::max(drift, std::abs(picture.get_strip_time(time) - sound.get_strip_time(time)));
            }
        }
    }
    return drift;
}

TEST(EditorRandom, PictureAndSoundStayInStepToTheSample) {
    const RecordingLog quiet;
    Qx::CurrentProject project = Qx::currentProject();
    const Qx::CurrentProject before = project;
    for (const Qx::FrameRate::Code code :
         {Qx::FrameRate::Fps25, Qx::FrameRate::Fps29_97, Qx::FrameRate::Fps23_976}) {
        project.frameRateCode = code;
        Qx::setCurrentProject(project);
        const double frame = Qx::FrameRate(code).frameDuration();
        std::mt19937 random(77);
        const auto build = [&](int number) {
            EditPtr edit =
                editOf({"V ", "V ", "V ", "V ", "A ", "A ", "A ", "A ", "A ", "A ", "A ", "A "}, number);
            for (int chan = 0; chan < 12; ++chan) {
                // Every channel plays one material through, but is cut at places of its own.
                const auto step = 1 + static_cast<int>(random() % 50);
                for (int at = 0; at < 5000; at += step) {
                    edit->get_edit_cel_p(chan)->appendEventPair(
                        cookie(Cookie_Type::Material, number, 0), 100 + at * frame, at * frame,
                        std::min(at + step, 5000) * frame - at * frame);
                }
            }
            return edit;
        };
        const EditPtr edit = build(1);
        const EditPtr source = build(2);
        for (int i = 0; i < 1000; ++i) {
            const double at = static_cast<double>(random() % 3000) * frame;
            const double length = static_cast<double>(1 + random() % 200) * frame;
            const double from = static_cast<double>(random() % 4000) * frame;
            // Marks as a user sets them, anywhere within a frame.
            const double off = (static_cast<double>(random() % 900) / 1000 - 0.45) * frame;
            const Editor::Result result =
                i % 2 == 0 ? Editor::apply(moduleOf(source, {from, from + length}),
                                           moduleOf(edit, {at + off}), Op::Insert)
                           : Editor::apply({}, moduleOf(edit, {at, at + length + off}), Op::Remove);
            ASSERT_TRUE(result.valid()) << result.reason();
            EXPECT_FALSE(result.syncLoss());
        }
        EXPECT_LT(greatestDrift(*edit), 0.5 / 48000) << code;
    }
    Qx::setCurrentProject(before);
}

} // namespace
