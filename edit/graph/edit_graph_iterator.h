#pragma once

#include "edit/graph/edit_graph_iterator_state.h"
#include "edit/graph/itor_stack_entry.h"
#include "platform/effects/fx_graph_node_base.h"

#include <functional>
#include <memory>

namespace EditGraph {
class Trail;
}

/// Walks the graph of what is seen or heard at a time: from a root (a channel, an event or a node) down through the
/// inputs of effects, channels that show other channels, and edits within edits. It keeps a stack of positions,
/// each with the mapping of times that leads to it.
///
///     EditGraphIterator at(edit, fxChannel, 12.5, EditGraphIterator::kBidirectional);
///     if (at.moveToInput(0)) { use(at.getChanId(-1), at.applyTimeTransformsStackTo(12.5, false)); at.moveBack(); }
///
/// A bidirectional iterator keeps every level; another keeps the present one alone, and the mapping. It holds the
/// edits that it came to, and changes nothing in them. What was found stays as it was when an edit is changed;
/// steps from there see the changed one.
///
/// A step to or from a level that the stack has had allocates nothing. Not thread-safe.
///
/// Levels: 0 is the root; -1 stands for the present one. A query of a level that is not there, or of an invalid
/// iterator, answers an empty value: null, `NO_CHAN`, `Qx::kNoPairTime`, `Editable::invalidRange()`. A move or a
/// search of an invalid iterator answers false. A move that answers false has changed nothing.
class QM_API EditGraphIterator {
public:
    using Extents = NumRange<double, Ordered>;
    using RangeType = CelEventPair::RangeType;

    /// \name Iteration flags, or'ed
    /// @{
    static constexpr int kBidirectional = 1;
    /// Goes on into the edits that events of material show.
    static constexpr int kTraverseGhosts = 2;
    /// Asks sources how far their material goes, and narrows the extents to that.
    static constexpr int kMaterialShortfallDetection = 4;
    /// @}

    /// What `search` compares with the stamp that is sought.
    enum SearchType : int {
        NodeId = 0,       ///< the stamp of the effect node
        InputTrackId = 1, ///< what its inputs name
        ChanId = 2        ///< the stamp of the channel
    };

    /// How many levels a search goes down.
    static constexpr int kMostSearchLevels = 50;
    /// How many references in a row are followed from edit to edit.
    static constexpr int kMostNestedEdits = 50;

    /// \name Construction
    /// The root is left out, so that the stack is empty, where it would be on picture without an effect; it is kept
    /// for sound, and for an event or a node that is given. Where nothing plays the iterator is invalid.
    /// @{
    /// Empty and invalid.
    explicit EditGraphIterator(int flags = kBidirectional);
    /// At the event of a channel at a time.
    EditGraphIterator(const EditPtr& edit, const IdStamp& trackId, const double& time,
                      int flags = kBidirectional);
    EditGraphIterator(const EditPtr& edit, int chanIndex, const double& time, int flags = kBidirectional);
    /// At an event.
    EditGraphIterator(const CelEventPair& pair, double time, int flags = kBidirectional);
    /// At a node without an event; `extents` stands for that.
    EditGraphIterator(EditPtr edit, double time, Tag<FXGraphNodeBase> node, const Extents& extents,
                      int flags = kBidirectional);
    EditGraphIterator(const EditGraphIterator& other);
    /// With other flags. What is not bidirectional gets the present level alone.
    EditGraphIterator(const EditGraphIterator& other, int flags);
    /// From the text of a state.
    explicit EditGraphIterator(const String& state);
    /// At the position that a state names: the edit is opened, and the node sought from its roots.
    explicit EditGraphIterator(const EditGraphIteratorState& state);
    EditGraphIterator& operator=(const EditGraphIterator& other);
    virtual ~EditGraphIterator();
    /// @}

    /// The same root, time, flags and levels.
    bool operator==(const EditGraphIterator& other) const;

    /// \name Navigation
    /// @{
    /// Down into an input of the present effect. Of an effect with explicit inputs, to what the input names; of a
    /// transition's unwired inputs, to the event before it (0) or behind it (1) on its channel. False for an input
    /// that is not there or not wired, and where nothing plays.
    bool moveToInput(unsigned input);
    /// One level up; bidirectional only. The extents stay as narrow as they are.
    bool moveBack();
    /// To the root; bidirectional only. False when there is none.
    bool moveBackAll();
    /// To the head of the compound effect that the present node is a member of; true without a move where the node
    /// is a head itself and no member. False when there is none above.
    bool moveBackToCompoundEffect();
    void invalidate();
    /// @}

