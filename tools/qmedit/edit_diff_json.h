#pragma once

#include "edit/inspect/content_diff.h"
#include "edit/inspect/edit_diff.h"

/// One JSON object and a line end, as docs/qmedit.md describes it.
[[nodiscard]] String diffJson(const EditDiff& diff, const ContentDiff& content, const EditReport& before,
                              const EditReport& after);
