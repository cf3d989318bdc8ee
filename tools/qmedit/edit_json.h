#pragma once

#include "edit/inspect/edit_report.h"
#include "edit/inspect/verification.h"
#include "edit/manager/revisions.h"
#include "interchange/loss_report.h"
#include "tools/qmedit/project_session.h"

#include <utility>
#include <vector>

/// The JSON texts of qmedit, as docs/qmedit.md describes them. Each is one valid JSON value in UTF-8 and a
/// line end, whatever bytes the edit holds: a byte that is not UTF-8 becomes U+FFFD. Numbers do not depend on
/// the locale. Fields are added over time and keep their meaning.

/// One edit: an object. Each pair stands on a line of its own.
[[nodiscard]] String editJson(const EditReport& report);

/// The edits of a project: an array of objects.
[[nodiscard]] String listJson(const std::vector<ListedEdit>& edits);

/// The markers of an edit, in order: an array of the objects that `show --json` gives for them, each with its
/// `number`.
[[nodiscard]] String markersJson(const EditReport& report);

/// Header values by key, in order: an object.
[[nodiscard]] String headerJson(const configb& header, const std::vector<String>& keys);

/// One marker of an edit: the object that `show --json` gives for it, without a line end.
[[nodiscard]] String cueJsonText(const EditReport& report, const CueReport& cue);

/// One header value: a JSON value, without a line end.
[[nodiscard]] String valueJsonText(const configb::Value& value);

/// One pair of an edit: the object that `show --json` gives for it, without a line end.
[[nodiscard]] String pairJsonText(const EditReport& report, const PairReport& pair);

/// Checked files: an array of objects.
[[nodiscard]] String verifyJson(const std::vector<VerifiedFile>& files);

/// The states of an edit: an object.
[[nodiscard]] String historyJson(const cookie& item, const std::vector<Revision>& revisions);

/// What a salvage made: an object.
[[nodiscard]] String salvageJson(const cookie& item, const Edit& edit, const std::vector<String>& lost);

/// What became of an import or export: an object of texts, null where empty, of numbers, and of the lists of
/// the report, "errors", "losses", "warnings" and "notes", each of objects with "line" (null for the file as a
/// whole) and "what". Without a line end.
[[nodiscard]] String reportJson(const std::vector<std::pair<const char*, String>>& texts,
                                const std::vector<std::pair<const char*, size_t>>& numbers,
                                const interchange::LossReport& report);

/// "2026-11-21T11:30:00Z" for seconds since 1970, UTC; empty for a time that has no date.
[[nodiscard]] String isoTime(int64_t seconds);