    /// \name Queries
    /// @{
    [[nodiscard]] Tag<FXGraphNodeBase> getNodeH(int level = -1) const;
    [[nodiscard]] IdStamp getNodeId(int level = -1) const;
    /// The channel, in the edit of the level (`getCurrentPosEdit`).
    [[nodiscard]] IdStamp getChanId(int level = -1) const;
    [[nodiscard]] int getChanIndex(int level = -1) const;
    /// The event's in point. Good until the cel's next change.
    [[nodiscard]] ce_handle getUTRHandle(int level = -1) const;
    /// Ends of `getRange`, in times of the level's edit.
    [[nodiscard]] double getStartEditTime(int level = -1, RangeType type = RangeType::CutToCut) const;
    [[nodiscard]] double getEndEditTime(int level = -1, RangeType type = RangeType::CutToCut) const;
    /// The event's range of a type. Of a neighbour that a transition leads from, and that is no material, the two
    /// types are exchanged.
    [[nodiscard]] Extents getRange(int level = -1, RangeType type = RangeType::CutToCut) const;
    /// The level itself; null when it is not there. Good until the iterator's next move.
    [[nodiscard]] const ItorStackEntry* getEntry(int level = -1) const;
    /// The root edit.
    [[nodiscard]] EditPtr getEditH() const;
    /// The edit of the present level; the root edit without levels.
    [[nodiscard]] EditPtr getCurrentPosEdit() const;
    /// The input through which the present level was reached; -1 for the root.
    [[nodiscard]] int getParentInputNum() const;
    /// How many levels are kept.
    [[nodiscard]] int getStackDepth() const { return m_current + 1; }
    /// The root time, as given.
    [[nodiscard]] double getTime() const { return m_time; }
    /// The channel or the node that the iterator began at.
    [[nodiscard]] IdStamp getRootTrackID() const { return m_valid ? m_rootTrackId : IdStamp(); }
    [[nodiscard]] int getIterationFlags() const;
    /// The span of root times around `getTime` in which the walk so far would give the same.
    [[nodiscard]] const Extents& getExtents() const { return m_extents; }
    void setExtents(const Extents& extents) { m_extents = extents; }
    /// Narrows the extents to a span of root times, as far as its ends lie in them. A span of no length is replaced.
    void updateExtents(double a, double b);
    /// Where the root edit ends.
    [[nodiscard]] double getEditEndTime() const;
    /// The product of the opacities of the effects on the way down from the root, the present one included, at a
    /// root time; 1 without any. Levels that are not kept do not count.
    [[nodiscard]] double getAlphaAt(double time) const;
    /// The product of the opacities of the compound effect that the present node is the head or a member of, at
    /// `getTime`; else that of the node.
    [[nodiscard]] double getCompoundAlpha() const;
    [[nodiscard]] bool isCompoundEffectHead() const;
    [[nodiscard]] bool isValid() const { return m_valid; }
    [[nodiscard]] bool isBidirectional() const { return m_bidirectional; }
    /// The time in the edit of the present level for a root time, or with `inverse` the other way.
    [[nodiscard]] double applyTimeTransformsStackTo(double time, bool inverse) const;
    /// The position as text; empty when it has none that could be found again.
    [[nodiscard]] String asString() const;
    /// @}

    /// \name Searching
    /// From the present level downwards, inputs in their order, `kMostSearchLevels` deep. Where a search would go deeper
    /// or comes to a loop it gives that way up and says so in the log. Every place is searched once, so the effort
    /// grows with the number of nodes, not with that of the ways to them.
    /// @{
    /// Moves to what is sought. A search that is not bidirectional compares stamps of nodes, whatever the type, and
    /// follows no edits within edits. False, staying, when it is not found.
    bool search(const IdStamp& id, SearchType type);
    bool search(const Tag<FXGraphNodeBase>& node);
    /// Moves to the next place of the present node in the rest of the graph; bidirectional only. When there is none,
    /// false, and the iterator is at the root.
    bool searchNext();
    /// @}

    /// \name Listing
    /// They append, each item once, in the order in which a walk down the inputs meets them. They follow no edits within
    /// edits: tracks are those of the edit of the present level.
    /// @{
    /// The channels that the inputs of the present effect name, by index.
    void findInputTracksRaw(Vector<int>& tracks) const;
    /// The nodes of the present effect: its node, those of the same graph and the members of the compound effect.
    void findComponentsForCurrentEffect(Vector<Tag<FXGraphNodeBase>>& nodes) const;
    /// Those that can be opened. The edit owns them.
    void findComponentsForCurrentEffect(Vector<FXGraphNodeBase*>& nodes) const;
    /// The same of the present effect and all effects below it.
    void findAllComponents(Vector<Tag<FXGraphNodeBase>>& nodes) const;
    void findAllComponents(Vector<FXGraphNodeBase*>& nodes) const;
    /// The channels on which the material lies that is seen or heard through the present position; black is none.
    void findMaterialTracks(Vector<int>& tracks) const;
    void findMaterialTracks(Vector<IdStamp>& tracks) const;
    /// The node of the material that the present picture is made from, down its first inputs. Names nothing where
    /// material has no node.
    [[nodiscard]] Tag<FXGraphNodeBase> findOriginalMaterialNodeForVTrackUTR() const;
    /// Narrows the extents to where all that lies below by explicit inputs stays the same, and returns them.
    Extents calculateMorphologyExtentsExplicit();
    /// Calls `visit` at the present position and at everything below it, with an iterator there, no more than
    /// `kMostSearchLevels` levels down. A place that several ways lead to is visited at least once.
    void visitBelow(const std::function<void(const EditGraphIterator&)>& visit) const;
    /// @}

