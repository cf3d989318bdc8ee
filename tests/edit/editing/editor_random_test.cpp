#include "tests/edit/editing/editing_fixture.h"
#include "tests/support/row_model.h"

#include <cmath>
#include <optional>
#include <random>

using namespace test;
using rows::kBlack;
using rows::kGap;
using rows::lengthOf;
using rows::Row;
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

struct Channels {
    std::string kinds; ///< 'E', 'V' or 'A' for each row
    std::vector<Row> rows;
    [[nodiscard]] int end() const {
        int longest = 0;
        for (const Row& row : rows) {
            longest = std::max(longest, lengthOf(row));
        }
        return longest;
    }
};

struct Span {
    int from = 0;
    int to = 0;
    [[nodiscard]] int length() const { return to - from; }
};

/// One side of an operation, in frames.
struct Side {
    int in = kUnset;
    int out = kUnset;
    int current = 0;
    std::vector<bool> selected;

    [[nodiscard]] bool hasBoth() const { return in != kUnset && out != kUnset; }
    /// Between the marks; from the current time to the one that is set, or to both of them if they are one.
    [[nodiscard]] std::optional<Span> marked() const {
        if (in == kUnset && out == kUnset) {
            return std::nullopt;
        }
        const int one = in != kUnset ? in : out;
        const int other = hasBoth() && in != out ? out : current;
        return Span{std::min(one, other), std::max(one, other)};
    }
    /// The earlier (or later) of two marks, else the one that is asked for, else the current time.
    [[nodiscard]] int place(bool later) const {
        const int one = later ? out : in;
        return hasBoth() ? (later ? std::max(in, out) : std::min(in, out)) : one != kUnset ? one : current;
    }
};

/// The operations as anybody would do them by hand, frame by frame.
class ByHand {
public:
    ByHand(const Channels& source, const Side& from, const Channels& destination, const Side& to, Op op)
        : m_source(source), m_from(from), m_to(to), m_op(op), m_result(destination) {}

    /// Nothing if the operation is to be refused.
    std::optional<Channels> run() {
        const bool sourced = editOpRequiresSourceAndDest(m_op);
        const bool done = sourced                    ? withSource()
                          : editOpIsInterTrack(m_op) ? betweenChannels()
                                                     : removeOrLift();
        if (!done) {
            return std::nullopt;
        }
        pad();
        return m_result;
    }

private:
    static int nothing(char kind) { return kind == 'E' ? kGap : kBlack; }
    [[nodiscard]] bool inserts() const { return getCoreEditOperation(m_op) == kCoreInsert; }
    [[nodiscard]] static std::vector<size_t> selected(const Channels& channels, const Side& side, char kind) {
        std::vector<size_t> found;
        for (size_t i = 0; i < channels.rows.size(); ++i) {
            if (channels.kinds[i] == kind && side.selected[i]) {
                found.push_back(i);
            }
        }
        return found;
    }

    bool withSource() {
        const bool back = editOpIsBackwards(m_op);
        const bool toMarks = m_op == Op::ReplaceMarked || m_op == Op::InsertMarked ||
                             m_op == Op::BackReplaceMarked || m_op == Op::BackInsertMarked;
        const auto region = toMarks ? m_to.marked() : m_from.marked().value_or(Span{0, m_source.end()});
        if (!region || region->length() == 0 || (!toMarks && region->from >= m_source.end())) {
            return false;
        }
        const int length = region->length();
        const int from = toMarks ? m_from.place(back) - (back ? length : 0) : region->from;
        return lay(from, length, toMarks ? region->from : m_to.place(back) - (back ? length : 0));
    }

    bool lay(int from, int length, int at) {
        bool any = false;
        bool laid = false;
        for (const char kind : {'E', 'V', 'A'}) {
            const auto sources = selected(m_source, m_from, kind);
            const auto to = selected(m_result, m_to, kind);
            for (size_t i = 0; i < to.size(); ++i) {
                const Row* const source = i < sources.size() ? &m_source.rows[sources[i]] : nullptr;
                laid = laid || source != nullptr;
                if (source == nullptr && !inserts() && m_op != Op::ReplaceToEnd) {
                    break;
                }
                if ((source != nullptr && from < 0) || (at < 0 && (source != nullptr || inserts()))) {
                    return false;
                }
                const Row with =
                    rows::part(source != nullptr ? *source : Row(), std::max(from, 0), length, nothing(kind));
                any = layOne(m_result.rows[to[i]], kind, source != nullptr, with, at) || any;
            }
        }
        return any && laid;
    }

