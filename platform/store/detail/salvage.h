#pragma once

#include "platform/base/status.h"
#include "platform/store/detail/object_store_file.h"
#include "platform/store/object_store_info.h"

namespace Qx::detail {

/// Reads a file whose table is whole, whatever else is wrong with it. `complaints` tells, object by object,
/// what is wrong with it (empty: nothing), and `verdict` what is wrong with the file.
Status salvageStore(const String& path, StoreImage& image, std::vector<StoredObject>& objects,
                    std::vector<String>& complaints, StoreVerdict& verdict);

/// An object that was found in a file without a whole table.
struct ScannedObject {
    StoredObject object;   ///< its name and layer are empty where no row tells them
    std::string_view form; ///< the short name of its most derived layer; empty where its bytes do not tell it
};

/// Looks for objects in a file whose table is not whole, in the order of the file. Rows of the table that
/// read and whose checksum fits come first; the rest of the file is searched at each place where an object
/// may begin for a packed hierarchy of layers.
std::vector<ScannedObject> scanStore(std::span<const std::byte> file);

StoredObjectInfo infoOf(const StoredObject& object, const String& complaint);

} // namespace Qx::detail
