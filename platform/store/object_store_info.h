#pragma once

#include "platform/base/export.h"
#include "platform/base/qx_string.h"
#include "platform/base/status.h"

#include <cstdint>
#include <vector>

/// An object as the table of a store tells of it.
struct StoredObjectInfo {
    String name;
    String layer; ///< full name of its most derived layer
    uint8_t revisionMajor = 0;
    uint8_t revisionMinor = 0;
    uint64_t offset = 0; ///< from the start of the file
    uint64_t length = 0;
    bool sound = false; ///< its bytes lie within the file and are as they were written
    String reason;      ///< why it is not sound; empty when it is
};

/// Lists what is in the file of an object store, in the order of the file, even when parts of it are damaged:
/// the header may be wrong and objects may be unsound, but the table must be whole. Nothing is changed.
///
/// `damage` is set to one sentence that tells why `TagBag::open` would refuse the file, and to nothing when
/// it would not. A failure means that the file cannot be read or that nothing can be told of its objects, for
/// the reason given; `objects` is then empty. Safe on any thread.
QM_API Qx::Status examineStore(const String& path, std::vector<StoredObjectInfo>& objects, String& damage);
