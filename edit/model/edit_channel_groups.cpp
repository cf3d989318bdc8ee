#include "edit/model/channel_group_list.h"
#include "edit/model/edit.h"
#include "platform/base/critical_section.h"
#include "platform/store/tag_bag.h"

#include <algorithm>
#include <functional>
#include <iterator>
#include <mutex>
#include <set>

namespace {

/// A list as it lies in the store; null if there is none or it cannot be read.
ChannelGroupList* openList(TagBag& store, const char* name) {
    return store.contains(name) ? dynamic_cast<ChannelGroupList*>(store.openObject(name)) : nullptr;
}

/// A list may name what is no channel of the edit: it is a file's, or was changed by its own operations.
auto isChannelOf(const Edit& edit) {
    return [&edit](const IdStamp& chan) { return edit.chanValid(chan); };
}

/// One piece of a group's name: a letter with a number, or a name of the channel's own (number 0).
struct Label {
    String text;
    int number = 0;
};

/// "A1-A4,B" from the labels in order: neighbours with one letter and rising numbers are joined.
String joinLabels(const Vector<Label>& labels) {
    const auto follows = [&](size_t i) {
        return labels[i].number > 0 && labels[i - 1].number > 0 && labels[i].text == labels[i - 1].text &&
               labels[i].number == labels[i - 1].number + 1;
    };
    const auto text = [&](size_t i) {
        const Label& label = labels[i];
        return label.number > 0 ? String(label.text + String::format("%d", label.number)) : label.text;
    };
    String name;
    for (size_t i = 0; i < labels.size(); ++i) {
        size_t last = i;
        while (last + 1 < labels.size() && follows(last + 1)) {
            ++last;
        }
        name += (name.empty() ? "" : ",") + text(i);
        if (last != i) {
            name += "-" + text(last);
        }
        i = last;
    }
    return name;
}

const char* typeText(ChannelGroup::eType type) {
    switch (type) {
    case ChannelGroup::eStereo:
        return "Stereo ";
    case ChannelGroup::eStereoscopic:
        return "Stereoscopic ";
    case ChannelGroup::eSurround:
        return "Surround ";
    default:
        return "";
    }
}

Label labelOf(const Edit& edit, const IdStamp& chan, bool ownNames) {
    if (ownNames && !edit.getChanName(chan).empty()) {
        return {edit.getChanDisplayName(chan), 0};
    }
    const Edit::ChanType type = edit.getChanTypeAndSubType(chan);
    if (type.subtype == Edit_Chan_SubType::ALIAS) {
        return {"FX", edit.getIndexWithinType(chan) + 1};
    }
    const auto letter = static_cast<char>(Edit::edit_chan_letter_from_type(type.type, type.subtype));
    return {String(1, letter), edit.getIndexWithinType(chan) + 1};
}

String groupName(const Edit& edit, const IdStamp& chan, bool ownNames, bool withType) {
    if (!edit.chanValid(chan)) {
        return {};
    }
    Vector<IdStamp> members;
    edit.getGroupContainingChan(chan, members);
    Vector<Label> labels;
    for (const IdStamp& member : members) {
        if (edit.chanValid(member)) {
            labels.push_back(labelOf(edit, member, ownNames));
        }
    }
    const ChannelGroupList* list = edit.retrieveGroupsList();
    const int group = list != nullptr ? list->findGroupContaining(chan) : -1;
    const bool prefixed = withType && group >= 0;
    return (prefixed ? typeText(list->getGroup(static_cast<unsigned>(group))->getType()) : "") +
           joinLabels(labels);
}

} // namespace

void Edit::groupsChanged() {
    setChangeDescription(kGroupsChanged, true);
}

ChannelGroupList* Edit::retrieveGroupsList() const {
    // The list is the store's, which anybody may take it out of: no object must have gone since it was found.
    const auto isKnown = [this] {
        return m_groupsFoundAt.load(std::memory_order_acquire) == m_store.numDepartures();
    };
    if (isKnown()) {
        return m_groups.load(std::memory_order_relaxed);
    }
    const std::lock_guard lock(m_section);
    if (isKnown()) {
        return m_groups.load(std::memory_order_relaxed);
    }
    ChannelGroupList* list = nullptr;
    if (m_store.contains(ChannelGroupList::Id)) {
        list = openList(m_store, ChannelGroupList::Id);
    } else {
        auto empty = std::make_unique<ChannelGroupList>();
        list = empty.get();
        m_store.storeObject(ChannelGroupList::Id, std::move(empty));
    }
    if (list != nullptr) {
        m_groups.store(list, std::memory_order_relaxed);
        m_groupsFoundAt.store(m_store.numDepartures(), std::memory_order_release);
    }
    return list;
}

ChannelGroupList* Edit::retrieveDefaultGroupsList() const {
    return openList(m_store, ChannelGroupList::IdForDefaultGrouping);
}

