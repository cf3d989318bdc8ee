// The file of an object store, read from a file system in memory that holds the input as its one file. Each
// input is read as it is, and once more with the checksums of its header and table put right, so that the
// fuzzer gets behind them.

#include "platform/services/files.h"
#include "platform/store/configb.h"
#include "platform/store/edit_header_proxy.h"
#include "platform/store/tag_bag.h"

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <cstring>

#define XXH_INLINE_ALL
#include <xxhash.h>

namespace {

using Bytes = std::vector<uint8_t>;

class MemoryFile : public Qx::OpenFile {
public:
    explicit MemoryFile(const Bytes& bytes) : m_bytes(bytes) {}
    Qx::FileError read(void* to, size_t size, size_t& got) override {
        got = std::min(size, m_bytes.size() - m_position);
        if (got > 0) {
            std::memcpy(to, m_bytes.data() + m_position, got);
        }
        m_position += got;
        return {};
    }
    Qx::FileError seek(uint64_t offset) override {
        m_position = std::min<uint64_t>(offset, m_bytes.size());
        return {};
    }
    Qx::FileError info(Qx::FileInfo& info) override {
        info.kind = Qx::FileKind::Regular;
        info.size = m_bytes.size();
        return {};
    }
    Qx::FileError write(const void*, size_t, size_t&) override { return refuse(); }
    Qx::FileError setPermissions(uint32_t) override { return refuse(); }
    Qx::FileError sync() override { return refuse(); }
    Qx::FileError lock(bool, bool&) override { return refuse(); }
    Qx::FileError close() override { return {}; }

private:
    static Qx::FileError refuse() { return {EROFS, "write", "input"}; }
    const Bytes& m_bytes;
    size_t m_position = 0;
};

class MemoryFileSystem : public Qx::FileSystem {
public:
    Bytes bytes;

    Qx::FileError open(const String&, Qx::OpenMode mode, std::unique_ptr<Qx::OpenFile>& file) override {
        if (mode != Qx::OpenMode::Read) {
            return refuse();
        }
        file = std::make_unique<MemoryFile>(bytes);
        return {};
    }
    Qx::FileError info(const String&, Qx::FileInfo& info) override { return MemoryFile(bytes).info(info); }
    Qx::FileError rename(const String&, const String&) override { return refuse(); }
    Qx::FileError remove(const String&) override { return refuse(); }
    Qx::FileError makeFolder(const String&) override { return refuse(); }
    Qx::FileError removeFolder(const String&) override { return refuse(); }
    Qx::FileError list(const String&, std::vector<String>&) override { return refuse(); }
    Qx::FileError syncFolder(const String&) override { return refuse(); }
    Qx::FileError syncAll(const String&) override { return refuse(); }
    Qx::FileError touch(const String&, bool) override { return refuse(); }

private:
    static Qx::FileError refuse() { return {EROFS, "write", "input"}; }
};

void require(bool holds) {
    if (!holds) {
        std::abort();
    }
}

template <typename Number>
Number at(const Bytes& bytes, size_t offset) {
    Number number{};
    std::memcpy(&number, bytes.data() + offset, sizeof number);
    return number;
}

/// Puts right the checksums of the header and, where it lies within the file, of the table.
void mend(Bytes& bytes) {
    if (bytes.size() < 64) {
        return;
    }
    const auto tableOffset = at<uint64_t>(bytes, 24);
    const auto tableLength = at<uint64_t>(bytes, 32);
    if (tableOffset <= bytes.size() && tableLength <= bytes.size() - tableOffset) {
        const uint64_t sum = XXH3_64bits(bytes.data() + tableOffset, tableLength);
        std::memcpy(bytes.data() + 40, &sum, sizeof sum);
    }
    const uint64_t sum = XXH3_64bits(bytes.data(), 56);
    std::memcpy(bytes.data() + 56, &sum, sizeof sum);
}

void checkFile() {
    TagBag bag;
    const TagBag::OpenResult result =
        bag.open(cookie(Cookie_Type::Edit, 1, 1), "memory", eOpenExisting, ".qme");
    require((result == TagBag::Opened) == bag.isOpen() && bag.isOpen() == bag.openError().empty());
    for (const String& name : bag.names()) {
        require((bag.openObject(name) != nullptr) == bag.objectError().empty());
    }
    std::vector<StoredObjectInfo> objects;
    String damage;
    const bool examined = examineStore("memory/input", objects, damage).isOk();
    require(result != TagBag::Opened || (examined && damage.empty()));
    const bool salvaged = bag.openSalvaging("memory/input", objects) == TagBag::Opened;
    require(salvaged == examined);
    for (const String& name : bag.names()) {
        require((bag.extractObject(name) != nullptr) == bag.objectError().empty());
    }
}

void checkObject(std::span<const std::byte> bytes) {
    EditHeaderProxy proxy;
    PStream stream(bytes);
    require(proxy.STRM_hierarchyUnpack(stream) == stream.good());
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    checkObject(std::as_bytes(std::span(data, size)));
    MemoryFileSystem memory;
    Qx::FileSystem* before = Qx::setFileSystem(&memory);
    memory.bytes.assign(data, data + size);
    checkFile();
    mend(memory.bytes);
    checkFile();
    Qx::setFileSystem(before);
    return 0;
}
