#pragma once

#include "edit/model/ce_handle.h"
#include "edit/model/cel.h"
#include "edit/model/edit_ptr.h"

#include <array>
#include <memory>

/// The cel that plays inside an event whose strip is an edit, and the edit; null when the event shows
/// anything else, or the edit cannot be opened. It is the edit's channel of the letter and number that the
/// event's own cel is named by ("A2"), where it has such a name, else its first video channel. The edit owns
/// the cel.
QM_API cel* get_sub_cel(EditPtr& edit, const ce_handle& event);

/// The events of the edit that an event shows, as a copy in the times of the event's cel, trimmed to the
/// event and with its velocity and levels: `out` becomes its start, and the caller comes to own the copy
/// (`out.get_its_cel()`). Returns the edit's cookie. The invalid cookie, with `out` invalid and nothing to
/// own, for an event that shows no edit or of whose edit nothing is seen. The last argument is not used.
QM_API cookie sub_handle(ce_handle& out, const ce_handle& event, bool unused = false);

/// A position in a cel and the edits nested in it: a stack of events, level 0 on the top cel and each deeper
/// level inside the edit that the level above shows. It finds the innermost event at a time and steps through
/// the flattened hierarchy.
///
/// The times of every level are those of the top cel. The top cel is the caller's and must outlive the
/// handle; the cels of deeper levels are copies that the handle owns. Copies of a handle share them. A
/// handle is used by one thread at a time. What goes too deep or pops too often is reported through
/// `ole_splat`, and the position is then of no further use.
class QM_API hier_handle {
public:
    /// The levels that a position can have.
    static constexpr int kMaxDepth = 10;

    /// No levels: depth -1.
    hier_handle() = default;
    /// The start of a top cel, which belongs to the edit named.
    hier_handle(cel* top, const cookie& edit);
    hier_handle(const hier_handle&) = default;
    hier_handle& operator=(const hier_handle&) = default;
    /// Leaves levels as long as their count is below the depth that remains: about half of them. The cels of
    /// the others stay for the life of the process, so handles into them that `get` gave stay usable.
    ~hier_handle();

    [[nodiscard]] int depth() const { return m_depth; }
    /// The event of the current level; invalid without levels.
    [[nodiscard]] ce_handle get() const;
    /// The edit of the current level; invalid without levels.
    [[nodiscard]] cookie getEditCookie() const;

    /// One level down, to a handle on a cel that this handle owns from here on.
    void push(const cookie& edit, const ce_handle& event);
    /// One level up; the cel of the level that is left goes.
    void popd();
    /// Descends from the current level's event as far as edits are nested, to the start of each.
    void drill(const ce_handle& event);
    /// Moves to the innermost event of a kind at a time (seconds on the top cel), climbing out of edits that
    /// do not play then.
    void find(double time, ce_info kind);
    /// The descending part of `find`, from the current level's event.
    void find_aux(double time, ce_info kind);
    /// Moves to the next or the previous event of a kind, into nested edits and out of them. Past either end
    /// the current handle is invalid.
    void next_hier(ce_info kind) { walk_hier(kNext, kind); }
    void prev_hier(ce_info kind) { walk_hier(kPrevious, kind); }
    /// 1 is next, 2 previous; another number does nothing.
    void walk_hier(int type, ce_info kind);

private:
    static constexpr int kNext = 1;
    static constexpr int kPrevious = 2;

    struct Level {
        cookie edit;
        ce_handle event;
        std::shared_ptr<cel> owned; ///< null at level 0
    };

    [[nodiscard]] Level& current() { return m_levels[static_cast<size_t>(m_depth)]; }

    /// One place more than there are levels: the one that is too many is reported and kept apart.
    std::array<Level, kMaxDepth + 1> m_levels;
    int m_depth = -1;
    cel* m_rootCel = nullptr;
};
