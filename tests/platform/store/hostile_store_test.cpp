#include "store_fixture.h"
#include "support/memory_meter.h"

#include <chrono>
#include <cstring>
#include <functional>

#define XXH_INLINE_ALL
#include <xxhash.h>

using namespace test;

namespace {

/// A row of the table, as a forger would write it.
struct Row {
    std::string name;
    std::string layer = "Numbers";
    uint64_t offset = 0;
    uint64_t length = 0;
    std::string bytes = std::string(16, 'b');
};

/// A store of given rows with all checksums right, whatever the rows say.
struct Forgery {
    std::vector<Row> rows;
    uint32_t count = 0;
    uint16_t major = 1;
    uint16_t minor = 0;
    uint64_t tableShift = 0;
    uint64_t tableLengthShift = 0;
    uint64_t sizeShift = 0;
    uint32_t reserved = 0;
    uint32_t headerSize = 64;
    std::string tableEnd;
    std::string behind;

    explicit Forgery(size_t objects = 3) {
        for (size_t i = 0; i < objects; ++i) {
            Row row;
            row.name = "object" + std::to_string(i);
            row.offset = 64 + i * 16;
            row.length = 16;
            rows.push_back(row);
        }
        count = static_cast<uint32_t>(objects);
    }

    [[nodiscard]] std::string file() const {
        PStream table;
        std::string objects;
        for (const Row& row : rows) {
            objects += row.bytes;
            table.setString(row.name);
            table.setString(row.layer);
            table.setCookedChar(1);
            table.setCookedChar(0);
            table.setUnsignedLongLong(row.offset);
            table.setUnsignedLongLong(row.length);
            table.setUnsignedLongLong(
                XXH3_64bits(row.bytes.data(), std::min(row.bytes.size(), size_t(row.length))));
        }
        table.setRaw(tableEnd.data(), tableEnd.size());
        const uint64_t tableAt = 64 + objects.size();
        PStream header;
        header.setRaw("\x89QME\r\n\x1A\n", 8);
        header.setUnsignedShort(major);
        header.setUnsignedShort(minor);
        header.setUnsignedLong(headerSize);
        header.setUnsignedLongLong(tableAt + table.size() + behind.size() + sizeShift);
        header.setUnsignedLongLong(tableAt + tableShift);
        header.setUnsignedLongLong(table.size() + tableLengthShift);
        header.setUnsignedLongLong(XXH3_64bits(table.bytes().data(), table.size()));
        header.setUnsignedLong(count);
        header.setUnsignedLong(reserved);
        header.setUnsignedLongLong(XXH3_64bits(header.bytes().data(), header.size()));
        return text(header) + objects + text(table) + behind;
    }
    static std::string text(const PStream& stream) {
        return {reinterpret_cast<const char*>(stream.bytes().data()), stream.size()};
    }
};

class HostileStore : public StoreTest {
protected:
    TagBag::OpenResult openBytes(const std::string& content) {
        write(content);
        const auto start = std::chrono::steady_clock::now();
        const TagBag::OpenResult result = open(m_bag);
        const auto took = std::chrono::steady_clock::now() - start;
        EXPECT_LT(took, std::chrono::seconds(1));
        EXPECT_EQ(m_bag.openError().empty(), result == TagBag::Opened);
        EXPECT_EQ(m_bag.openStatus().code(), result == TagBag::Opened  ? Qx::StatusCode::Ok
                                             : result == TagBag::Newer ? Qx::StatusCode::Newer
                                                                       : Qx::StatusCode::Damaged);
        return result;
    }
    TagBag m_bag;
};

TEST_F(HostileStore, EveryFlippedByteIsRefused) {
    writeSmall();
    const std::string sound = bytes();
    for (size_t i = 0; i < sound.size(); ++i) {
        for (const int flip : {0x01, 0x80, 0xFF}) {
            std::string damaged = sound;
            damaged[i] = static_cast<char>(damaged[i] ^ flip);
            const TagBag::OpenResult result = openBytes(damaged);
            EXPECT_TRUE(result == TagBag::Damaged || (i < 8 && result == TagBag::Foreign))
                << "byte " << i << " flipped by " << flip << " gives " << result;
            EXPECT_NE(m_bag.openError().find(name), String::npos);
        }
    }
}

TEST_F(HostileStore, EveryTruncationAndEveryAppendedByteIsRefused) {
    writeSmall();
    const std::string sound = bytes();
    for (size_t size = 0; size < sound.size(); ++size) {
        EXPECT_EQ(openBytes(sound.substr(0, size)), TagBag::Damaged) << "cut after " << size;
    }
    for (const char c : {'\0', '\n', 'x'}) {
        EXPECT_EQ(openBytes(sound + c), TagBag::Damaged);
    }
    EXPECT_EQ(openBytes(sound + sound), TagBag::Damaged);
    EXPECT_EQ(openBytes(sound), TagBag::Opened);
}

TEST_F(HostileStore, TransferAsTextIsNamed) {
    writeSmall();
    std::string stripped;
    std::string widened;
    for (const char c : bytes()) {
        stripped += c == '\r' ? "" : std::string(1, c);
        widened += c == '\n' ? std::string("\r\n") : std::string(1, c);
    }
    for (const std::string& damaged : {stripped, widened}) {
        EXPECT_EQ(openBytes(damaged), TagBag::Damaged);
        EXPECT_NE(m_bag.openError().find("as text"), String::npos) << m_bag.openError();
    }
}

TEST_F(HostileStore, TablesThatLieAreRefused) {
    constexpr uint64_t k2to31 = uint64_t{1} << 31;
    constexpr uint64_t k2to63 = uint64_t{1} << 63;
    using Forge = std::function<void(Forgery&)>;
    const std::vector<std::pair<const char*, Forge>> cases = {
        {"an object before its place", [](Forgery& f) { f.rows[1].offset = 64; }},
        {"an object behind its place", [](Forgery& f) { f.rows[1].offset += 8; }},
        {"an object in the header", [](Forgery& f) { f.rows[0].offset = 0; }},
        {"an object that runs into the next", [](Forgery& f) { f.rows[0].length = 24; }},
        {"an object that runs into the table", [](Forgery& f) { f.rows[2].length = 17; }},
        {"a shorter object, so that a filling byte is not zero", [](Forgery& f) { f.rows[2].length = 15; }},
        {"a length of 2^31", [](Forgery& f) { f.rows[1].length = k2to31; }},
        {"a length of 2^32 - 1", [](Forgery& f) { f.rows[2].length = UINT32_MAX; }},
        {"a length of 2^63", [](Forgery& f) { f.rows[2].length = k2to63; }},
        {"a length of 2^64 - 1", [](Forgery& f) { f.rows[2].length = UINT64_MAX; }},
        {"a length that wraps around", [](Forgery& f) { f.rows[1].length = UINT64_MAX - 79; }},
        {"an offset of 2^63", [](Forgery& f) { f.rows[0].offset = k2to63; }},
        {"a name twice", [](Forgery& f) { f.rows[2].name = f.rows[0].name; }},
        {"an empty name", [](Forgery& f) { f.rows[2].name.clear(); }},
        {"a name with a line end", [](Forgery& f) { f.rows[2].name = "a\nb"; }},
        {"a name with a zero", [](Forgery& f) { f.rows[2].name = std::string("a\0b", 3); }},
        {"a name that is no UTF-8", [](Forgery& f) { f.rows[2].name = "a\xC3"; }},
        {"a name of 1025 bytes", [](Forgery& f) { f.rows[2].name.assign(1025, 'n'); }},
        {"a layer name with an escape", [](Forgery& f) { f.rows[0].layer = "\x1B[2J"; }},
        {"an empty layer name", [](Forgery& f) { f.rows[0].layer.clear(); }},
        {"more objects than rows", [](Forgery& f) { f.count = 4; }},
        {"fewer objects than rows", [](Forgery& f) { f.count = 2; }},
        {"2^32 - 1 objects", [](Forgery& f) { f.count = UINT32_MAX; }},
        {"no objects but bytes", [](Forgery& f) { f.count = 0; }},
        {"bytes behind the rows", [](Forgery& f) { f.tableEnd = "more"; }},
        {"a table that begins later", [](Forgery& f) { f.tableShift = 8; }},
        {"a table that begins in the header", [](Forgery& f) { f.tableShift = uint64_t{0} - 64; }},
        {"a table at 2^63", [](Forgery& f) { f.tableShift = k2to63; }},
        {"a table of 2^63 bytes", [](Forgery& f) { f.tableLengthShift = k2to63; }},
        {"a table that wraps around", [](Forgery& f) { f.tableLengthShift = uint64_t{0} - 200; }},
        {"a declared size of 2^63", [](Forgery& f) { f.sizeShift = k2to63; }},
        {"bytes behind the table", [](Forgery& f) { f.behind = "12345678"; }},
        {"a reserved field that is not zero", [](Forgery& f) { f.reserved = 1; }},
        {"a header of another size", [](Forgery& f) { f.headerSize = 72; }},
        {"format 0", [](Forgery& f) { f.major = 0; }},
    };
    for (const auto& [what, forge] : cases) {
        Forgery forgery;
        forge(forgery);
        const auto file = forgery.file();
        const test::MemoryMeter meter;
        EXPECT_EQ(openBytes(file), TagBag::Damaged) << what;
        EXPECT_LT(meter.peak(), file.size() + (64U << 20)) << what;
    }
    EXPECT_EQ(openBytes(Forgery().file()), TagBag::Opened) << m_bag.openError();
    EXPECT_EQ(openBytes(Forgery(0).file()), TagBag::Opened) << m_bag.openError();
}

TEST_F(HostileStore, NewerFormatsAreReadAsFarAsTheyCanBe) {
    Forgery forgery;
    forgery.minor = 1;
    forgery.tableEnd = "what a newer minor version added";
    EXPECT_EQ(openBytes(forgery.file()), TagBag::Opened) << m_bag.openError();
    forgery.major = 2;
    forgery.headerSize = 96;
    EXPECT_EQ(openBytes(forgery.file()), TagBag::Newer);
    EXPECT_NE(m_bag.openError().find("2.1"), String::npos) << m_bag.openError();
}

TEST_F(HostileStore, ObjectThatIsNoneIsRefusedAndKept) {
    const std::string file = Forgery().file();
    ASSERT_EQ(openBytes(file), TagBag::Opened);
    EXPECT_EQ(m_bag.openObject("object1"), nullptr);
    EXPECT_NE(m_bag.objectError().find("object1"), String::npos);
    EXPECT_EQ(m_bag.objectStatus().code(), Qx::StatusCode::Damaged);
    ASSERT_TRUE(m_bag.flush());
    EXPECT_EQ(bytes(), file);
}

} // namespace
