#pragma once

#include "edit/model/edit.h"
#include "edit/model/transition.h"

#include <vector>

/// Checks how the effects of an edit hang together, and appends a sentence for each thing that is wrong:
/// events whose effect is not there or is that of another event too, inputs that name no channel, nodes that
/// are not there, that two graphs share or that nothing refers to, loops through nodes or channels, and
/// transitions that join nothing or need more material than there is.
///
/// `extentOf` tells what material has; without it, and where it does not know, nothing is missing. Opens
/// every node; changes nothing. Hostile graphs end it like any other.
QM_API void checkEffects(Edit& edit, const Transitions::MaterialExtent& extentOf,
                         std::vector<String>& faults);
