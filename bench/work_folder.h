#pragma once

#include "platform/base/qx_string.h"

namespace bench {

/// The folder that all files of the measures go to: a fresh one in the current folder, on whatever disk that
/// is. It is removed when the program ends.
const String& workFolder();
/// A path in it.
String workPath(const String& name);

/// Waits until the disk has written all that it was given, so that no measure pays for the one before.
void settleDisk();

} // namespace bench
