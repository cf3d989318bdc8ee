#pragma once

#include "platform/base/num_range.h"
#include "platform/effects/fx_graph_node_base.h"
#include "platform/store/streamable_layer.h"

/// The effects of an edit whose events are gone: the head of each graph, with the span over which it applied,
/// so that it can be found again, brought back or cleaned up. The nodes themselves lie where they lay. It is
/// kept in the edit's object store and knows nothing of events. Not thread-safe.
class QM_API OrphanedComponentList : public StreamableLayer, public Taggable {
public:
    using Range = NumRange<double, Ordered>;
    /// The name in the object store. It lives in files: do not change it.
    static constexpr const char* Id = "OrphanedComponentList";

    OrphanedComponentList() : StreamableLayer(kForm) {}
    OrphanedComponentList(const OrphanedComponentList&) = default;
    OrphanedComponentList& operator=(const OrphanedComponentList&) = default;
    ~OrphanedComponentList() override;

    /// Appends a node. One that is listed keeps its place and range.
    void add(const Tag<FXGraphNodeBase>& node, const Range& range);
    [[nodiscard]] bool isOrphan(const Tag<FXGraphNodeBase>& node) const;
    /// [0, 0] for a node that is not listed.
    [[nodiscard]] Range getRangeFor(const Tag<FXGraphNodeBase>& node) const;
    /// False for a node that is not listed. The order of the others stays.
    bool remove(const Tag<FXGraphNodeBase>& node);
    /// Appends the nodes whose range holds `t`, in the order of the list: from its start to before its end,
    /// both with the tolerance of times.
    void findIntersecting(double t, Vector<IdStamp>& nodes) const;
    [[nodiscard]] unsigned size() const { return static_cast<unsigned>(m_entries.size()); }
    /// The node at a place from 0; the null stamp beyond the end.
    [[nodiscard]] IdStamp operator[](size_t index) const;

    [[nodiscard]] const TagTypeId& tagTypeId() const override;
    /// Packed: a count, then for each entry a byte that is 2, the stamp, and the start and the end of its
    /// range.
    void pack(PStream& stream) const override;
    /// Ends that arrive in the wrong order are exchanged. On a bad stream the list is as it was.
    void unpack(PStream& stream) override;
    [[nodiscard]] std::unique_ptr<Streamable> clone(BuilderType type = BuilderType::Copy) const override;

    static const Form kForm;

private:
    struct Entry {
        IdStamp node;
        Range range;
    };
    [[nodiscard]] const Entry* find(const IdStamp& node) const;

    std::vector<Entry> m_entries;
};
