#include "platform/store/detail/object_store_file.h"

#include "platform/store/detail/checksum.h"
#include "platform/store/detail/header_values.h"
#include "platform/store/pstream.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <unordered_set>

namespace Qx::detail {

namespace {

/// A name and a layer name of one byte each, two revision bytes, offset, length and checksum.
constexpr size_t kLeastRowSize = 4 + 1 + 4 + 1 + 2 + 24;

std::span<const std::byte> signatureBytes() {
    return std::as_bytes(std::span(kStoreSignature));
}

/// Room for a row's numbers in a message.
String number(uint64_t value) {
    return std::to_string(value);
}

/// What to say of a file that does not begin with the signature, or not with all of it.
StoreVerdict judgeSignature(std::span<const std::byte> bytes) {
    const std::span<const std::byte> signature = signatureBytes();
    if (bytes.empty()) {
        return StoreVerdict::damaged("it is empty");
    }
    if (bytes.size() < signature.size() && std::equal(bytes.begin(), bytes.end(), signature.begin())) {
        return StoreVerdict::damaged("it is cut off after " + number(bytes.size()) + " bytes");
    }
    // The letters stand but what surrounds them does not: line ends were changed, or the eighth bit cut.
    const bool letters =
        bytes.size() >= 4 && std::equal(bytes.begin() + 1, bytes.begin() + 4, signature.begin() + 1);
    if (letters) {
        return StoreVerdict::damaged("its signature is changed, as by a transfer as text");
    }
    return {StoreState::Foreign, "it begins with other bytes"};
}

bool takeName(PStream& stream, std::string_view& name) {
    const std::span<const std::byte> bytes = stream.getSpan(stream.getUnsignedLong());
    name = {reinterpret_cast<const char*>(bytes.data()), bytes.size()};
    return stream.good() && isStoredName(name);
}

StoredObject takeRow(PStream& stream, String& complaint) {
    StoredObject row;
    if (!takeName(stream, row.name)) {
        complaint = stream.good() ? "has the name " + quoted(row.name) + ", which no object may have"
                                  : String("is cut off");
        return row;
    }
    if (!takeName(stream, row.layer)) {
        complaint = stream.good() ? "has the layer name " + quoted(row.layer) + ", which no layer may have"
                                  : String("is cut off");
        return row;
    }
    row.major = stream.getCookedChar();
    row.minor = stream.getCookedChar();
    row.offset = stream.getUnsignedLongLong();
    row.length = stream.getUnsignedLongLong();
    row.checksum = stream.getUnsignedLongLong();
    if (!stream.good()) {
        complaint = "is cut off";
    }
    return row;
}

/// The first position in [from, to) that does not hold zero; `to` if all do.
uint64_t firstNonZero(std::span<const std::byte> file, uint64_t from, uint64_t to) {
    while (from < to && file[from] == std::byte{0}) {
        ++from;
    }
    return from;
}

} // namespace

Status StoreVerdict::status(const String& path) const {
    switch (state) {
    case StoreState::Sound:
        return {};
    case StoreState::Newer:
        return Status::failure(StatusCode::Newer, sentence(path));
    case StoreState::Foreign:
    case StoreState::Damaged:
        break;
    }
    return Status::failure(StatusCode::Damaged, sentence(path));
}

String StoreVerdict::sentence(const String& path) const {
    switch (state) {
    case StoreState::Sound:
        return {};
    case StoreState::Foreign:
        return path + " is not an object store: " + what + "; check that this is the file you mean";
    case StoreState::Newer:
        return path + " was written by a newer version of this program: " + what +
               "; open it with that version";
    case StoreState::Damaged:
        break;
    }
    return path + " is damaged: " + what + "; restore a backup of it, or salvage the objects that are sound";
}

bool isStoredName(std::string_view name) {
    const auto isControl = [](char c) {
        const auto byte = static_cast<unsigned char>(c);
        return byte < 0x20 || byte == 0x7F;
    };
    return !name.empty() && name.size() <= kMaxStoredName &&
           std::none_of(name.begin(), name.end(), isControl) && isUtf8(name);
}

StoreHeaderBytes encodeStoreHeader(const StoreHeader& header) {
    PStream stream;
    stream.setRaw(kStoreSignature.data(), kStoreSignature.size());
    stream.setUnsignedShort(header.major);
    stream.setUnsignedShort(header.minor);
    stream.setUnsignedLong(kStoreHeaderSize);
    stream.setUnsignedLongLong(header.fileSize);
    stream.setUnsignedLongLong(header.tableOffset);
    stream.setUnsignedLongLong(header.tableLength);
    stream.setUnsignedLongLong(header.tableChecksum);
    stream.setUnsignedLong(header.objectCount);
    stream.setUnsignedLong(0);
    stream.setUnsignedLongLong(checksum(stream.bytes()));
    StoreHeaderBytes bytes{};
    std::memcpy(bytes.data(), stream.bytes().data(), bytes.size());
    return bytes;
}

StoreHeader decodeStoreHeader(std::span<const std::byte> bytes) {
    PStream stream(bytes);
    stream.getSpan(kStoreSignature.size());
    StoreHeader header;
    header.major = stream.getUnsignedShort();
    header.minor = stream.getUnsignedShort();
    stream.getUnsignedLong();
    header.fileSize = stream.getUnsignedLongLong();
    header.tableOffset = stream.getUnsignedLongLong();
    header.tableLength = stream.getUnsignedLongLong();
    header.tableChecksum = stream.getUnsignedLongLong();
    header.objectCount = stream.getUnsignedLong();
    return header;
}

StoreVerdict judgeStoreHeader(std::span<const std::byte> bytes, uint64_t fileSize) {
    const std::span<const std::byte> signature = signatureBytes();
    if (bytes.size() < signature.size() || !std::equal(signature.begin(), signature.end(), bytes.begin())) {
        return judgeSignature(bytes);
    }
    if (bytes.size() < kStoreHeaderSize) {
        return StoreVerdict::damaged("it is cut off after " + number(fileSize) + " bytes");
    }
    PStream sum(bytes.subspan(kStoreHeaderChecksumAt));
    if (sum.getUnsignedLongLong() != checksum(bytes.first(kStoreHeaderChecksumAt))) {
        return StoreVerdict::damaged("the checksum of its header is wrong");
    }
    const StoreHeader header = decodeStoreHeader(bytes);
    if (header.major > kStoreMajor) {
        return {StoreState::Newer, "it has format " + number(header.major) + "." + number(header.minor) +
                                       ", this version reads format " + number(kStoreMajor)};
    }
    PStream rest(bytes.subspan(12));
    const uint32_t headerSize = rest.getUnsignedLong();
    PStream reserved(bytes.subspan(52));
    if (header.major < kStoreMajor || headerSize != kStoreHeaderSize || reserved.getUnsignedLong() != 0) {
        return StoreVerdict::damaged("its header contradicts itself");
    }
    if (header.fileSize != fileSize) {
        return StoreVerdict::damaged("it has " + number(fileSize) + " bytes and was written with " +
                                     number(header.fileSize));
    }
    return {};
}

StoreVerdict readStoreTable(std::span<const std::byte> file, std::vector<StoredObject>& objects) {
    objects.clear();
    if (file.size() < kStoreHeaderSize) {
        return StoreVerdict::damaged("it is cut off after " + number(file.size()) + " bytes");
    }
    const StoreHeader header = decodeStoreHeader(file);
    if (header.tableOffset < kStoreHeaderSize || header.tableOffset > file.size() ||
        header.tableLength > file.size() - header.tableOffset) {
        return StoreVerdict::damaged("its table does not lie within it");
    }
    const std::span<const std::byte> bytes = file.subspan(header.tableOffset, header.tableLength);
    if (checksum(bytes) != header.tableChecksum) {
        return StoreVerdict::damaged("the checksum of its table is wrong");
    }
    if (header.objectCount > kMaxStoredObjects || header.objectCount > bytes.size() / kLeastRowSize) {
        return StoreVerdict::damaged("its table cannot hold " + number(header.objectCount) + " objects");
    }
    PStream stream(bytes);
    std::unordered_set<std::string_view> names;
    std::vector<StoredObject> rows;
    rows.reserve(header.objectCount);
    names.reserve(header.objectCount);
    for (uint32_t i = 0; i < header.objectCount; ++i) {
        String complaint;
        const StoredObject row = takeRow(stream, complaint);
        if (complaint.empty() && !names.insert(row.name).second) {
            complaint = "has the name " + quoted(row.name) + " of another object";
        }
        if (!complaint.empty()) {
            return StoreVerdict::damaged("row " + number(i + 1) + " of its table " + complaint);
        }
        rows.push_back(row);
    }
    // A newer minor version may have added to the end of the table; this one leaves nothing over.
    if (stream.remaining() > 0 && header.minor <= kStoreMinor) {
        return StoreVerdict::damaged("its table has bytes left over");
    }
    objects = std::move(rows);
    return {};
}

std::vector<StoredObject> readSoundRows(std::span<const std::byte> file, uint64_t offset) {
    std::vector<StoredObject> rows;
    if (offset < kStoreHeaderSize || offset > file.size()) {
        return rows;
    }
    PStream stream(file.subspan(offset));
    while (stream.remaining() >= kLeastRowSize && rows.size() < kMaxStoredObjects) {
        String complaint;
        const StoredObject row = takeRow(stream, complaint);
        if (!complaint.empty()) {
            break;
        }
        if (row.offset >= kStoreHeaderSize && judgeStoredObject(file, row).empty()) {
            rows.push_back(row);
        }
    }
    return rows;
}

StoreVerdict judgeStorePlaces(std::span<const std::byte> file, std::span<const StoredObject> objects) {
    const StoreHeader header = decodeStoreHeader(file);
    uint64_t position = kStoreHeaderSize;
    for (const StoredObject& object : objects) {
        if (object.offset != position || object.length > header.tableOffset - position) {
            return StoreVerdict::damaged("object " + quoted(object.name) + " lies at " +
                                         number(object.offset) + " with a length of " +
                                         number(object.length) + ", which is not its place");
        }
        const uint64_t end = position + object.length;
        position = alignedStore(end);
        if (position > header.tableOffset) {
            return StoreVerdict::damaged("its table begins within object " + quoted(object.name));
        }
        const uint64_t stray = firstNonZero(file, end, position);
        if (stray != position) {
            return StoreVerdict::damaged("the filling byte at " + number(stray) + " is not zero");
        }
    }
    if (position != header.tableOffset || header.tableLength != file.size() - position) {
        return StoreVerdict::damaged("its table is not in its place");
    }
    return {};
}

String judgeStoredObject(std::span<const std::byte> file, const StoredObject& object) {
    if (object.offset > file.size() || object.length > file.size() - object.offset) {
        return "object " + quoted(object.name) + " does not lie within the file";
    }
    if (checksum(file.subspan(object.offset, object.length)) != object.checksum) {
        return "the checksum of object " + quoted(object.name) + " is wrong";
    }
    return {};
}

StoreVerdict judgeStore(std::span<const std::byte> file, std::vector<StoredObject>& objects) {
    StoreVerdict verdict =
        judgeStoreHeader(file.first(std::min<size_t>(file.size(), kStoreHeaderSize)), file.size());
    if (verdict.isSound()) {
        verdict = readStoreTable(file, objects);
    }
    if (verdict.isSound()) {
        verdict = judgeStorePlaces(file, objects);
    }
    for (size_t i = 0; i < objects.size() && verdict.isSound(); ++i) {
        String complaint = judgeStoredObject(file, objects[i]);
        if (!complaint.empty()) {
            verdict = StoreVerdict::damaged(std::move(complaint));
        }
    }
    return verdict;
}

FileError readFully(OpenFile& file, std::span<std::byte> to, size_t& got) {
    got = 0;
    while (got < to.size()) {
        size_t piece = 0;
        if (FileError error =
                retryInterrupted([&] { return file.read(to.data() + got, to.size() - got, piece); })) {
            return error;
        }
        if (piece == 0) {
            break;
        }
        got += piece;
    }
    return {};
}

void StoreImage::allocate(size_t size) {
    m_size = size;
    m_pages = size < PageMemory::kLeastSize ? nullptr : PageMemory::make(size);
    if (m_pages != nullptr) {
        m_bytes = m_pages->bytes().data();
        return;
    }
    // Not zeroed: every byte is overwritten from the file.
    m_heap = std::make_unique_for_overwrite<std::byte[]>(size);
    m_bytes = m_heap.get();
}

FileError StoreImage::read(const String& path, bool headerMustHold, StoreVerdict& judged) {
    drop();
    m_identity = {};
    std::unique_ptr<OpenFile> file;
    if (FileError error = retryInterrupted([&] { return fileSystem().open(path, OpenMode::Read, file); })) {
        return error;
    }
    FileInfo info;
    if (FileError error = retryInterrupted([&] { return file->info(info); })) {
        return error;
    }
    if (info.size > kMaxStoreSize) {
        return {EFBIG, "read", path};
    }
    allocate(info.size);
    const std::span<std::byte> whole(m_bytes, m_size);
    const size_t headerSize = std::min<size_t>(m_size, kStoreHeaderSize);
    size_t got = 0;
    if (FileError error = readFully(*file, whole.first(headerSize), got)) {
        return error;
    }
    judged = judgeStoreHeader(whole.first(got), info.size);
    if (headerMustHold && !judged.isSound()) {
        return {};
    }
    size_t more = 0;
    if (FileError error = readFully(*file, whole.subspan(got), more)) {
        return error;
    }
    m_size = got + more;
    if (m_size < info.size) {
        judged = StoreVerdict::damaged("it became shorter while it was read");
        return {};
    }
    m_identity.path = path;
    m_identity.info = info;
    m_identity.known = m_size >= kStoreHeaderSize;
    m_identity.infoKnown = true;
    std::memcpy(m_identity.header.data(), m_bytes, headerSize);
    return {};
}

bool StoreSource::open(const StoreIdentity& identity) {
    FileInfo info;
    StoreHeaderBytes header{};
    m_file.reset();
    std::unique_ptr<OpenFile> file;
    size_t got = 0;
    const bool opened =
        identity.known &&
        !retryInterrupted([&] { return fileSystem().open(identity.path, OpenMode::Read, file); }) &&
        !retryInterrupted([&] { return file->info(info); }) && !readFully(*file, header, got);
    const bool unmoved = !identity.infoKnown || isSameFile(info, identity.info);
    const bool same = opened && unmoved && got == header.size() && header == identity.header &&
                      info.size == decodeStoreHeader(header).fileSize;
    if (same) {
        m_file = std::move(file);
    }
    return same;
}

bool StoreSource::read(uint64_t offset, std::span<std::byte> to) {
    size_t got = 0;
    return m_file != nullptr && !retryInterrupted([&] { return m_file->seek(offset); }) &&
           !readFully(*m_file, to, got) && got == to.size();
}

} // namespace Qx::detail
