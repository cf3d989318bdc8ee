#pragma once

#include "platform/base/export.h"
#include "platform/base/qx_string.h"

/// What kind of item an edit is. The numbers appear in project records: do not change them.
enum edit_log_type_t : int {
    kLogNone = 0,
    kLogShot = 1,
    kLogEdit = 2,
    kLogGhost3 = 3, ///< 3 to 7: ghost variants of a shot
    kLogGhost4 = 4,
    kLogGhost5 = 5,
    kLogGhost6 = 6,
    kLogGhost7 = 7,
    kLogMagic = 8,
    kLogReel = 9,
    kLogTemplate = 10
};

/// The forms of an edit file, by its name.
enum QxEditFileType : int {
    kUnknownFile = 0,
    kObjectStoreFile = 1,
    kObjectStoreEd3File = 2,
    kLegacyTextFile = 4
};
/// The form that a file's name stands for, without regard to case.
QM_API QxEditFileType getEditFileTypeFromFileName(const WString& name);

/// Why a revision of an edit is replaced by another.
enum RevisionChangeType : int { kRevisionBackup = 1, kRevisionUndo = 2, kRevisionRedo = 3 };
