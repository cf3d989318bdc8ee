#pragma once

#include "edit/model/aud_levels_cel.h"
#include "edit/persist/detail/edit_file.h"

/// Which cel the store's bytes under each Celid name were made from, and with which channel information: a
/// cel keeps its bytes only under the name and with the information that they hold.
struct Edit::StoredCels {
    struct Entry {
        std::weak_ptr<const cel> content;
        String name;
        IdStamp id;
        String subType;
        String materialInfo;
    };
    std::vector<Entry> entries;

    [[nodiscard]] bool holds(size_t number, const Entry& wanted) const {
        if (number >= entries.size()) {
            return false;
        }
        const Entry& entry = entries[number];
        return entry.content.lock() == wanted.content.lock() && entry.name == wanted.name &&
               entry.id == wanted.id && entry.subType == wanted.subType &&
               entry.materialInfo == wanted.materialInfo;
    }
};

/// A cel as it was read, before it is a channel.
struct EditFile::LoadedCel {
    Qx::Ptr<cel> content;      ///< null for one that does not read
    Edit::ChanType type;       ///< of one that does not read: what the header says of it
    bool ownName = false;      ///< its name was given to the channel, not made from its place
    bool kindIsStated = false; ///< the header says what kind of channel it is
};

/// The levels of a file's pairing, before they are a channel.
struct EditFile::LoadedLevels {
    AudLevelsCel levels; ///< invalid where they or their audio channel do not read
    IdStamp audio;
    String name;   ///< empty unless the levels channel has one of its own
    int place = 0; ///< among the levels channels
    String pairing;
};
