#pragma once

#include "edit/inspect/event_labels.h"
#include "tools/qmedit/commands.h"

/// Writes the labels that are asked for beside the pairs of an edit, or what a burnt-in display reads. An
/// `ExitCode`; what is wrong with the names or the timecode is reported.
int showLabels(const EditReport& report, const ShowOptions& options, EventLabels& labels);
