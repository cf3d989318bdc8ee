#pragma once

#include "edit/editing/edit_module.h"
#include "platform/base/status.h"

#include <vector>

/// The channels that a user names for an operation, as in "VA1A2": "V" the picture with its effects, "V2" the
/// second video channel, "A" the sound, "A2" the second sound channel, in any case.
class ChannelChoice {
public:
    /// Fails for a text that is not made of such names.
    static Qx::Status parse(const String& text, ChannelChoice& choice);

    /// True if nothing was named, so that every channel takes part.
    [[nodiscard]] bool isEmpty() const { return m_names.empty(); }
    /// The greatest number that stands with a type; 1 where only its letter does, 0 where neither does.
    [[nodiscard]] int highest(Edit_Chan_Type type) const;
    /// Leaves selected what is named and there.
    void select(EditModule& module) const;
    /// Fails for a name that none of the edits has; null handles are passed over.
    [[nodiscard]] Qx::Status check(const std::vector<EditPtr>& edits) const;

private:
    struct Name {
        Edit_Chan_Type type;
        int number; ///< from 1; 0 for all of the type
        String text;
    };
    /// The channels of an edit that a name means.
    static void find(const Edit& edit, const Name& name, Vector<IdStamp>& chans);

    std::vector<Name> m_names;
};
