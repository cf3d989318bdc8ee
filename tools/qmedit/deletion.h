#pragma once

#include "tools/qmedit/project_session.h"

/// Deletes an item with its undo and redo backups, after its present state was kept as a milestone, so that a
/// recovery brings it back. Under the writers' lock, with a manager. A failure says what of it is still there;
/// where no milestone could be made that is all of it, unless `anyway`.
Qx::Status deleteKeeping(ProjectSession& session, const cookie& item, bool anyway = false);
