#pragma once

#include "edit/manager/edit_search.h"
#include "edit/manager/edit_upgrading.h"
#include "edit/material/log_attributes.h"

/// JSON of logs and upgrades, by the rules of edit_json.h.

/// The attributes of an item that are not empty, by their persistable texts: an object.
[[nodiscard]] String attributesJson(const LogAttributes::Map& attributes);
/// Items that were found: an array of objects of every column of their records that is not empty.
[[nodiscard]] String foundJson(const std::vector<FoundEdit>& found);
/// What became of edits that were upgraded: an array of objects.
[[nodiscard]] String upgradesJson(const std::vector<UpgradedEdit>& edits);
/// "current", "would upgrade", "upgraded", "not whole", "failed".
[[nodiscard]] const char* outcomeText(UpgradedEdit::Outcome outcome);
