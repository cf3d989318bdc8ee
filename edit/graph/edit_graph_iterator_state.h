#pragma once

#include "platform/base/cookie.h"
#include "platform/base/id_stamp.h"
#include "platform/base/num_range.h"

class EditGraphIterator;

/// The position of an `EditGraphIterator` as a value that can be kept as text: "E0001000 ID 12.5 1". It names the
/// root edit, what the position shows, the root time and the iteration flags.
struct QM_API EditGraphIteratorState {
    cookie edit;
    IdStamp id; ///< of the node; of the channel, where there is no node or it stands for its channel
    double time = Qx::kNoTime;
    int flags = 1;

    EditGraphIteratorState() = default;
    explicit EditGraphIteratorState(const EditGraphIterator& position);
    /// Reads what `asString` made: four fields between blanks. The default state for any other number of them;
    /// fields that are not well formed give the null value of theirs.
    explicit EditGraphIteratorState(const String& text);

    /// True if it names an edit and something in it.
    [[nodiscard]] bool valid() const { return edit.is_valid() && id.valid(); }
    [[nodiscard]] String asString() const;
    bool operator==(const EditGraphIteratorState&) const = default;
};
