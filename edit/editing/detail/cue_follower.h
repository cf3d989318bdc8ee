#pragma once

#include "edit/editing/detail/edit_plan.h"
#include "edit/model/cel.h"

/// Lets the cues of an edit follow one operation. Made before the changes; `follow` comes after them. Records
/// no change of the edit: it is a part of the operation's.
class Editor::CueFollower {
public:
    CueFollower(Edit& edit, const Plan& plan, edit_operation op);

    /// Events of a channel that were made as copies of others.
    void noteCopies(const IdStamp& chan, const cel::IdMap& copied);
    /// Moves each attached cue with its event. One whose moment went to another channel goes there; one whose
    /// event is gone goes with it.
    void follow();

private:
    void moveToCopies();

    struct Copy {
        IdStamp chan;
        IdStamp event;
    };
    struct Moved {
        size_t cue = 0;
        IdStamp event; ///< its event before the operation
    };

    Edit& m_edit;
    bool m_changesChannel;
    std::vector<bool> m_hadEvent; ///< for each cue
    std::vector<Moved> m_moved;   ///< the cues whose moment is copied to another channel
    std::map<IdStamp, Copy> m_copies;
};
