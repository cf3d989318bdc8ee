#pragma once

#include "platform/base/export.h"
#include "platform/base/id_stamp.h"
#include "platform/base/vector.h"

#include <cstdint>

/// Channels that display and editing treat together: an ordered list of at least two channel stamps, and what
/// kind of group they are. Made by `ChannelGroupList` alone.
class QM_API ChannelGroup {
public:
    /// What the members are to one another. The numbers live in files: do not change them. Another number in
    /// a file is kept as it is.
    enum eType : uint32_t {
        eAll = 0,          ///< no kind; as an argument, every kind
        ePlain = 1,        ///< edited together, no more; the type of groups from older files
        eStereo = 2,       ///< left and right sound
        eStereoscopic = 3, ///< left and right picture
        eSurround = 4      ///< the channels of a surround mix, in their usual order
    };

    [[nodiscard]] const Vector<IdStamp>& getChans() const { return m_chans; }
    [[nodiscard]] size_t size() const { return m_chans.size(); }
    [[nodiscard]] eType getType() const { return m_type; }
    [[nodiscard]] bool isMember(const IdStamp& chan) const;

    /// The revision of a packed group: from 2 on it carries its type.
    [[nodiscard]] static constexpr uint8_t currentBuildRevision() { return 2; }

    bool operator==(const ChannelGroup&) const = default;

private:
    friend class ChannelGroupList;
    friend struct ChannelGroupForm;

    ChannelGroup() = default;
    ChannelGroup(Vector<IdStamp> chans, eType type) : m_chans(std::move(chans)), m_type(type) {}

    Vector<IdStamp> m_chans;
    eType m_type = ePlain;
};
