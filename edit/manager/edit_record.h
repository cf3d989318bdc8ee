#pragma once

#include "edit/model/edit.h"
#include "edit/project/projdb.h"
#include "platform/services/files.h"

/// The bits of a record's "Flags". The numbers are in project records: do not change them.
enum EditRecordFlags : int {
    kRecordHidden = 0x8,
    kRecordGhost6 = 0x80,
    kRecordGhost4 = 0x200,
    kRecordGhost3 = 0x400,
    kRecordGhost5 = 0x800
};

/// The record that an edit gives.
///
/// "chans" names the kinds of channel with a letter and a number each, in the order V, A, F: "V1A4F2". A is
/// in upper case only where the edit has more than one audio channel, F where it has more than one effects
/// channel; a single one is "a1", "f1". So the letter in upper case stands for what `EditInfo` asks.
///
/// "start time" and "end time" are timecode at the current project's rate and drop-frame setting, rounded to
/// frames; the hours go on from 24, and a time below 0 has a '-' in front. The columns of the log attributes have what `Edit::getAttribute` answers. `file` is what the
/// edit was read from or written to; null when the edit differs from its file or has none.
[[nodiscard]] QM_API projdb::Record editRecordOf(const Edit& edit, const Qx::FileInfo* file);

/// True if a record was made from a file that is as `file` says.
[[nodiscard]] QM_API bool isRecordOfFile(const projdb::Record& record, const Qx::FileInfo& file);

/// Stamps a record with the file that it was made from.
QM_API void stampRecord(projdb::Record& record, const Qx::FileInfo& file);

/// Seconds for the text of "start time" or "end time"; `Qx::kNoTime` for one that is empty or does not read.
[[nodiscard]] QM_API double recordTime(const String& text);
