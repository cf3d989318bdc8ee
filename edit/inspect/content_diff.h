#pragma once

#include "edit/inspect/edit_content.h"
#include "edit/inspect/edit_diff.h"

#include <optional>
#include <vector>

/// What differs between two edits beside their pairs and markers.

/// A value that only one of the two has, or that differs.
struct ValueDiff {
    String key; ///< any bytes
    std::optional<configb::Value> before;
    std::optional<configb::Value> after;
};

struct PropertiesDiff {
    String place;
    std::vector<ValueDiff> values;
};

struct LevelsDiff {
    String place;
    DiffKind kind = DiffKind::Changed;
    size_t nodesBefore = 0;
    size_t nodesAfter = 0;
    std::vector<Aud::DynamicLevelControl::Node> removed;         ///< nodes that only the first has, in order
    std::vector<Aud::DynamicLevelControl::Node> added;           ///< and those that only the second has
    std::vector<MovedRun<Aud::DynamicLevelControl::Node>> moved; ///< those that both have, at other times
};

struct GroupsDiff {
    bool changed = false; ///< also where only their order differs
    size_t before = 0;
    size_t after = 0;
    std::vector<GroupContent> removed;
    std::vector<GroupContent> added;
};

struct ObjectDiff {
    String name; ///< any bytes
    DiffKind kind = DiffKind::Changed;
};

struct QM_API ContentDiff {
    std::vector<ValueDiff> header;
    std::vector<PropertiesDiff> properties; ///< of the channels that differ
    std::vector<LevelsDiff> levels;
    GroupsDiff groups;
    GroupsDiff defaultGroups;
    std::vector<ObjectDiff> objects;
    [[nodiscard]] bool same() const;
};

/// Compares what two edits keep beside their pairs and markers. Header keys that every save or change writes,
/// and those that say which of its states an edit is, are left out.
[[nodiscard]] QM_API ContentDiff contentDiffOf(const EditContent& before, const EditContent& after);
