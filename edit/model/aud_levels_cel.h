#pragma once

#include "edit/model/managed_cel.h"
#include "platform/media/level_store.h"
#include "platform/store/tag_bag.h"

/// The level envelope of one audio channel: a store of nodes with its channel's stamp. Copying shares the
/// store; `clone` makes one of its own.
class QM_API AudLevelsCel {
public:
    using Store = Aud::DynamicLevelControl::Store;
    using Range = cel::Range;

    AudLevelsCel() = default;
    [[nodiscard]] static AudLevelsCel createInvalid() { return {}; }
    /// A new, empty one with a fresh channel stamp.
    [[nodiscard]] static AudLevelsCel create();
    ~AudLevelsCel();

    [[nodiscard]] const IdStamp& id() const { return m_id; }
    void id(const IdStamp& id) { m_id = id; }
    [[nodiscard]] bool valid() const { return m_contents != nullptr; }
    /// True for one that is invalid or has no node: it changes nothing that is heard.
    [[nodiscard]] bool is_dummy() const;
    [[nodiscard]] AudLevelsCel clone() const;

    /// The nodes. An invalid one has none.
    [[nodiscard]] const Store& getNodeStore() const;
    /// The nodes, to be changed; counts as a change. For an invalid one it is a programming error, which is
    /// reported; the object then becomes valid, with no node.
    Store& changeNodeStore();
    /// False for an invalid one.
    bool insertNode(double time, float level);
    [[nodiscard]] Range getExtents(Editable::ExtentType type = Editable::Everything,
                                   bool fromZero = false) const;
    /// The operations of the node store. False, with nothing changed, for an invalid one and for times that
    /// are not usable; `simplify` also where nothing was to drop. An invalid source counts as an empty one.
    bool insert(const AudLevelsCel& source, const Range& sourceRange, double at);
    bool remove(const Range& range);
    bool replace(const AudLevelsCel& source, const Range& sourceRange, double at);
    bool simplify();

    [[nodiscard]] bool changed() const;
    void setChanged(bool changed);

    /// Brings nodes of an older revision up to date with the channel that they belong to. Levels of revision
    /// 0 hold only what was drawn by hand, and the clips' own levels besides; since revision 1 the nodes
    /// stand for all that is done to the sound, so the clips' nodes are added (`replaceClipNodes`). False if
    /// nothing was to do.
    bool checkNodesRevision(const AudCel& audio);
    /// Rebuilds the nodes that come from the clips' own levels: each clip of material whose level is not 1 at
    /// both ends gets a node at its in point and one at its out point, in the place of what nodes lie
    /// between; the envelope outside the clip stays as it was (`Store::kStep`). The clips are not changed.
    /// False, with nothing changed, if no clip has levels of its own or the nodes are there already.
    bool replaceClipNodes(const AudCel& audio);

    /// Lends the levels to the store under their stamp's text.
    void writeToStore(TagBag& store) const;
    /// The levels with a stamp; an invalid one if the store has none that reads.
    [[nodiscard]] static AudLevelsCel createFromStore(const IdStamp& id, TagBag& store);
    /// Ends the lending after a save.
    void extractFromStore(TagBag& store) const;

private:
    class Contents;
    Qx::Ptr<Contents> m_contents;
    IdStamp m_id;
};
