#include "edit/model/edit.h"

#include <mutex>

namespace {

/// A list as it lies in the store; null if there is none or it cannot be read.
ChannelGroupList* openList(TagBag& store, const char* name) {
    return store.contains(name) ? dynamic_cast<ChannelGroupList*>(store.openObject(name)) : nullptr;
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
    if (ChannelGroupList* list = m_groups.load(std::memory_order_acquire)) {
        return list;
    }
    const std::lock_guard lock(m_section);
    ChannelGroupList* list = m_groups.load(std::memory_order_relaxed);
    if (list != nullptr) {
        return list;
    }
    if (m_store.contains(ChannelGroupList::Id)) {
        list = openList(m_store, ChannelGroupList::Id);
    } else {
        auto empty = std::make_unique<ChannelGroupList>();
        list = empty.get();
        m_store.storeObject(ChannelGroupList::Id, std::move(empty));
    }
    m_groups.store(list, std::memory_order_release);
    return list;
}

ChannelGroupList* Edit::retrieveDefaultGroupsList() const {
    const std::lock_guard lock(m_section);
    return openList(m_store, ChannelGroupList::IdForDefaultGrouping);
}

void Edit::forgetGroups() {
    const std::lock_guard lock(m_section);
    m_groups.store(nullptr, std::memory_order_release);
}

void Edit::storeGroups() {
    const auto tell = [this](ChannelGroupList* list, const char* name) {
        if (list != nullptr && list->changed()) {
            m_store.markChanged(name);
            list->setChanged(false);
        }
    };
    tell(m_groups.load(std::memory_order_acquire), ChannelGroupList::Id);
    tell(retrieveDefaultGroupsList(), ChannelGroupList::IdForDefaultGrouping);
}

bool Edit::groupChannels(const Vector<IdStamp>& chans, ChannelGroup::eType type) {
    ChannelGroupList* list = retrieveGroupsList();
    if (chans.size() < 2 || list == nullptr) {
        return false;
    }
    // The list keeps each member once, so a second mention of one is harmless.
    Vector<IdStamp> members;
    bool changed = false;
    for (const IdStamp& chan : chans) {
        const int group = list->findGroupContaining(chan);
        if (group < 0) {
            members.push_back(chan);
            continue;
        }
        list->getGroupContents(static_cast<unsigned>(group), members);
        list->destroyGroup(static_cast<unsigned>(group));
        changed = true;
    }
    changed = list->addGroup(members, type) || changed;
    if (changed) {
        groupsChanged();
    }
    return true;
}

bool Edit::ungroupChannels(const IdStamp& chan) {
    ChannelGroupList* list = retrieveGroupsList();
    const int group = list != nullptr ? list->findGroupContaining(chan) : -1;
    if (group < 0) {
        return false;
    }
    list->destroyGroup(static_cast<unsigned>(group));
    groupsChanged();
    return true;
}

bool Edit::ungroupAllChannels() {
    ChannelGroupList* list = retrieveGroupsList();
    if (list == nullptr) {
        return false;
    }
    if (list->destroyAllGroups(ChannelGroup::eAll) > 0) {
        groupsChanged();
    }
    return true;
}

bool Edit::removeFromGroup(const IdStamp& chan) {
    ChannelGroupList* list = retrieveGroupsList();
    if (list == nullptr || !list->removeMember(chan)) {
        return false;
    }
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
    } else {
        list->getGroupContents(static_cast<unsigned>(group), members);
    }
}

IdStamp Edit::getFirstInGroup(const IdStamp& chan) const {
    const ChannelGroupList* list = retrieveGroupsList();
    const int group = list != nullptr ? list->findGroupContaining(chan) : -1;
    return group < 0 ? chan : list->getGroup(static_cast<unsigned>(group))->getChans().front();
}

IdStamp Edit::getLastInGroup(const IdStamp& chan) const {
    const ChannelGroupList* list = retrieveGroupsList();
    const int group = list != nullptr ? list->findGroupContaining(chan) : -1;
    return group < 0 ? chan : list->getGroup(static_cast<unsigned>(group))->getChans().back();
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
