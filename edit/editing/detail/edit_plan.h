#pragma once

#include "edit/editing/editor.h"
#include "edit/model/aud_levels_cel.h"
#include "edit/model/cel.h"
#include "edit/model/event_objects.h"
#include "platform/store/tag_bag.h"

#include <array>
#include <vector>

/// A channel of the destination that takes part in an operation.
struct Editor::Target {
    Edit::ChanType type;
    IdStamp chan;   ///< null until the channel is added
    IdStamp source; ///< what is laid comes from this channel; null for none
    IdStamp levels; ///< the levels channel of an audio channel; null for none
    bool needsLevels = false;
    double movesFrom = Qx::kNoTime; ///< what lies at or behind this time moves, by `shift`
    double shift = 0;
    bool moves = false; ///< something that is not black does
};

/// One change of one channel, ready to be made.
struct Editor::Step {
    edit_operation core = edit_operation::NoOperation; ///< `kCoreReplace` and its like
    size_t target = 0;
    double at = 0;                          ///< where it begins in the destination
    double length = 0;                      ///< of what is laid or removed
    std::shared_ptr<const cel> part;        ///< what is laid, from 0 to `length`
    std::shared_ptr<TagBag> objects;        ///< what is bound to events of the part; null for nothing
    std::vector<EventObjects::Bound> bound; ///< those, with where the whole of each would lie in the part
    bool blackBefore = false;               ///< the transition that the part begins with leads from black
    bool blackAfter = false;                ///< the one that it ends with leads to black
    AudLevelsCel levels;                    ///< its levels; an invalid one for none
    cel::Range levelsRange;
    bool withLevels = true;
    [[nodiscard]] double end() const { return at + length; }
};

/// All that an operation will do to the channels of its destination: typed values, worked out and checked
/// before anything is changed.
struct Editor::Plan {
    std::vector<Target> targets;
    std::vector<Step> steps;
    double at = 0; ///< the span in the destination that the operation is about
    double length = 0;
    double current = Qx::kNoTime; ///< `Result::curTime`
    double roundedBy = 0;         ///< how far a time of the source was moved to a whole frame, at most
};

/// Works out the plan of one operation. Changes nothing.
class Editor::Planner {
public:
    Planner(const EditModule& source, const EditModule& destination, edit_operation op, unsigned flags);

    /// Null with `refusal()` set when the operation is refused.
    [[nodiscard]] std::unique_ptr<Plan> plan();
    [[nodiscard]] const Qx::Status& refusal() const { return m_refusal; }
    /// What is to be told of a plan that was made (`Result::notice`).
    [[nodiscard]] String notice(const Plan& plan) const;

private:
    using Range = cel::Range;

    /// The place of a source's region in the destination, for one channel.
    struct Lay {
        Range region;    ///< in the source
        double at = 0;   ///< of the region's start in the destination
        double open = 0; ///< where an insert opens the channel
    };

    bool refuse(String reason, Qx::StatusCode code = Qx::StatusCode::BadArgument);
    // edit_planner.cpp
    bool checkOperation();
    bool planWithSource();
    bool planPass(const EditModule& destination, bool otherEyes);
    bool pairChannels(const EditModule& destination, Edit::ChanType type, std::vector<Target>& pairs);
    bool findSourceSpan();
    bool findLay(const Target& target, const EditModule& destination, Lay& lay);
    bool checkSourceRegion(const Range& region);
    bool addSourceSteps(Target target, const EditModule& destination);
    void addInsert(size_t target, const Lay& lay);
    void addFillBlack(size_t target, const Lay& lay);
    // edit_planner_within.cpp
    bool planWithin();
    bool planRemoveOrLift();
    bool planInterTrack();
    bool addSwap(const Vector<IdStamp>& chans);
    bool addCopies(const Vector<IdStamp>& chans);
    bool addFittingStep(const IdStamp& from, const IdStamp& to, const Range& region);
    [[nodiscard]] double endOf(const IdStamp& chan) const;
    // edit_planner_steps.cpp
    size_t addTarget(Target target);
    void addStep(edit_operation core, size_t target, double at, double length,
                 std::shared_ptr<const cel> part = nullptr);
    void addCopyStep(size_t target, double at, Edit& from, const IdStamp& chan, const Range& region,
                     double lead = 0);
    void addBlackStep(edit_operation core, size_t target, double at, double length);
    [[nodiscard]] bool mustHoldEnd(const Target& target, double to) const;
    bool destinationRegion(const EditModule& destination, const IdStamp& chan, Range& region);
    Range sourceRegion(const Range& exact);
    std::shared_ptr<cel> takePart(const cel* content, const Range& region, bool fillGaps, double lead);
    void takeObjects(Step& step, Edit& from, const cel& content, const Range& region);
    std::shared_ptr<cel> onFrames(const std::shared_ptr<cel>& part);
    bool checkSteps();
    bool checkStep(const Step& step);
    void findShifts();
    [[nodiscard]] double rounded(double time) const;
    [[nodiscard]] bool exact() const { return (m_flags & Editor::ExactTimes) != 0; }
    /// True if what comes from the source lies on other frames than the destination's.
    [[nodiscard]] bool changesRate() const { return !exact() && m_sourceRate != m_rate; }
    [[nodiscard]] String nameOf(const Target& target) const;

