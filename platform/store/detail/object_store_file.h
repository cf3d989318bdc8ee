#pragma once

#include "platform/base/qx_string.h"
#include "platform/services/files.h"
#include "platform/services/page_memory.h"

#include <array>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <span>
#include <vector>

/// The file of an object store, as docs/file-format.md describes it: reading and judging it. Nothing here
/// knows what an object is.
namespace Qx::detail {

// The numbers of the form live in files: do not change them.
inline constexpr std::array<unsigned char, 8> kStoreSignature = {0x89, 'Q', 'M', 'E', 0x0D, 0x0A, 0x1A, 0x0A};
inline constexpr uint16_t kStoreMajor = 1;
inline constexpr uint16_t kStoreMinor = 0;
inline constexpr uint32_t kStoreHeaderSize = 64;
inline constexpr size_t kStoreHeaderChecksumAt = 56;
inline constexpr uint64_t kStoreAlignment = 8;
inline constexpr uint64_t kMaxStoreSize = uint64_t{1} << 32;
inline constexpr uint32_t kMaxStoredObjects = 1u << 20;
inline constexpr size_t kMaxStoredName = 1024;

using StoreHeaderBytes = std::array<std::byte, kStoreHeaderSize>;

struct StoreHeader {
    uint16_t major = kStoreMajor;
    uint16_t minor = kStoreMinor;
    uint64_t fileSize = 0;
    uint64_t tableOffset = 0;
    uint64_t tableLength = 0;
    uint64_t tableChecksum = 0;
    uint32_t objectCount = 0;
};

/// A row of the table. The texts point into the file's bytes.
struct StoredObject {
    std::string_view name;
    std::string_view layer;
    uint8_t major = 0;
    uint8_t minor = 0;
    uint64_t offset = 0;
    uint64_t length = 0;
    uint64_t checksum = 0;
};

enum class StoreState { Sound, Foreign, Newer, Damaged };

struct [[nodiscard]] StoreVerdict {
    StoreState state = StoreState::Sound;
    String what; ///< what is wrong; empty when nothing is

    [[nodiscard]] bool isSound() const { return state == StoreState::Sound; }
    [[nodiscard]] static StoreVerdict damaged(String what) { return {StoreState::Damaged, std::move(what)}; }
    /// One sentence for a person: the path, what is wrong and what can be done.
    [[nodiscard]] String sentence(const String& path) const;
    /// The same as an outcome; a success for a sound store.
    [[nodiscard]] Status status(const String& path) const;
};

/// True for a name that may stand in the table: 1 to 1024 bytes of UTF-8 without control characters.
bool isStoredName(std::string_view name);

[[nodiscard]] constexpr uint64_t alignedStore(uint64_t position) {
    return (position + kStoreAlignment - 1) / kStoreAlignment * kStoreAlignment;
}

StoreHeaderBytes encodeStoreHeader(const StoreHeader& header);
/// The numbers of a header, unjudged. `bytes` holds a whole header at least.
StoreHeader decodeStoreHeader(std::span<const std::byte> bytes);

/// Judges the first bytes of a file of `fileSize` bytes, as many of the header's as there are.
StoreVerdict judgeStoreHeader(std::span<const std::byte> bytes, uint64_t fileSize);
/// Reads the table of a file; the header need not be sound. Judges the table's place, checksum, names and
/// form, not the places that it tells of.
StoreVerdict readStoreTable(std::span<const std::byte> file, std::vector<StoredObject>& objects);
/// The rows from `offset` on that read, up to the first that does not, whatever the table's checksum says.
/// Only those whose object's bytes have the checksum that the row tells.
std::vector<StoredObject> readSoundRows(std::span<const std::byte> file, uint64_t offset);
/// Judges where the objects lie and that every byte between them is zero.
StoreVerdict judgeStorePlaces(std::span<const std::byte> file, std::span<const StoredObject> objects);
/// What is wrong with one object's bytes; empty when they are within the file and as they were written.
String judgeStoredObject(std::span<const std::byte> file, const StoredObject& object);
/// All of the above.
StoreVerdict judgeStore(std::span<const std::byte> file, std::vector<StoredObject>& objects);

/// A file that was read or written, known again by these. Its header tells its size and, through the table's
/// checksum, the checksum of each object, so that it alone vouches for the contents; the other marks are
/// compared where they are known.
struct StoreIdentity {
    String path;
    FileInfo info;
    StoreHeaderBytes header{};
    bool known = false;
    bool infoKnown = false;
};

/// A whole file in memory.
class StoreImage {
public:
    /// Reads a file, up to the first failure. `judged` is the verdict on its header; when that is not sound
    /// and `headerMustHold`, nothing but the header was read.
    FileError read(const String& path, bool headerMustHold, StoreVerdict& judged);
    [[nodiscard]] std::span<const std::byte> bytes() const { return {m_bytes, m_size}; }
    /// Something that keeps a large part of the bytes of a large image, whatever becomes of the rest; null for
    /// what goes with the image. A loan of its own is worth its cost only for what is used where it lies.
    [[nodiscard]] std::shared_ptr<const void> keep(std::span<const std::byte> part) const {
        return m_pages == nullptr || part.size() < kLeastKept ? nullptr : m_pages->lend(part);
    }
    [[nodiscard]] const StoreIdentity& identity() const { return m_identity; }
    /// The bytes go, but for the parts that are kept.
    void drop() {
        if (m_pages != nullptr) {
            m_pages->giveBackUnlent();
        }
        m_pages.reset();
        m_heap.reset();
        m_bytes = nullptr;
        m_size = 0;
    }

private:
    static constexpr size_t kLeastKept = size_t{1} << 16;
    void allocate(size_t size);

    std::shared_ptr<PageMemory> m_pages; ///< of a large image
    std::unique_ptr<std::byte[]> m_heap; ///< of a small one
    std::byte* m_bytes = nullptr;
    size_t m_size = 0;
    StoreIdentity m_identity;
};

/// Reads objects out of a file that was read or written before.
class StoreSource {
public:
    /// Opens the file. False unless it is still the very one.
    bool open(const StoreIdentity& identity);
    /// Reads bytes at a place of the file, all or nothing.
    bool read(uint64_t offset, std::span<std::byte> to);

private:
    std::unique_ptr<OpenFile> m_file;
};

/// Reads until `to` is full. `got` is less only at the end of the file.
FileError readFully(OpenFile& file, std::span<std::byte> to, size_t& got);

} // namespace Qx::detail
