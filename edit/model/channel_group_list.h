#pragma once

#include "edit/model/channel_group.h"
#include "platform/store/streamable_layer.h"
#include "platform/store/taggable.h"

#include <vector>

/// The groups of an edit, in order, kept in the edit's object store. It owns its groups and knows nothing of
/// the edit, of which channels exist, of dirt or of notification.
///
/// A group has at least two members and no member twice; what would leave one with fewer removes it. That a
/// channel is in at most one group is up to `Edit::groupChannels`, through which groups are made. Stamps that
/// are given to a change may be members of the list's own groups. Not thread-safe.
class QM_API ChannelGroupList : public StreamableLayer, public Taggable {
public:
    /// The names in the object store. They live in files: do not change them.
    static constexpr const char* Id = "ChannelGroupList";
    static constexpr const char* IdForDefaultGrouping = "DefaultChannelGroupList";

    ChannelGroupList() : StreamableLayer(kForm) {}
    ChannelGroupList(const ChannelGroupList&) = default;
    ChannelGroupList& operator=(const ChannelGroupList& other);
    ~ChannelGroupList() override;

    [[nodiscard]] unsigned size() const { return static_cast<unsigned>(m_groups.size()); }
    /// Null for an index out of range. Valid until the list's next change.
    [[nodiscard]] const ChannelGroup* getGroup(unsigned i) const;
    /// Appends a group of those stamps whose magic type is that of a channel (2), in order, each once. Adds
    /// nothing (false) when not more than one remains.
    bool addGroup(const Vector<IdStamp>& chans, ChannelGroup::eType type);
    /// Index of the first group with the stamp as a member; -1 if none.
    [[nodiscard]] int findGroupContaining(const IdStamp& chan) const;
    [[nodiscard]] bool isMember(const IdStamp& chan) const { return findGroupContaining(chan) >= 0; }
    /// Appends the members of a group in order; nothing for an index out of range.
    void getGroupContents(unsigned i, Vector<IdStamp>& chans) const;
    /// False for an index out of range.
    bool destroyGroup(unsigned i);
    /// Removes the groups of a type, or all for `ChannelGroup::eAll`. Returns how many went.
    unsigned destroyAllGroups(ChannelGroup::eType type);
    /// Takes a channel out of every group it is in; a group left with one member goes. False if it is in
    /// none.
    bool removeMember(IdStamp chan);
    /// The stamp `from` becomes `to` wherever it is a member. False, changing nothing, if it is nowhere, or
    /// `to` is null or a member already.
    bool replaceMember(IdStamp from, IdStamp to);

    [[nodiscard]] const TagTypeId& tagTypeId() const override;

    /// Packed: a count, then per group a revision byte (2), the number of members, per member a revision byte
    /// (2) and the stamp, and the type.
    void pack(PStream& stream) const override;
    /// Groups of a revision below 2 have no type and get the plain one. Null stamps, and stamps that are in
    /// an earlier place already, are passed over, and then groups with fewer than two members. A wrong count
    /// or a revision from the future puts the stream into its error state; the list is then as it was.
    void unpack(PStream& stream) override;
    [[nodiscard]] std::unique_ptr<Streamable> clone(BuilderType type = BuilderType::Copy) const override;

    /// The same groups in the same order; revisions do not count.
    bool operator==(const ChannelGroupList& other) const { return m_groups == other.m_groups; }

    static const Form kForm;

private:
    std::vector<ChannelGroup> m_groups;
};
