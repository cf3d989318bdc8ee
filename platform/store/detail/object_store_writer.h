#pragma once

#include "platform/base/status.h"
#include "platform/services/atomic_file.h"
#include "platform/store/detail/object_store_file.h"
#include "platform/store/streamable.h"

namespace Qx::detail {

/// Where a writer put an object, and its checksum.
struct StoredPlace {
    uint64_t offset = 0;
    uint64_t length = 0;
    uint64_t checksum = 0;
};

/// Name, layer and revision of an object that is being written.
struct StoredLabel {
    std::string_view name;
    std::string_view layer;
    uint8_t major = 0;
    uint8_t minor = 0;
};

/// Writes the file of an object store, object after object, atomically. After a failure of any call nothing
/// more is called; destroying the writer then leaves the old file as it was.
class StoreWriter {
public:
    explicit StoreWriter(const String& path) : m_path(path), m_file(path) {}

    Status begin();
    /// Packs an object.
    Status add(const StoredLabel& label, const Streamable& object, StoredPlace& place);
    /// Takes over bytes whose checksum is known.
    Status add(const StoredLabel& label, std::span<const std::byte> bytes, uint64_t sum, StoredPlace& place);
    /// Takes over bytes from another store. `intact` is false, and the writer is good for nothing more, when
    /// they cannot be read or are not what they were.
    Status add(const StoredLabel& label, StoreSource& source, const StoredPlace& from, StoredPlace& place,
               bool& intact);
    /// Writes table and header and makes the file take its name. `identity` is set, and `replaced` true, as
    /// soon as it has, even when making that durable then fails.
    Status commit(StoreIdentity& identity, bool& replaced);

private:
    Status endObject(const StoredLabel& label, uint64_t start, uint64_t sum, StoredPlace& place);
    Status write(std::span<const std::byte> bytes);
    Status writeBuffer();
    [[nodiscard]] uint64_t position() const { return m_file.size() + m_buffer.size(); }

    String m_path;
    AtomicFile m_file;
    PStream m_buffer; ///< bytes that follow those in the file
    PStream m_table;
    uint32_t m_count = 0;
};

} // namespace Qx::detail
