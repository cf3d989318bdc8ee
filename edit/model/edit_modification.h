#pragma once

#include "edit/model/channel_types.h"
#include "platform/base/export.h"
#include "platform/base/id_stamp.h"
#include "platform/base/qx_string.h"

#include <vector>

/// What a change did. The numbers are written into edit headers: do not change them, and do not give a number
/// that was retired to anything else.
enum EditModificationType : int {
    kNoModification = 0,
    // 1 to 16: the edit operations of the same number.
    kOpReplace = 1,
    kOpReplaceMarked = 2,
    kOpInsert = 3,
    kOpRemove = 4,
    kOpInsertMarked = 5,
    kOpReplaceToEnd = 6,
    kOpLift = 7,
    kOpSwapTracks = 8,
    kOpBackReplace = 9,
    kOpBackReplaceMarked = 10,
    kOpCopyTrack = 11,
    kOpMoveTrack = 12,
    kOpFillBlack = 13,
    kOpBackInsert = 14,
    kOpBackInsertMarked = 15,
    kOpReplaceMaterial = 16,
    kPropertiesChanged = 17, ///< header properties that the project record shows
    kNameChanged = 18,
    kCuesChanged = 19,
    kGroupsChanged = 20,
    kLevelsChanged = 21,
    kFadesChanged = 22,
    kEffectsChanged = 23,
    kEventsChanged = 24, ///< events trimmed or given another strip
    kLabelsChanged = 25,
    kSyncChanged = 26,
    kChansInserted = 27,
    kChansRemoved = 28,
    kEditDeleted = 29, ///< recorded, does not dirty the edit
    kCurrentTimeChanged = 30,
    kMarkChanged = 31,
    kChanNameChanged = 32,
    kShotSoundChanged = 33,
    kInitial = 37,      ///< the description of an edit that was just made
    kSeveral = 38,      ///< changes of several kinds since the last reset
    kNotDescribed = 39, ///< no stored description
    kTransient = 54     ///< neither written to the header nor dirtying
};

/// One change to an edit, as data: typed, printable, comparable, and where its type has an opposite,
/// invertible. A plain value.
///
/// Text form: "type name direction [chan=STAMP] [at=SECONDS] [for=SECONDS] [index=N] [count=N]".
class QM_API EditModification {
public:
    EditModification() = default;
    EditModification(EditModificationType type) : m_type(type) {}
    /// Reads the text form; a text that is none gives type 39.
    [[nodiscard]] static EditModification fromString(std::string_view text);

    [[nodiscard]] EditModificationType type() const { return m_type; }
    /// A name for people, such as "insert".
    [[nodiscard]] const char* name() const;
    [[nodiscard]] String asString() const;

    /// True if this describes the undoing of a change.
    [[nodiscard]] bool inverted() const { return m_inverted; }
    /// The description of undoing this change: inserted channels become removed ones and so on; a type
    /// without an opposite keeps its type. Inverting twice gives the same again.
    [[nodiscard]] EditModification invert() const;

    [[nodiscard]] const IdStamp& chan() const { return m_chan; }
    [[nodiscard]] double at() const { return m_at; }
    [[nodiscard]] double length() const { return m_length; }
    [[nodiscard]] int index() const { return m_index; }
    [[nodiscard]] int count() const { return m_count; }
    EditModification& setChan(const IdStamp& chan);
    EditModification& setSpan(double at, double length);
    EditModification& setChans(int index, int count);

    bool operator==(const EditModification&) const = default;

private:
    EditModificationType m_type = kNoModification;
    bool m_inverted = false;
    IdStamp m_chan;
    double m_at = 0;
    double m_length = 0;
    int m_index = NO_CHAN;
    int m_count = 0;
};

/// True for the types that an edit operation of the console makes: 1 to 16.
[[nodiscard]] QM_API bool isConsoleEditOp(EditModificationType type);
