#pragma once

#include "edit/model/edit.h"
#include "platform/media/edit_label.h"

/// What was read of an edit's header of labels and rolls, and labels that are not in it yet.
struct Edit::Labels {
    std::vector<edit_label> labels;
    std::vector<String> unreadLabels; ///< texts of the header that are no label
    std::vector<MediumRoll> rolls;
    std::vector<String> unreadRolls;
    bool labelsBuilt = false;
    bool rollsBuilt = false;
};
