#include "edit/model/channel_group_list.h"

#include "platform/store/pstream.h"

#include <algorithm>
#include <unordered_set>
#include <utility>

namespace {

/// The revision byte before each packed stamp. Lives in files: do not change it.
constexpr uint8_t kStampRevision = 2;
/// From this revision on a packed group carries its type.
constexpr uint8_t kFirstRevisionWithType = 2;
constexpr size_t kPackedStamp = 1 + 3 * sizeof(uint32_t);
constexpr size_t kLeastPackedGroup = 1 + sizeof(uint32_t);

const bool kGroupsRegistered = [] {
    Streamable::registerBuilder(ChannelGroupList::Id, []() -> std::unique_ptr<Streamable> {
        return std::make_unique<ChannelGroupList>();
    });
    return true;
}();

} // namespace

/// The packed form of one group. Lives in files: do not change it.
struct ChannelGroupForm {
    static void pack(const ChannelGroup& group, PStream& stream) {
        stream.setUnsignedLong(static_cast<uint32_t>(group.size()));
        for (const IdStamp& chan : group.getChans()) {
            stream.setCookedChar(kStampRevision);
            chan.pack(stream);
        }
        stream.setUnsignedLong(group.getType());
    }

    /// Leaves out the stamps in `seen`, and adds those that it keeps.
    static ChannelGroup unpack(PStream& stream, unsigned revision, std::unordered_set<IdStamp>& seen) {
        ChannelGroup group;
        if (revision > ChannelGroup::currentBuildRevision()) {
            stream.fail();
        }
        const uint32_t count = stream.getCount(kPackedStamp);
        for (uint32_t i = 0; i < count && stream.good(); ++i) {
            const unsigned stampRevision = stream.getCookedChar();
            IdStamp chan;
            chan.unpack(stream, stampRevision);
            if (stampRevision > kStampRevision) {
                stream.fail();
            }
            if (chan.valid() && seen.insert(chan).second) {
                group.m_chans.push_back(chan);
            }
        }
        if (revision >= kFirstRevisionWithType) {
            group.m_type = static_cast<ChannelGroup::eType>(stream.getUnsignedLong());
        }
        if (group.size() == 1) {
            seen.erase(group.m_chans.front());
        }
        return group;
    }
};

bool ChannelGroup::isMember(const IdStamp& chan) const {
    return std::find(m_chans.begin(), m_chans.end(), chan) != m_chans.end();
}

ChannelGroupList::~ChannelGroupList() = default;

ChannelGroupList& ChannelGroupList::operator=(const ChannelGroupList& other) {
    if (this != &other) {
        StreamableLayer::operator=(other);
        Taggable::operator=(other);
        m_groups = other.m_groups;
    }
    return *this;
}

const TagTypeId& ChannelGroupList::tagTypeId() const {
    static const TagTypeId& type = *new TagTypeId(Id);
    return type;
}

const ChannelGroup* ChannelGroupList::getGroup(unsigned i) const {
    return i < m_groups.size() ? &m_groups[i] : nullptr;
}

bool ChannelGroupList::addGroup(const Vector<IdStamp>& chans, ChannelGroup::eType type) {
    Vector<IdStamp> members;
    for (const IdStamp& chan : chans) {
        if (chan.getMagicType() == IdStampMagic::Channel &&
            std::find(members.begin(), members.end(), chan) == members.end()) {
            members.push_back(chan);
        }
    }
    if (members.size() < 2) {
        return false;
    }
    m_groups.push_back(ChannelGroup(std::move(members), type));
    setTagChanged(true);
    return true;
}

int ChannelGroupList::findGroupContaining(const IdStamp& chan) const {
    const auto it = std::find_if(m_groups.begin(), m_groups.end(),
                                 [&](const ChannelGroup& group) { return group.isMember(chan); });
    return it != m_groups.end() ? static_cast<int>(it - m_groups.begin()) : -1;
}

void ChannelGroupList::getGroupContents(unsigned i, Vector<IdStamp>& chans) const {
    if (const ChannelGroup* group = getGroup(i)) {
        chans.insert(chans.end(), group->getChans().begin(), group->getChans().end());
    }
}

bool ChannelGroupList::destroyGroup(unsigned i) {
    if (i >= m_groups.size()) {
        return false;
    }
    m_groups.erase(m_groups.begin() + static_cast<std::ptrdiff_t>(i));
    setTagChanged(true);
    return true;
}

unsigned ChannelGroupList::destroyAllGroups(ChannelGroup::eType type) {
    const size_t gone = std::erase_if(m_groups, [type](const ChannelGroup& group) {
        return type == ChannelGroup::eAll || group.getType() == type;
    });
    if (gone > 0) {
        setTagChanged(true);
    }
    return static_cast<unsigned>(gone);
}

bool ChannelGroupList::removeMember(IdStamp chan) {
    size_t taken = 0;
    for (ChannelGroup& group : m_groups) {
        taken += std::erase(group.m_chans, chan);
    }
    std::erase_if(m_groups, [](const ChannelGroup& group) { return group.size() < 2; });
    if (taken > 0) {
        setTagChanged(true);
    }
    return taken > 0;
}

bool ChannelGroupList::replaceMember(IdStamp from, IdStamp to) {
    if (!to.valid() || isMember(to) || !isMember(from)) {
        return false;
    }
    for (ChannelGroup& group : m_groups) {
        std::replace(group.m_chans.begin(), group.m_chans.end(), from, to);
    }
    setTagChanged(true);
    return true;
}

constinit const StreamableLayer::Form ChannelGroupList::kForm{Id, "groups"};

void ChannelGroupList::pack(PStream& stream) const {
    stream.setUnsignedLong(size());
    for (const ChannelGroup& group : m_groups) {
        stream.setCookedChar(ChannelGroup::currentBuildRevision());
        ChannelGroupForm::pack(group, stream);
    }
}

void ChannelGroupList::unpack(PStream& stream) {
    if (isFromTheFuture()) {
        stream.fail();
        return;
    }
    std::vector<ChannelGroup> groups;
    std::unordered_set<IdStamp> seen;
    const uint32_t count = stream.getCount(kLeastPackedGroup);
    for (uint32_t i = 0; i < count && stream.good(); ++i) {
        const unsigned revision = stream.getCookedChar();
        ChannelGroup group = ChannelGroupForm::unpack(stream, revision, seen);
        if (group.size() > 1) {
            groups.push_back(std::move(group));
        }
    }
    if (!stream.good()) {
        return;
    }
    m_groups = std::move(groups);
    setCurrentRevision();
}

std::unique_ptr<Streamable> ChannelGroupList::clone(BuilderType) const {
    return std::make_unique<ChannelGroupList>(*this);
}
