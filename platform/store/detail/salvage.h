#pragma once

#include "platform/base/status.h"
#include "platform/store/detail/object_store_file.h"
#include "platform/store/object_store_info.h"

namespace Qx::detail {

/// Reads a file whose table is whole, whatever else is wrong with it. `complaints` tells, object by object,
/// what is wrong with it (empty: nothing), and `verdict` what is wrong with the file.
Status salvageStore(const String& path, StoreImage& image, std::vector<StoredObject>& objects,
                    std::vector<String>& complaints, StoreVerdict& verdict);

StoredObjectInfo infoOf(const StoredObject& object, const String& complaint);

} // namespace Qx::detail
