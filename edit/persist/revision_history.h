#pragma once

#include "platform/base/export.h"

#include <span>

/// One revision of the content of edit files and what came with it.
struct EditRevision {
    int revision;
    const char* description;
};

/// The revision of the content that this library writes.
inline constexpr int kCurrentEditRevision = 602;
/// From this revision on nothing is to be brought up to date.
inline constexpr int kFirstCurrentRevision = 501;

/// The revisions in order. Numbers and texts live in files: do not change them; a new revision is appended.
QM_API std::span<const EditRevision> editRevisionHistory();
