#include "edit/model/channel_view.h"

#include "edit/model/edit.h"

namespace {

/// Passes channels by type and subtype.
class TrackTypeFilter final : public ChannelView::iFilter {
public:
    TrackTypeFilter(const EditPtr& edit, unsigned types, unsigned include, unsigned exclude)
        : m_edit(edit), m_types(types), m_include(include), m_exclude(exclude) {}

    [[nodiscard]] bool accept(const IdStamp& chan) const override {
        const Edit::ChanType kind = m_edit->getChanTypeAndSubType(chan);
        const auto subtype = static_cast<unsigned>(kind.subtype);
        if ((m_types & kind.type) == 0) {
            return false;
        }
        const bool included = m_include == kEverySubtype || (m_include & subtype) != 0;
        if (included && (m_exclude & subtype) == 0) {
            return true;
        }
        return m_include == 0 && subtype == 0;
    }

private:
    static constexpr auto kEverySubtype = static_cast<unsigned>(Edit_Chan_SubType::ANY);

    const EditPtr& m_edit;
    unsigned m_types;
    unsigned m_include;
    unsigned m_exclude;
};

} // namespace

ChannelView::iFilter::~iFilter() = default;

void ChannelView::addTracks(Vector<IdStamp>& chans, const iFilter& filter) const {
    if (!m_edit.valid()) {
        return;
    }
    Vector<IdStamp> all;
    m_edit->getChans(all, VideoChan, Edit_Chan_SubType::ANY);
    m_edit->getChans(all, AudioChan, Edit_Chan_SubType::ANY);
    for (const IdStamp& chan : all) {
        const bool grouped = m_edit->isGrouped(chan);
        if ((grouped && !m_edit->isFirstInGroup(chan)) || !filter.accept(chan)) {
            continue;
        }
        if (grouped && m_expanded) {
            m_edit->getGroupContainingChan(chan, chans);
        } else {
            chans.push_back(chan);
        }
    }
}

void ChannelView::getChannelOrder(Vector<IdStamp>& chans, unsigned types, unsigned include,
                                  unsigned exclude) const {
    addTracks(chans, TrackTypeFilter(m_edit, types, include, exclude));
}

void ChannelView::getChannelOrder(Vector<int>& chans, unsigned types, unsigned include,
                                  unsigned exclude) const {
    Vector<IdStamp> stamps;
    for (const Edit_Chan_Type type : {VideoChan, AudioChan}) {
        if ((types & type) != 0) {
            addTracks(stamps, TrackTypeFilter(m_edit, type, include, exclude));
        }
    }
    for (const IdStamp& chan : stamps) {
        chans.push_back(m_edit->getIdx(chan));
    }
}

void ChannelView::getChannelOrder(ChannelIndexList& chans, unsigned types, unsigned include,
                                  unsigned exclude) const {
    Vector<int> order;
    getChannelOrder(order, types, include, exclude);
    for (const int chan : order) {
        chans.append(chan);
    }
}