    bool layOne(Row& row, char kind, bool sourced, const Row& with, int at) {
        const int end = at + lengthOf(with);
        if (inserts()) {
            rows::insert(row, at, with, nothing(kind));
            return true;
        }
        bool changed = false;
        if (m_op == Op::FillBlack) {
            const int to = m_to.hasBoth() && m_to.in != m_to.out ? std::min(end, m_to.place(true)) : end;
            for (int i = at; i < to; ++i) {
                if (i >= lengthOf(row) || row[static_cast<size_t>(i)] <= kBlack) {
                    rows::reach(row, i + 1, nothing(kind));
                    row[static_cast<size_t>(i)] = with[static_cast<size_t>(i - at)];
                    changed = true;
                }
            }
            return changed;
        }
        if (sourced) {
            rows::put(row, at, with, m_op == Op::ReplaceMaterial, nothing(kind));
            changed = true;
        }
        if (m_op == Op::ReplaceToEnd && lengthOf(row) > end) {
            row.resize(static_cast<size_t>(end));
            changed = true;
        }
        return changed;
    }

    /// Empties a span of a row as far as the row reaches; false if it does not reach there.
    static bool lift(Row& row, char kind, Span span) {
        const int end = std::min(span.to, lengthOf(row));
        if (span.from >= end) {
            return false;
        }
        std::fill(row.begin() + span.from, row.begin() + end, nothing(kind));
        return true;
    }

    bool removeOrLift() {
        const std::optional<Span> span = m_to.marked();
        bool any = false;
        for (size_t i = 0; i < m_result.rows.size(); ++i) {
            Row& row = m_result.rows[i];
            if (!m_to.selected[i]) {
                continue;
            }
            if (!span || span->length() == 0) {
                return false;
            }
            if (m_op == Op::Remove) {
                any = any || span->from < lengthOf(row);
                rows::remove(row, span->from, span->to);
            } else {
                any = lift(row, m_result.kinds[i], *span) || any;
            }
        }
        return any;
    }

    bool betweenChannels() {
        const Channels before = m_result;
        const std::optional<Span> span = m_to.marked();
        bool any = false;
        for (const char kind : {'E', 'V', 'A'}) {
            const auto chans = selected(before, m_to, kind);
            if (chans.size() < 2) {
                continue;
            }
            const bool swaps = m_op == Op::SwapTracks;
            if ((swaps && chans.size() > 2) || !span ||
                !carry(before, chans[0], {chans.begin() + 1, chans.end()}, *span, any) ||
                (swaps && !carry(before, chans[1], {chans[0]}, *span, any))) {
                return false;
            }
            if (m_op == Op::MoveTrack) {
                any = lift(m_result.rows[chans[0]], kind, *span) || any;
            }
        }
        return any;
    }

    /// What a channel plays in a span comes into others, as far as they reach; false if more than black is
    /// left.
    bool carry(const Channels& before, size_t from, const std::vector<size_t>& others, Span span, bool& any) {
        const int none = nothing(before.kinds[from]);
        const Row all = rows::part(before.rows[from], span.from, span.length(), none);
        for (const size_t to : others) {
            const int reach = std::clamp(lengthOf(before.rows[to]) - span.from, 0, span.length());
            if (std::any_of(all.begin() + reach, all.end(), [](int frame) { return frame > kBlack; })) {
                return false;
            }
            any = any || reach > 0;
            rows::put(m_result.rows[to], span.from, Row(all.begin(), all.begin() + reach), false, none);
            m_result.rows[to].resize(before.rows[to].size());
        }
        return span.length() > 0;
    }

