#pragma once

#include "edit/inspect/edit_report.h"

/// Fills in the number that each pair of a report has in the list that the edit was imported from, also of a
/// pair that was trimmed or moved since. `report` is the edit's.
void addEventNumbers(EditReport& report, const Edit& edit);
