#pragma once

#include "platform/base/status.h"
#include "platform/services/file_lock.h"
#include "platform/store/configb.h"

#include <vector>

/// What the classes of this folder share: the texts in a project's folder and the lock that guards them.
namespace Qx::detail {

/// The settings of a project, empty.
configb emptySettings();

/// The paths of a project folder's settings and lock files.
String settingsPath(const String& folder);
String lockPath(const String& folder);

/// The greatest text file of a project folder that is accepted, in bytes.
inline constexpr uint64_t kProjectTextLimit = uint64_t{64} << 20;

/// The key of the next edit number, and its range: 1 to one past the last number that a cookie's text can
/// hold.
inline constexpr const char* kNextEditKey = "NEXT_EDIT";
inline constexpr int kLastEditNumber = 36 * 36 * 36 * 36 - 1;

/// The key of the numbers above the next one that are taken although no name in the folder tells of them.
inline constexpr const char* kTakenEditsKey = "TAKEN_EDITS";

/// Reads a store from a text file that holds nothing else. `found` is false, and the store as it was, when
/// there is no such file. A failure names the file and leaves the store as it was.
Status readStore(const String& path, configb& store, bool& found);

/// Writes a store as a text file, durably and at once, whether or not an atomic batch is open on this thread:
/// what is written under the folder's lock must be there before the lock is released.
Status writeStore(const String& path, const configb& store);

/// The next edit number of the settings; a failure if it is out of range.
Status readNextEditNumber(const configb& settings, const String& path, int& number);

/// The numbers of the settings that are taken, ascending, appended to `numbers`: decimal numbers and ranges
/// of them ("12 15-17") with one blank between. A failure if the text is anything else.
Status readTakenNumbers(const configb& settings, const String& path, std::vector<int>& numbers);
/// Puts ascending numbers there; without any there is no such text.
void setTakenNumbers(configb& settings, const std::vector<int>& numbers);

} // namespace Qx::detail
