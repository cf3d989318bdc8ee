#pragma once

#include "edit/manager/revisions.h"

class Console;

/// The states as a table, a line each, as `qmedit history` shows them.
[[nodiscard]] String revisionTable(const std::vector<Revision>& revisions, const Console& console);

/// Warns of what the system could not tell of an edit's states. True if there was anything.
bool reportUnanswered(const RevisionList& list);

/// "2026-11-21 13:04" of local time; "-" for a time that has no date.
[[nodiscard]] String localTimeText(int64_t seconds);
