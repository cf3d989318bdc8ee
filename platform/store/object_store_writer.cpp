#include "platform/store/detail/object_store_writer.h"

#include "platform/store/detail/checksum.h"
#include "platform/store/detail/header_values.h"

#include <algorithm>

namespace Qx::detail {

namespace {

/// So many bytes are gathered before they go to the file; spans above a quarter of it go straight.
constexpr size_t kWriteSize = size_t{1} << 20;

} // namespace

Status StoreWriter::write(std::span<const std::byte> bytes) {
    if (bytes.size() > kMaxStoreSize || m_file.size() > kMaxStoreSize - bytes.size()) {
        return Status::failure(StatusCode::Unsupported,
                               m_path + " would be larger than 4 GiB, the greatest size of an object store");
    }
    if (const FileError error = m_file.write(bytes.data(), bytes.size())) {
        return error.status();
    }
    return {};
}

Status StoreWriter::writeBuffer() {
    Status status;
    for (const std::span<const std::byte> piece : m_buffer.pieces()) {
        status = write(piece);
        if (!status) {
            break;
        }
    }
    m_buffer.clear();
    m_buffer.setPlace(m_file.size());
    return status;
}

Status StoreWriter::begin() {
    // The header is known only at the end; until then its place holds zeros, which no reader takes for one.
    m_buffer.gather();
    const StoreHeaderBytes none{};
    m_buffer.setRaw(none.data(), none.size());
    return {};
}

Status StoreWriter::add(const StoredLabel& label, const Streamable& object, StoredPlace& place) {
    const uint64_t start = position();
    const size_t from = m_buffer.size();
    object.STRM_hierarchyPack(m_buffer);
    if (!m_buffer.good()) {
        return Status::failure("object " + quoted(label.name) + " of " + m_path +
                               " cannot be packed: a text or layer of it is larger than 4 GiB");
    }
    RunningChecksum sum;
    for (const std::span<const std::byte> piece : m_buffer.pieces(from)) {
        sum.add(piece);
    }
    return endObject(label, start, sum.value(), place);
}

Status StoreWriter::add(const StoredLabel& label, std::span<const std::byte> bytes, uint64_t sum,
                        StoredPlace& place) {
    const uint64_t start = position();
    if (bytes.size() > kWriteSize / 4) {
        if (Status status = writeBuffer(); !status) {
            return status;
        }
        if (Status status = write(bytes); !status) {
            return status;
        }
        m_buffer.setPlace(m_file.size());
    } else {
        m_buffer.setRaw(bytes.data(), bytes.size());
    }
    return endObject(label, start, sum, place);
}

Status StoreWriter::add(const StoredLabel& label, StoreSource& source, const StoredPlace& from,
                        StoredPlace& place, bool& intact) {
    const uint64_t start = position();
    std::vector<std::byte> piece(std::min<uint64_t>(from.length, kWriteSize));
    RunningChecksum sum;
    uint64_t done = 0;
    while (done < from.length) {
        const std::span<std::byte> bytes =
            std::span(piece).first(std::min<uint64_t>(piece.size(), from.length - done));
        intact = source.read(from.offset + done, bytes);
        if (!intact) {
            return {};
        }
        sum.add(bytes);
        done += bytes.size();
        m_buffer.setRaw(bytes.data(), bytes.size());
        if (m_buffer.size() >= kWriteSize) {
            if (Status status = writeBuffer(); !status) {
                return status;
            }
        }
    }
    intact = sum.value() == from.checksum;
    return intact ? endObject(label, start, from.checksum, place) : Status();
}

Status StoreWriter::endObject(const StoredLabel& label, uint64_t start, uint64_t sum, StoredPlace& place) {
    if (++m_count > kMaxStoredObjects) {
        return Status::failure(StatusCode::Unsupported, m_path + " would hold more than " +
                                                            std::to_string(kMaxStoredObjects) + " objects");
    }
    place = {start, position() - start, sum};
    m_table.setString(label.name);
    m_table.setString(label.layer);
    m_table.setCookedChar(label.major);
    m_table.setCookedChar(label.minor);
    m_table.setUnsignedLongLong(place.offset);
    m_table.setUnsignedLongLong(place.length);
    m_table.setUnsignedLongLong(place.checksum);
    const std::array<std::byte, kStoreAlignment> zeros{};
    m_buffer.setRaw(zeros.data(), alignedStore(position()) - position());
    return m_buffer.size() < kWriteSize ? Status() : writeBuffer();
}

Status StoreWriter::commit(StoreIdentity& identity, bool& replaced) {
    StoreHeader header;
    header.tableOffset = position();
    header.tableLength = m_table.size();
    header.tableChecksum = checksum(m_table.bytes());
    header.objectCount = m_count;
    header.fileSize = header.tableOffset + header.tableLength;
    m_buffer.setRaw(m_table.bytes().data(), m_table.size());
    if (Status status = writeBuffer(); !status) {
        return status;
    }
    const StoreHeaderBytes bytes = encodeStoreHeader(header);
    if (const FileError error = m_file.overwrite(0, bytes.data(), bytes.size())) {
        return error.status();
    }
    // Memory is asked for before the file is in place.
    StoreIdentity made{m_path, {}, bytes, true, false};
    const FileError error = m_file.commit();
    replaced = !error || m_file.replaced();
    if (replaced) {
        std::swap(identity, made);
        identity.info = m_file.info();
        identity.infoKnown = true;
        // Within a batch the name still holds the old file. Some file systems set the time when a file is closed.
        const FileInfo named = m_file.replaced() ? askFile(m_path).info() : FileInfo();
        if (named.kind == identity.info.kind && named.device == identity.info.device &&
            named.inode == identity.info.inode && named.size == identity.info.size) {
            identity.info = named;
        }
    }
    return error.status();
}

} // namespace Qx::detail
