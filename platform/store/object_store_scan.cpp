#include "platform/store/detail/checksum.h"
#include "platform/store/detail/salvage.h"
#include "platform/store/pstream.h"

#include <algorithm>

namespace Qx::detail {

namespace {

constexpr uint32_t kMaxLayers = 64;
constexpr size_t kMaxLayerName = 64;

/// The length of the packed hierarchy that begins at `offset`, with name and revision of its last layer; 0
/// where none does.
uint64_t hierarchyAt(std::span<const std::byte> file, uint64_t offset, ScannedObject& found) {
    PStream stream(file.subspan(offset));
    const uint32_t layers = stream.getUnsignedLong();
    if (layers == 0 || layers > kMaxLayers) {
        return 0;
    }
    for (uint32_t i = 0; i < layers && stream.good(); ++i) {
        const uint32_t size = stream.getUnsignedLong();
        if (size == 0 || size > kMaxLayerName) {
            return 0;
        }
        const std::span<const std::byte> name = stream.getSpan(size);
        found.form = {reinterpret_cast<const char*>(name.data()), name.size()};
        found.object.major = stream.getCookedChar();
        found.object.minor = stream.getCookedChar();
        stream.getSpan(stream.getUnsignedLong());
        if (!stream.good() || !isStoredName(found.form)) {
            return 0;
        }
    }
    return stream.good() ? file.size() - offset - stream.remaining() : 0;
}

} // namespace

std::vector<ScannedObject> scanStore(std::span<const std::byte> file) {
    std::vector<ScannedObject> found;
    if (file.size() < kStoreHeaderSize) {
        return found;
    }
    std::vector<StoredObject> rows = readSoundRows(file, decodeStoreHeader(file).tableOffset);
    std::stable_sort(rows.begin(), rows.end(),
                     [](const StoredObject& a, const StoredObject& b) { return a.offset < b.offset; });
    auto row = rows.begin();
    uint64_t position = kStoreHeaderSize;
    while (position < file.size() && found.size() < kMaxStoredObjects) {
        while (row != rows.end() && row->offset < position) {
            ++row;
        }
        ScannedObject next;
        const uint64_t length = hierarchyAt(file, position, next);
        if (row != rows.end() && row->offset == position) {
            next.object = *row;
            next.form = length == row->length ? next.form : std::string_view();
            found.push_back(next);
            position = alignedStore(position + row->length + (row->length == 0 ? kStoreAlignment : 0));
            continue;
        }
        // An object reaches no further than the next one that a row vouches for.
        const uint64_t end = row == rows.end() ? file.size() : row->offset;
        if (length == 0 || length > end - position) {
            position += kStoreAlignment;
            continue;
        }
        next.object.offset = position;
        next.object.length = length;
        next.object.checksum = checksum(file.subspan(position, length));
        found.push_back(next);
        position = alignedStore(position + length);
    }
    return found;
}

} // namespace Qx::detail
