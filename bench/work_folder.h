#pragma once

#include "platform/base/qx_string.h"

namespace bench {

/// The folder that all files of the measures go to: "bench-work" in the current folder, on whatever disk that
/// is. It is emptied when it is first asked for and when the program ends.
const String& workFolder();
/// A path in it.
String workPath(const String& name);

/// Waits until the disk has written all that it was given, so that no measure pays for the one before.
void settleDisk();

} // namespace bench