    /// Effects end with their last; all other channels are as long as the longest of them.
    void pad() {
        int longest = 0;
        for (size_t i = 0; i < m_result.rows.size(); ++i) {
            Row& row = m_result.rows[i];
            while (m_result.kinds[i] == 'E' && !row.empty() && row.back() == kGap) {
                row.pop_back();
            }
            longest = m_result.kinds[i] == 'E' ? longest : std::max(longest, lengthOf(row));
        }
        for (size_t i = 0; i < m_result.rows.size() && editOpCanAffectTrackLength(m_op); ++i) {
            if (m_result.kinds[i] != 'E') {
                m_result.rows[i].resize(static_cast<size_t>(longest), kBlack);
            }
        }
    }

    const Channels m_source; ///< a copy: it may be the destination
    const Side& m_from;
    const Side& m_to;
    Op m_op;
    Channels m_result;
};

/// The cels of an edit, which stand before its levels.
std::vector<cel*> celsOf(const Edit& edit) {
    std::vector<cel*> cels;
    for (int i = 0; i < edit.getNumChans() && edit.get_edit_cel_p(i) != nullptr; ++i) {
        cels.push_back(edit.get_edit_cel_p(i));
    }
    return cels;
}

Channels readFrames(const Edit& edit, std::string& problem) {
    Channels channels;
    channels.kinds = kindsOf(edit);
    for (const cel* const its : celsOf(edit)) {
        channels.rows.push_back(rows::rowOf(*its, kFrame, problem));
    }
    return channels;
}

class RandomRun {
public:
    explicit RandomRun(unsigned seed) : m_random(seed), m_levelsInStep(seed % 2 == 1) {
        for (int number = 1; number <= 3; ++number) {
            m_edits.push_back(build(number));
        }
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
        Side to = side(before, op);
        if (before.end() > 300) {
            op = Op::Remove;
            to = {pick(100), 200 + pick(100), 0, std::vector<bool>(before.rows.size(), true)};
        }
        const Channels from = readFrames(*source, problem);
        const Side of = side(from, Op::Replace);
        const auto expected = ByHand(from, of, before, to, op).run();
        const auto result = perform(module(source, of), module(edit, to), op, Editor::KeepClipboard, problem,
                                    !expected.has_value());
        if (result.valid() != expected.has_value()) {
            return problem + (expected ? "refused" : "done where it should be refused");
        }
        const Channels after = expected ? readFrames(*edit, problem) : Channels();
        for (size_t i = 0; i < after.rows.size(); ++i) {
            if (shown(after, i) != shown(*expected, i)) {
                return "another content of channel " + std::to_string(i);
            }
        }
        return problem;
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
        std::string problem;
        const EditModule to = wildModule(edit);
        (void)perform(wildModule(source), to, op, Editor::KeepClipboard | static_cast<unsigned>(pick(2)),
                      problem);
        return problem;
    }

private:
    /// Performs an operation. A refusal has a reason and changes nothing; what keeps the lengths of channels
    /// keeps them; and the edit is sound.
    Editor::Result perform(const EditModule& source, const EditModule& to, Op op, unsigned flags,
                           std::string& problem, bool mayBeRefused = true) {
        const EditPtr& edit = m_edits[0];
        const String before = mayBeRefused ? contentState(*edit) : String();
        std::vector<double> ends;
        for (const cel* const its : celsOf(*edit)) {
            ends.push_back(its->get_end_time());
        }
        Editor::Result result = Editor::apply(source, to, op, flags);
        const std::string what = String(editOperationName(op)) + ": " + result.reason() + ": ";
        if (!result.valid()) {
            problem += contentState(*edit) == before && !result.reason().empty() ? "" : what + "changed";
            return result;
        }
        for (size_t i = 0; i < ends.size() && !editOpCanAffectTrackLength(op); ++i) {
            if (std::abs(celsOf(*edit)[i]->get_end_time() - ends[i]) > 2e-6) {
                problem += what + "the length of channel " + std::to_string(i);
            }
        }
        const std::string fault = faultOf(*edit);
        problem += fault.empty() ? "" : what + fault;
        addCues();
        return result;
    }

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
        EditPtr edit = editOf({"E ", "V ", "V ", "A ", "A ", "A "}, number);
        for (int chan = 0; chan < 6; ++chan) {
            cel& its = *edit->get_edit_cel_p(chan);
            AudLevelsCel levels = AudLevelsCel::create();
            int at = 0;
            int kind = 0;
            for (int i = 0; i < 8; ++i) {
                const int length = 1 + pick(20);
                kind = kind == 0 ? 1 + pick(4) : pick(5); // never black after black
                const cookie strip = kind == 0 ? black_cookie : cookie(Cookie_Type::Material, 1 + pick(9), 0);
                if (kind > 0 || chan > 0) {
                    its.appendEventPair(strip, kind == 0 ? 0 : pick(5000) * kFrame, at * kFrame,
                                        (at + length) * kFrame - at * kFrame);
                    levels.insertNode(at * kFrame, levelOf(strip));
                    levels.insertNode((at + length) * kFrame - 1e-5, levelOf(strip));
                }
                at += length;
            }
            if (chan >= 3) {
                (void)edit->addLevelsChan(edit->getId(chan), levels);
            }
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
        edit.get_edit_cel_p(pick(6))->remove({pick(100) * kFrame, 1000});
        for (cel* const its : celsOf(edit)) {
            its->simplify(Simplification::MergeBlack); // what the cues kept apart
        }
        addCues();
    }
    void addCues() {
        const auto cels = celsOf(*m_edits[0]);
        cue_list& cues = m_edits[0]->get_cues();
        while (cues.get_num_cue_points(0) < 8) {
            cues.add_cue_point("cue", pick(100) * kFrame, pick(6), 0, {cels.begin(), cels.end()}, true);
        }
    }