    /// \name Classification of event pairs
    /// @{
    /// A valid pair whose object is material, by the magic type of its stamp; black is a kind of it.
    [[nodiscard]] static bool isMaterialUtr(const CelEventPair& pair);
    /// A pair that shows another channel, or an edit. Whether a source is an edit is asked by opening it.
    [[nodiscard]] static bool isAliasUtr(const CelEventPair& pair);
    /// The channel that a pair shows; null for one that shows none.
    [[nodiscard]] static IdStamp getAliasedTrackId(const CelEventPair& pair);
    /// The edit that a pair of material shows; null for other material, and for what cannot be opened.
    [[nodiscard]] static EditPtr getGhostEdit(const CelEventPair& pair);
    /// @}

private:
    using Transforms = Vector<EditByRefTimeTransform>;
    using EntryPtr = std::unique_ptr<ItorStackEntry>;

    void setFlags(int flags);
    void init(const IdStamp& track);
    void initFromPair(CelEventPair pair, bool keepsMaterial);
    void restore(const EditGraphIteratorState& state);
    void copyFrom(const EditGraphIterator& other, int flags);
    void clear();
    void countTransforms();

    [[nodiscard]] ItorStackEntry* entryAt(int level) const;
    [[nodiscard]] EffectInstance* currentEffect() const;
    [[nodiscard]] EntryPtr freshEntry();
    void recycle(EntryPtr entry);
    void addStackItem(EntryPtr entry);
    [[nodiscard]] const ItorStackEntry* findStackEntryWithDuration() const;
    [[nodiscard]] double mapToLevel(double time, int level) const;
    [[nodiscard]] double opacityAt(int level, double time) const;

    [[nodiscard]] bool moveToInputExplicit(const IdStamp& source, ItorStackEntry& entry);
    [[nodiscard]] bool moveToInputImplicit(unsigned input, const EffectInstance& effect,
                                           ItorStackEntry& entry);
    void fill(ItorStackEntry& entry, CelEventPair pair, double time);
    void traverseAliasing(CelEventPair& pair, double& time, Transforms& transforms);
    void traverseTrackAliasing(CelEventPair& pair, double time, Transforms& transforms);
    void traverseGhostAliasing(CelEventPair& pair, double& time, Transforms& transforms);
    void narrowExtents(double a, double b, const Transforms& transforms);
    void narrowToGap(const IdStamp& track);
    void constrainMorphologyExtents(const CelEventPair& pair, double time, const Transforms& transforms);
    void hold(const EditPtr& edit);

    bool biDirectionalSearch(const IdStamp& id, SearchType type, EditGraph::Trail& trail);
    bool searchInternal(const EditGraphIterator& from, const IdStamp& id, int depth, unsigned firstInput,
                        EditGraph::Trail& trail);
    [[nodiscard]] bool matches(const IdStamp& id, SearchType type) const;
    void putEntryAt(int level, const EditGraphIterator& from);
    void visit(const std::function<void(const EditGraphIterator&)>& visitor, EditGraph::Trail& trail);

    Vector<EntryPtr> m_stack;
    Vector<EntryPtr> m_spares;  ///< entries that were left, for the next steps
    Transforms m_above;         ///< the mappings of levels that are not kept, outermost first
    size_t m_numTransforms = 0; ///< in `m_above` and the stack
    int m_current = -1;
    double m_time = Qx::kNoTime;
    IdStamp m_rootTrackId;
    EditPtr m_rootEdit;
    Extents m_extents{Qx::kNoTime, Qx::kNoTime};
    bool m_bidirectional = true;
    bool m_traverseGhosts = false;
    bool m_materialShortfallDetection = false;
    bool m_valid = false;
    Vector<EditPtr> m_held;
};

/// The channel that shows what is seen in the end of a channel at a time: the topmost effects channel over it, else
/// the channel itself.
[[nodiscard]] QM_API IdStamp findTopTrack(const EditPtr& edit, const IdStamp& track, double time);

/// The channel of an edit that is shown by a pair which plays it, at a time of the edit: that of the same type and
/// place as the pair's, else the first of the type, or the topmost effects channel over it. Null for an edit without.
[[nodiscard]] QM_API IdStamp findShownTrack(const CelEventPair& pair, const EditPtr& inner, double time);

/// Appends the channels of the material that is seen or heard on a channel at a time, by index.
QM_API void listMaterialSourceTracks(Vector<int>& tracks, const EditPtr& edit, const IdStamp& track,
                                     double time);
/// Appends every channel that takes part in it below the given one, which itself counts where it shows material.
QM_API void listAllSourceTracks(Vector<int>& tracks, const EditPtr& edit, const IdStamp& track, double time);
/// Appends the channels on which something other than black plays at a time and that no other channel shows.
QM_API void findAllRootNodeChans(EditPtr& edit, double time, Vector<IdStamp>& tracks);