    EditModule m_source; ///< without the records of channels that are gone
    const EditModule& m_destination;
    edit_operation m_op;
    edit_operation m_core;
    unsigned m_flags;
    Qx::FrameRate m_rate; ///< of the destination
    Qx::FrameRate m_sourceRate;
    Range m_span;              ///< the module's source region
    double m_markedLength = 0; ///< of the destination's region, for the operations that fill it
    std::unique_ptr<Plan> m_plan;
    Qx::Status m_refusal;
};

namespace editing_detail {

/// The kinds of channel that an operation works on, in the order of the channel index.
inline constexpr std::array<Edit::ChanType, 3> kChannelKinds = {
    Edit::ChanType{VideoChan, Edit_Chan_SubType::ALIAS}, Edit::ChanType{VideoChan, Edit_Chan_SubType::NONE},
    Edit::ChanType{AudioChan, Edit_Chan_SubType::NONE}};

/// What a part of a channel is to be made of, so that no transition reaches out of it.
struct WholeEnds {
    /// The channel with each transition that does taken out: what is left of it shows the one clip that
    /// stays. Null when the channel itself will do.
    std::unique_ptr<cel> channel;
    bool blackBefore = false; ///< the part begins with a transition from black, which stays
    bool blackAfter = false;  ///< it ends with one to black
};
/// `objects` is where the transitions' nodes lie. With `materialOnly` no transition stays.
[[nodiscard]] WholeEnds wholeEnds(const cel& source, const cel::Range& region, TagBag& objects,
                                  bool materialOnly = false);
/// A cel of the content of `source` from `region.start()` on, `region.length()` long and beginning at 0, with
/// black where nothing lies if `fillGaps`. A null source gives a black or empty one.
[[nodiscard]] std::shared_ptr<cel> makePart(const cel* source, const cel::Range& region, bool fillGaps);
/// True for the channels whose gaps are filled with black: video and audio.
[[nodiscard]] inline bool isContinuous(const Edit::ChanType& type) {
    return type.subtype == Edit_Chan_SubType::NONE && (type.type == VideoChan || type.type == AudioChan);
}
/// The levels channel that belongs to an audio channel; an invalid one if there is none.
[[nodiscard]] AudLevelsCel levelsOf(const Edit& edit, const IdStamp& audio);
/// Gives an audio channel without levels a levels channel that says what its clips' own levels say. The null
/// stamp if that is not possible.
IdStamp addLevels(Edit& edit, const IdStamp& audio);
/// Makes the revision of an edit that undo goes back to; nothing for one that the manager does not have.
/// False, with the refusal and nothing changed, if the manager cannot.
[[nodiscard]] bool makeRevision(const EditPtr& edit, Qx::Status& refusal);
/// True if an edit may be changed by the current user.
[[nodiscard]] bool isWritable(const Edit& edit);
/// A time rounded to whole frames; as it is for an unknown rate.
[[nodiscard]] double roundTo(Qx::FrameRate rate, double time);
/// A plain time for messages: seconds with up to three decimals.
[[nodiscard]] String secondsText(double seconds);

} // namespace editing_detail