    Side side(const Channels& channels, Op op) {
        Side made;
        made.current = pick(channels.end() + 20);
        const bool needsMarks = !editOpRequiresSourceAndDest(op) || pick(3) > 0;
        if (needsMarks || pick(2) == 0) {
            made.in = pick(channels.end() + 20);
        }
        if (needsMarks || pick(2) == 0) {
            made.out = std::max(0, std::max(made.in, 0) + pick(60) - 20);
        }
        for (size_t i = 0; i < channels.rows.size(); ++i) {
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

    /// What is wrong with an edit, or nothing.
    [[nodiscard]] std::string faultOf(const Edit& edit) const {
        std::set<IdStamp> stamps;
        size_t events = 0;
        for (int chan = 0; const cel* const its : celsOf(edit)) {
            const std::string where = " on channel " + std::to_string(chan);
            events += static_cast<size_t>(its->numEvents());
            for (int i = 0; i < its->numEvents(); ++i) {
                stamps.insert(its->getChanEventPtr(i)->id);
            }
            if (its->is_good_cel() == 0) {
                return "inconsistent events" + where;
            }
            const bool heard = m_levelsInStep && edit.getChanType(chan) == AudioChan;
            const AudLevelsCel levels = edit.getLevelsCel(edit.getAudCel(edit.getId(chan)).getLevelsChanID());
            for (int i = 0; i < its->numEvents(); i += 2) {
                const channel_event& in = *its->getChanEventPtr(i);
                const double middle = (in.editTime + its->getChanEventPtr(i + 1)->editTime) / 2;
                if (in.strip.isBlack() && isUnmerged(edit, *its, i)) {
                    return "black is followed by black" + where;
                }
                if (heard && !in.strip.isBlack() &&
                    std::abs(levels.getNodeStore().levelAt(middle) - double{levelOf(in.strip)}) > 1e-4) {
                    return "the level is not that of the sound" + where;
                }
            }
            ++chan;
        }
        if (stamps.size() != events || edit.numGroups() != 1 || edit.getTrackGroup(0)->size() != 2) {
            return "two events have one stamp, or the group is broken";
        }
        for (size_t i = 0; i < edit.get_cues().get_num_cue_points(0); ++i) {
            const cue_point& cue = *edit.get_cues().get_cue_point(i, 0);
            const cel::Range pair = CEHPair(cue.event()).editRange();
            const bool outside = cue.editTime() < pair.start() - 1e-6 || cue.editTime() > pair.end() + 1e-6;
            if (cue.attached() && (cue.event().valid() == 0 || (cue.hasFlags(CueFlag::kInside) && outside))) {
                return "a cue at " + std::to_string(cue.editTime()) + " is not within its event";
            }
        }
        return "";
    }

    /// True if a pair of black is touched by the next, black too, and no cue is attached to either.
    static bool isUnmerged(const Edit& edit, const cel& its, int pair) {
        const channel_event* const next = its.getChanEventPtr(pair + 2);
        bool cued = false;
        for (size_t i = 0; i < edit.get_cues().get_num_cue_points(0); ++i) {
            const ce_handle& event = edit.get_cues().get_cue_point(i, 0)->event();
            const int cuedPair = event.index() / 2 * 2;
            cued = cued || (event.get_its_cel() == &its && (cuedPair == pair || cuedPair == pair + 2));
        }
        return next != nullptr && next->strip.isBlack() && !cued &&
               next->editTime <= its.getChanEventPtr(pair + 1)->editTime + 1e-6;
    }

    std::mt19937 m_random;
    const bool m_levelsInStep;
    std::vector<EditPtr> m_edits; ///< the destination, then the sources
};

TEST(EditorRandom, OperationsAgreeWithThoseMadeByHandAndNoMarksBreakAnEdit) {
    const RecordingLog quiet;
    for (unsigned seed = 1; seed <= kRuns; ++seed) {
        RandomRun run(seed);
        for (int i = 0; i < kOperations / kRuns; ++i) {
            ASSERT_EQ(run.step(), "") << "seed " << seed << ", operation " << i;
        }
        RandomRun wild(2 * seed); // levels of its own are not those of a shot's sound
        for (int i = 0; i < kOperations / kRuns / 5; ++i) {
            ASSERT_EQ(wild.wildStep(), "") << "seed " << seed << ", wild operation " << i;
        }
    }
}

/// The greatest difference between the material times that the channels play at one edit time.
double greatestDrift(const Edit& edit) {
    const cel& picture = *edit.get_edit_cel_p(0);
    double drift = 0;
    for (const cel* const sound : celsOf(edit)) {
        for (double time = 0.011; time < picture.get_end_time(); time += 0.37) {
            const cookie seen = picture.get_strip_cookie(time);
            if (seen != sound->get_strip_cookie(time)) {
                // The cut itself may lie between the two by what a time is rounded to.
                const bool atCut = seen == sound->get_strip_cookie(time + 1e-5) ||
                                   seen == sound->get_strip_cookie(time - 1e-5);
                drift = atCut ? drift : 1e9;
            } else if (!seen.isBlack()) {
                drift = std::max(drift, std::abs(picture.get_strip_time(time) - sound->get_strip_time(time)));
            }
        }
    }
    return drift;
}

TEST(EditorRandom, PictureAndSoundStayInStepToTheSample) {
    const RecordingLog quiet;
    const Qx::CurrentProject before = Qx::currentProject();
    for (const Qx::FrameRate::Code code :
         {Qx::FrameRate::Fps25, Qx::FrameRate::Fps29_97, Qx::FrameRate::Fps23_976}) {
        Qx::CurrentProject project = before;
        project.frameRateCode = code;
        Qx::setCurrentProject(project);
        const double frame = Qx::FrameRate(code).frameDuration();
        std::mt19937 random(77);
        const auto frames = [&](unsigned below) { return static_cast<int>(random() % below) * frame; };
        const auto build = [&](int number) {
            EditPtr edit = editOf({"V ", "V ", "V ", "A ", "A ", "A ", "A ", "A "}, number);
            for (cel* const its : celsOf(*edit)) {
                // Every channel plays one material through, but is cut at places of its own.
                const auto step = 1 + static_cast<int>(random() % 50);
                for (int at = 0; at < 5000; at += step) {
                    its->appendEventPair(cookie(Cookie_Type::Material, number, 0), 100 + at * frame,
                                         at * frame, std::min(at + step, 5000) * frame - at * frame);
                }
            }
            return edit;
        };
        const EditPtr edit = build(1);
        const EditPtr source = build(2);
        for (int i = 0; i < 1000; ++i) {
            const double at = frames(3000);
            const double length = frame + frames(200);
            const double from = frames(4000);
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
