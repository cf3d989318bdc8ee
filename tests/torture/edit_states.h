#pragma once

#include "platform/base/qx_string.h"

#include <map>
#include <string>

/// What edit files hold, in short texts that can be compared: two files that hold the same edit in the same
/// state have the same digest, whenever and by whichever process they were written.
namespace torture {

inline constexpr const char* kDamaged = "(damaged)";

/// The digest of an edit file: its name and a hash of what its channels and cues hold. Its count of
/// changes and their description are left out: an undo and a redo raise and write them.
/// `kDamaged` for one that does not read, empty for one that is missing.
String digestOf(const std::string& path);

/// Every edit file of a project's inner folder with its digest, by its path below the folder: edits, backups,
/// milestones and what was set aside. Temporary files, records and locks are left out.
using ProjectStates = std::map<std::string, String>;
ProjectStates statesOf(const std::string& projectFolder);

/// The same as text, for a report.
String textOf(const ProjectStates& states);
/// What differs between two states of a project, as text.
String differenceOf(const ProjectStates& before, const ProjectStates& after);

/// True if any file has the digest.
bool holds(const ProjectStates& states, const String& digest);

/// How many temporary files lie below a folder.
size_t numTemporaries(const std::string& folder);

} // namespace torture
