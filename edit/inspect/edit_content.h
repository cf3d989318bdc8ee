#pragma once

#include "edit/inspect/edit_report.h"

#include "edit/model/cel.h"
#include "platform/base/status.h"
#include "platform/media/level_store.h"
#include "platform/store/configb.h"

#include <compare>
#include <utility>
#include <vector>

/// What an edit keeps beside the pairs and markers of its report, taken out of it once as plain values.
/// Channels are told by their places (`ChannelReport::place`).

/// The properties of a channel that are not those of a new one: "name", "material", "resolution_s",
/// "sync_loss_s", "output" and "cross_fades"; those that end in "_s" are seconds.
struct ChannelContent {
    String place;
    configb properties;
};

struct LevelsContent {
    String place;
    std::vector<Aud::DynamicLevelControl::Node> nodes;
};

struct GroupContent {
    unsigned type = 0;
    std::vector<String> channels; ///< places, in order; the stamp of one that the edit does not have
    auto operator<=>(const GroupContent&) const = default;
};

/// An object of the file that is no part of the edit as this library knows it.
struct ObjectContent {
    String name;
    String layer; ///< any bytes, as the name
    std::pair<int, int> revision;
    String bytes;
    bool operator==(const ObjectContent&) const = default;
};

struct EditContent {
    configb header;
    std::vector<ChannelContent> channels;
    std::vector<LevelsContent> levels;
    std::vector<GroupContent> groups;
    std::vector<GroupContent> defaultGroups; ///< of a shot
    std::vector<ObjectContent> objects;
};

/// Takes out everything but the objects, which `addObjects` reads. `report` is the edit's.
[[nodiscard]] QM_API EditContent contentOf(const Edit& edit, const EditReport& report);

/// Adds the objects of the edit's file, an object store, that are no part of the edit. A failure names the
/// object or the file that cannot be read; some objects may have been added then.
QM_API Qx::Status addObjects(EditContent& content, const EditReport& report, const String& path);