bool Edit::groupChannels(const Vector<IdStamp>& chans, ChannelGroup::eType type) {
    ChannelGroupList* list = retrieveGroupsList();
    if (chans.size() < 2 || list == nullptr || refusesChange()) {
        return false;
    }
    // `chans` may be the members of one of the groups: nothing goes before everything was read. The list
    // keeps each member once, so a second mention of one is harmless.
    Vector<IdStamp> members;
    std::set<unsigned, std::greater<>> merged;
    for (const IdStamp& chan : chans) {
        const int group = list->findGroupContaining(chan);
        if (group < 0) {
            members.push_back(chan);
        } else if (merged.insert(static_cast<unsigned>(group)).second) {
            list->getGroupContents(static_cast<unsigned>(group), members);
        }
    }
    const ChannelGroupList before(*list);
    for (const unsigned group : merged) {
        list->destroyGroup(group);
    }
    list->addGroup(members, type);
    if (!(*list == before)) {
        groupsChanged();
    }
    return true;
}

bool Edit::ungroupChannels(const IdStamp& chan) {
    ChannelGroupList* list = retrieveGroupsList();
    const int group = list != nullptr ? list->findGroupContaining(chan) : -1;
    if (group < 0 || refusesChange()) {
        return false;
    }
    list->destroyGroup(static_cast<unsigned>(group));
    groupsChanged();
    return true;
}

bool Edit::ungroupAllChannels() {
    ChannelGroupList* list = retrieveGroupsList();
    if (list == nullptr || refusesChange()) {
        return false;
    }
    if (list->destroyAllGroups(ChannelGroup::eAll) > 0) {
        groupsChanged();
    }
    return true;
}

bool Edit::removeFromGroup(const IdStamp& chan) {
    if (!isGrouped(chan) || refusesChange()) {
        return false;
    }
    retrieveGroupsList()->removeMember(chan);
    groupsChanged();
    return true;
}

bool Edit::isGrouped(const IdStamp& chan) const {
    const ChannelGroupList* list = retrieveGroupsList();
    return list != nullptr && list->isMember(chan);
}

void Edit::getGroupContainingChan(const IdStamp& chan, Vector<IdStamp>& members) const {
    if (!chanValid(chan)) {
        return;
    }
    const ChannelGroupList* list = retrieveGroupsList();
    const int group = list != nullptr ? list->findGroupContaining(chan) : -1;
    if (group < 0) {
        members.push_back(chan);
        return;
    }
    const Vector<IdStamp>& all = list->getGroup(static_cast<unsigned>(group))->getChans();
    std::copy_if(all.begin(), all.end(), std::back_inserter(members), isChannelOf(*this));
}

IdStamp Edit::getFirstInGroup(const IdStamp& chan) const {
    const ChannelGroupList* list = retrieveGroupsList();
    const int group = list != nullptr ? list->findGroupContaining(chan) : -1;
    if (group < 0) {
        return chan;
    }
    const Vector<IdStamp>& all = list->getGroup(static_cast<unsigned>(group))->getChans();
    const auto first = std::find_if(all.begin(), all.end(), isChannelOf(*this));
    return first != all.end() ? *first : all.front();
}

IdStamp Edit::getLastInGroup(const IdStamp& chan) const {
    const ChannelGroupList* list = retrieveGroupsList();
    const int group = list != nullptr ? list->findGroupContaining(chan) : -1;
    if (group < 0) {
        return chan;
    }
    const Vector<IdStamp>& all = list->getGroup(static_cast<unsigned>(group))->getChans();
    const auto last = std::find_if(all.rbegin(), all.rend(), isChannelOf(*this));
    return last != all.rend() ? *last : all.back();
}

unsigned Edit::numGroups(Edit_Chan_Type) const {
    const ChannelGroupList* list = retrieveGroupsList();
    return list != nullptr ? list->size() : 0;
}

const ChannelGroup* Edit::getTrackGroup(unsigned index) const {
    const ChannelGroupList* list = retrieveGroupsList();
    return list != nullptr ? list->getGroup(index) : nullptr;
}

bool Edit::sameGroup(const IdStamp& a, const IdStamp& b) const {
    const ChannelGroupList* list = retrieveGroupsList();
    const int group = list != nullptr ? list->findGroupContaining(a) : -1;
    return group >= 0 && group == list->findGroupContaining(b);
}

bool Edit::similarGroups(const IdStamp& a, const IdStamp& b) const {
    const ChannelGroupList* list = retrieveGroupsList();
    const int first = list != nullptr ? list->findGroupContaining(a) : -1;
    const int second = list != nullptr ? list->findGroupContaining(b) : -1;
    if (first < 0 || second < 0) {
        return false;
    }
    const ChannelGroup& one = *list->getGroup(static_cast<unsigned>(first));
    const ChannelGroup& other = *list->getGroup(static_cast<unsigned>(second));
    return one.getType() == other.getType() && one.size() == other.size();
}

String Edit::getGroupName(const IdStamp& chan, bool withType) const {
    return groupName(*this, chan, false, withType);
}

String Edit::getGroupDisplayName(const IdStamp& chan, bool withType) const {
    return groupName(*this, chan, true, withType);
}
