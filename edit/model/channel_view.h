#pragma once

#include "edit/model/channel_index_list.h"
#include "edit/model/channel_types.h"
#include "edit/model/edit_ptr.h"
#include "platform/base/id_stamp.h"
#include "platform/base/vector.h"

/// Lists an edit's channels in the order in which they are displayed: video channels, effects first, then
/// audio. The members of a channel group stand at the place of its first member: all of them, in group order,
/// when groups are expanded, else the first alone, for the group. What a group's first member is decides
/// whether a filter lets the group through.
///
/// Holds a handle of the edit; owns nothing else. Lists are appended to, never emptied. Not thread-safe.
class QM_API ChannelView {
public:
    /// A test of channels.
    class QM_API iFilter {
    public:
        virtual ~iFilter();
        [[nodiscard]] virtual bool accept(const IdStamp& chan) const = 0;
    };

    ChannelView(const EditPtr& edit, bool groupsExpanded) : m_edit(edit), m_expanded(groupsExpanded) {}

    void setEdit(const EditPtr& edit) { m_edit = edit; }
    void setGroupsExpanded(bool expanded) { m_expanded = expanded; }
    [[nodiscard]] bool groupsExpanded() const { return m_expanded; }

    /// Appends the channels that pass a filter. Nothing without an edit.
    void addTracks(Vector<IdStamp>& chans, const iFilter& filter) const;
    void getChannelOrder(Vector<IdStamp>& chans, const iFilter& filter) const { addTracks(chans, filter); }
    /// Channels of a type in `types` whose subtype passes. `include` 15 stands for every subtype, 0 for
    /// `NONE` alone, else a subtype passes that has a bit in common with it; a bit in common with `exclude`
    /// rejects unless `include` is 0 and the subtype `NONE`.
    void getChannelOrder(Vector<IdStamp>& chans, unsigned types, unsigned include, unsigned exclude) const;
    /// The same order as indices: the video channels if `types` has bit 1, then the audio channels if bit 2.
    void getChannelOrder(Vector<int>& chans, unsigned types, unsigned include, unsigned exclude) const;
    void getChannelOrder(ChannelIndexList& chans, unsigned types, unsigned include, unsigned exclude) const;

private:
    EditPtr m_edit;
    bool m_expanded;
};
