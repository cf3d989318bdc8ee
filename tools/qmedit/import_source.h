#pragma once

#include "platform/base/status.h"

/// Says whether a file given to `qmedit import` looks like what import reads, before anything reads it whole:
/// a regular file of text that has the name of an EDL (".edl") or of a legacy text (".ed2"), or the content
/// of an EDL (a TITLE, FCM or event line near its start). Sets `resolved` to the file that a link leads to. A
/// failure is one line that names the file, the line where there is one, and what to do.
[[nodiscard]] Qx::Status checkImportSource(const String& path, String& resolved);

/// Reads standard input to its end, refusing more than `most` bytes and what does not look like an EDL. `name`
/// stands for it in messages.
[[nodiscard]] Qx::Status readStandardInput(const String& name, uint64_t most, String& text);
