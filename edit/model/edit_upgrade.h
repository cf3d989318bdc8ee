#pragma once

#include "platform/base/qx_string.h"

#include <vector>

/// What bringing an edit of an older revision up to date did. A plain value.
struct EditUpgrade {
    int from = 0; ///< the revision that the edit was of; 0 for a legacy text
    int to = 0;   ///< the revision that it is of
    /// What the steps did, in their order, a clause each: "3 level ramps became nodes of levels channels".
    std::vector<String> done;
    /// What could not be brought up to date and stays as it was; empty when the edit was upgraded whole.
    std::vector<String> notDone;
};
