#pragma once

#include "edit/model/edit.h"
#include "platform/base/status.h"

#include <functional>
#include <unordered_set>
#include <vector>

/// Who plays what in a project. An item is played by an edit in which an event names it.

/// Reads an edit for one look at it. A failure says why it cannot be read.
using EditReader = std::function<Qx::Status(const cookie& item, EditPtr& edit)>;

/// Adds the items that an edit names: shots, other edits, its media, magic items.
QM_API void addPlayed(const Edit& edit, std::unordered_set<cookie>& played);

/// An edit that plays an item, or may.
struct ItemUser {
    cookie edit;
    String problem; ///< why the edit could not be read, so that it may play the item; empty: it plays it
};

/// Of `edits`, those that play the item, or that cannot be read, in their order. The item itself is left out.
/// One edit after the other is read and let go. Stops early, with what was found, when `cancelled`, which may
/// be empty, answers true; it is asked before each edit.
[[nodiscard]] QM_API std::vector<ItemUser> findUsers(const cookie& item, const std::vector<cookie>& edits,
                                                     const EditReader& read,
                                                     const std::function<bool()>& cancelled = nullptr);

/// Of some items, those that nothing plays.
struct UnusedItems {
    std::vector<cookie> items;
    /// A sentence for each file that could not be read, so that it may play any of them.
    std::vector<String> unread;
};

/// Looks for the items of `candidates` that no state of `edits` plays, of all that are on the disk: undo brings
/// a backup back, recovery a milestone, each with what it plays. Nothing is changed. Stops early, with no item, when `cancelled`, which may be empty, answers true; it
/// is asked before each edit.
[[nodiscard]] QM_API UnusedItems findUnused(const std::vector<cookie>& candidates,
                                            const std::vector<cookie>& edits,
                                            const std::function<bool()>& cancelled = nullptr);
