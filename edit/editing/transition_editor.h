#pragma once

#include "edit/model/cel.h"
#include "edit/model/edit_ptr.h"
#include "edit/model/transition.h"
#include "platform/effects/effect_instance.h"

/// Where a transition lies about the cut that it covers. Here it is four seconds long, and the cut of A and B
/// lies between the letters of the first line:
///
///                AAAAAABBBBBB
///     Start      AAAAAA----BB     begins at the cut: only A plays on
///     Centre     AAAA----BBBB
///     End        AA----BBBBBB     ends at the cut: only B plays before
enum class TransitionAlign { Start, Centre, End };

/// "start", "centre" (also "center") and "end", without regard to case. False, leaving `align`, for others.
[[nodiscard]] QM_API bool transitionAlignFromText(std::string_view text, TransitionAlign& align);

/// Lays, changes and takes out transitions: event pairs between the clips that they join, on the clips' own
/// channel (video or audio), whose effect has two inputs that are not wired.
///
/// A transition covers a cut. The clips give way to it, so that nothing overlaps and nothing moves; under it
/// both play on, and taking it out gives back the clips and their cut:
///
///     AAAAAABBBBBB  <->  AAAA----BBBB
///
/// Where the cut lay is kept by what the clips play, not by a record: a transition that is taken out leaves
/// its cut in its middle. Lengths and times are seconds; unless `Editor::ExactTimes` is given they are
/// rounded to whole frames. A cut is found from any time within half a frame of it.
///
/// An operation is whole or not at all, is backed up, announced once (`kEffectsChanged`) and undone like
/// those of `Editor`, whose flags `ExactTimes` and `NoBackup` it takes. It never shortens what was asked for:
/// what needs more material than there is, is refused and says how much is missing.
///
/// Threads as for `Editor`.
class QM_API TransitionEditor {
public:
    /// Besides flags of `Editor`: what the material has is not asked for. For who builds an edit whose
    /// material is not there yet.
    static constexpr unsigned WithoutHandles = 256;

    /// The outcome. The default is that of an operation that did nothing.
    struct Result {
        bool done = false;
        String reason;                ///< why it was refused: one line for a person
        String notice;                ///< what a person should know of one that was done; mostly empty
        IdStamp event;                ///< of the transition: the stamp of its in event and of its node
        cel::Range range;             ///< where it lies, or lay
        Transitions::Handles handles; ///< what it needs
    };

    /// Lays a transition over the cut at `at` between two clips, or a clip and black or nothing (a fade in or
    /// out). `effect` is copied; it has to be a transition (`EffectInstance::isTransition`), one of sound for
    /// an audio channel. Refused where no cut is, where a transition lies, and when it would reach beyond
    /// either clip or need more material than there is.
    static Result add(const EditPtr& edit, const IdStamp& chan, double at, const EffectInstance& effect,
                      double length, TransitionAlign align = TransitionAlign::Centre, unsigned flags = 0);

    /// Changes the transition that plays at `at`: its effect, unless that is null; its length, unless that is
    /// 0; and lays it about the cut that was in its middle as `align` says, unless it keeps its length and
    /// `align` is `Centre`. The event keeps its stamp.
    static Result set(const EditPtr& edit, const IdStamp& chan, double at, const EffectInstance* effect,
                      double length, TransitionAlign align = TransitionAlign::Centre, unsigned flags = 0);

    /// Takes out the transition that plays at `at`. Its clips meet in its middle; its graph is noted in
    /// the edit's list of orphans.
    static Result remove(const EditPtr& edit, const IdStamp& chan, double at, unsigned flags = 0);

    /// The in event of the transition that plays at a time; invalid if none does.
    [[nodiscard]] static ce_handle find(const EditPtr& edit, const IdStamp& chan, double at);
    /// What the transition that plays at a time needs.
    [[nodiscard]] static Transitions::Handles handlesOf(const EditPtr& edit, const IdStamp& chan, double at);

    TransitionEditor() = delete;
};
