#pragma once

#include "edit/model/edit.h"
#include "platform/base/status.h"

#include <vector>

/// Checking edit files, and saving what is sound of damaged ones. Both take a file of any name, backups and
/// copies included, change nothing on the disk and follow no link.

/// Reads everything that is in an edit file: the whole of its bytes against their checksums, then every
/// object of it. `faults` gets one sentence for each thing that is wrong with it; none means that
/// `Edit::readFile` takes the whole of it. Objects of classes that this program does not know are sound when
/// their bytes are.
///
/// A file that could not be read at all, or was written by a later version, has that as its fault, and the
/// result is false: it may be sound. Safe on any thread.
///
/// `read`, if given, receives the edit as far as it could be read, null if it could not.
QM_API bool verifyEditFile(const String& path, std::vector<String>& faults, EditPtr* read = nullptr);

/// Makes an edit of all that is sound of a damaged object store. One damaged object costs that object: a
/// channel, the levels of a channel, the cues, the groups. Without its header the edit has the properties of
/// a new one, and its channels are kept. Where the table of the file is damaged or was cut off, objects are
/// looked for by their form; no checksum vouches for those, so a channel is taken only when its events agree.
///
/// `lost` gets a line for each thing that is lost or doubtful, with the channel's name where it is known;
/// none for a sound file. The edit has no cookie, so that no save of it meets the damaged file, is dirty, is
/// no backup, and names no undo states. On failure, when nothing of the file makes an edit, `edit` is as it
/// was and the reason says why. Safe on any thread.
QM_API Qx::Status salvageEdit(const String& path, EditPtr& edit, std::vector<String>& lost);
