#include "edit/model/edit.h"
#include "edit/model/edit_keys.h"

#include "edit/model/channel_group_list.h"
#include "platform/services/log.h"
#include "platform/store/tag_bag.h"

#include <algorithm>

bool Edit::isDefaultGroupingPresent() const {
    if (get_log_type() != kLogShot) {
        return false;
    }
    const ChannelGroupList* defaults = retrieveDefaultGroupsList();
    return defaults != nullptr && defaults->size() > 0;
}

bool Edit::applyDefaultGrouping() {
    ChannelGroupList* list = isDefaultGroupingPresent() ? retrieveGroupsList() : nullptr;
    if (list == nullptr || refusesChange()) {
        return false;
    }
    const ChannelGroupList& defaults = *retrieveDefaultGroupsList();
    ChannelGroupList applied;
    for (unsigned i = 0; i < defaults.size(); ++i) {
        Vector<IdStamp> chans;
        defaults.getGroupContents(i, chans);
        std::erase_if(chans, [this](const IdStamp& chan) { return !chanValid(chan); });
        applied.addGroup(chans, defaults.getGroup(i)->getType());
    }
    if (!(applied == *list)) {
        *list = applied;
        groupsChanged();
    }
    return true;
}

bool Edit::updateDefaultGroupingForShot() {
    const ChannelGroupList* list = get_log_type() == kLogShot ? retrieveGroupsList() : nullptr;
    if (list == nullptr) {
        return false;
    }
    const ChannelGroupList* defaults = retrieveDefaultGroupsList();
    const bool unreadable = defaults == nullptr && m_store.contains(ChannelGroupList::IdForDefaultGrouping);
    if (unreadable || (defaults != nullptr ? *defaults == *list : list->size() == 0) || refusesChange()) {
        return false;
    }
    if (list->size() == 0) {
        m_store.removeObject(ChannelGroupList::IdForDefaultGrouping);
    } else {
        m_store.storeObject(ChannelGroupList::IdForDefaultGrouping,
                            std::make_unique<ChannelGroupList>(*list));
    }
    groupsChanged();
    return true;
}

String Edit::getGroupTextFromED2() const {
    return EditKeys::kLegacyGroups.get(m_header);
}

void Edit::updateChannelGroups() {
    const String text = getGroupTextFromED2();
    if (text.empty()) {
        return;
    }
    ChannelGroupList* list = retrieveGroupsList();
    if (list == nullptr) {
        LogBoth("Warning: Could not obtain GroupList object in Edit::updateChannelGroups\n");
        return;
    }
    for (const String& group : text.split('-', true)) {
        Vector<IdStamp> chans;
        for (const String& number : group.split('A', true)) {
            const IdStamp chan = getChanWithName("A" + number.trimmed());
            // A text that names a channel twice leaves it in its first group.
            if (chan.valid() && !list->isMember(chan)) {
                chans.push_back(chan);
            }
        }
        list->addGroup(chans, ChannelGroup::ePlain);
    }
    m_header.remove(EditKeys::kLegacyGroups);
}
