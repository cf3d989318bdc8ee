#pragma once

#include "edit/project/projdb.h"
#include "platform/base/cookie.h"
#include "platform/base/export.h"
#include "platform/base/status.h"

#include <vector>

/// An item that was found, with its record. A plain value.
struct FoundEdit {
    cookie item;
    projdb::Record record;
};

/// Finds the items of the current project by their records, in the order of cookies; no edit file is opened.
///
/// Each condition is the name of a log attribute or of a column of the record, in any case and with '_' for a
/// blank, then '=' and a pattern: "scene=12", "reel=A*", "snd_reel=?*". In the pattern '*' stands for any
/// text, also none, and '?' for one character; the case of ASCII letters does not count. An item is found if
/// it meets them all. What the records say is as old as they are: `edit_manager::update_projdb` brings them
/// up to date.
///
/// Fails, leaving `found`, for a condition that is none, which is named, and without records.
QM_API Qx::Status findEdits(const std::vector<String>& conditions, std::vector<FoundEdit>& found);
