#include "platform/services/atomic_batch.h"
#include "store_fixture.h"

#include <fcntl.h>
#include <sys/stat.h>

using namespace test;

namespace {

using Values = std::vector<uint32_t>;

TEST_F(StoreTest, ObjectsComeBackInTheirOrder) {
    writeSmall();
    TagBag bag;
    ASSERT_EQ(open(bag), TagBag::Opened) << bag.openError();
    EXPECT_EQ(bag.names(), (std::vector<String>{"first", "strange", "last"}));
    EXPECT_EQ(valuesOf(bag, "first"), (Values{1, 2, 3}));
    EXPECT_EQ(valuesOf(bag, "last"), (Values{4, 5}));

    EXPECT_EQ(bag.openObject("absent"), nullptr);
    EXPECT_NE(bag.objectError().find("absent"), String::npos);
    EXPECT_EQ(bag.objectStatus().code(), Qx::StatusCode::NotFound);
    EXPECT_EQ(bag.openObject("strange"), nullptr);
    EXPECT_NE(bag.objectError().find("Stranger"), String::npos);
    EXPECT_EQ(bag.objectStatus().code(), Qx::StatusCode::Unsupported);
    Stranger stranger;
    EXPECT_TRUE(bag.readObject("strange", stranger));
    EXPECT_EQ(stranger.values, (Values{7}));
}

TEST_F(StoreTest, UnchangedObjectsAreNotPacked) {
    writeSmall();
    const std::string before = bytes();
    TagBag bag;
    ASSERT_EQ(open(bag), TagBag::Opened);
    const auto first = bag.extractObject("first");
    const auto last = bag.extractObject("last");
    ASSERT_TRUE(first && last);
    bag.lendObject("first", *first, false);
    bag.lendObject("last", *last, false);
    ASSERT_TRUE(bag.flush());
    EXPECT_EQ(bag.numPacked(), 0u);
    EXPECT_EQ(bag.numKept(), 3u);
    EXPECT_EQ(bytes(), before) << "the same objects give the same bytes";

    auto& list = dynamic_cast<Numbers&>(*first);
    list.values.assign(1000, 9);
    bag.lendObject("first", *first, true);
    ASSERT_TRUE(bag.flush());
    EXPECT_EQ(bag.numPacked(), 1u);
    bag.releaseLent();
    ASSERT_TRUE(bag.flush()) << "what is not lent stays as it was last written";
    EXPECT_EQ(bag.numPacked(), 0u);
    ASSERT_EQ(open(bag), TagBag::Opened);
    EXPECT_EQ(valuesOf(bag, "first"), Values(1000, 9));
    EXPECT_EQ(valuesOf(bag, "last"), (Values{4, 5}));
    EXPECT_EQ(bag.names(), (std::vector<String>{"first", "strange", "last"}));
}

TEST_F(StoreTest, BytesAreTakenOnlyFromTheVeryFileThatWasRead) {
    struct Case {
        const char* what;
        std::function<void(const String&, std::string)> spoil;
    };
    const Case cases[] = {
        {"gone", [](const String& path, const std::string&) { ::unlink(path.c_str()); }},
        {"damaged with the same size and time",
         [](const String& path, std::string content) {
             struct stat was {};
             ::stat(path.c_str(), &was);
             const size_t at = content.find("N") + 12; // within the bytes of the first object
             content[at] = static_cast<char>(content[at] ^ 1);
             std::ofstream(path, std::ios::binary | std::ios::in | std::ios::out) << content;
             const timespec times[2] = {was.st_atim, was.st_mtim};
             ::utimensat(AT_FDCWD, path.c_str(), times, 0);
         }},
        {"another store",
         [](const String& path, const std::string& content) {
             std::ofstream(path, std::ios::binary) << content << "more";
         }},
    };
    for (const Case& each : cases) {
        SCOPED_TRACE(each.what);
        writeSmall();
        TagBag bag;
        ASSERT_EQ(open(bag), TagBag::Opened);
        const auto first = bag.extractObject("first");
        const auto last = bag.extractObject("last");
        ASSERT_TRUE(first && last);
        each.spoil(bag.path(), bytes());
        const std::string spoiled = bytes();

        bag.lendObject("first", *first, false);
        EXPECT_FALSE(bag.flush()) << "nobody has the bytes of the last object";
        EXPECT_EQ(bytes(), spoiled);
        EXPECT_LE(folder.numNames(), 1u) << "a temporary file was left behind";

        bag.lendObject("last", *last, false);
        const Qx::Status status = bag.flush();
        ASSERT_TRUE(status) << status.reason();
        ASSERT_EQ(open(bag), TagBag::Opened) << bag.openError();
        EXPECT_EQ(valuesOf(bag, "first"), (Values{1, 2, 3}));
        EXPECT_EQ(valuesOf(bag, "last"), (Values{4, 5}));
        EXPECT_TRUE(bag.contains("strange"));
    }
}

TEST_F(StoreTest, BatchPutsTheFileInPlaceLater) {
    writeSmall();
    TagBag bag;
    ASSERT_EQ(open(bag), TagBag::Opened);
    auto first = bag.extractObject("first");
    auto last = bag.extractObject("last");
    dynamic_cast<Numbers&>(*first).values = {8};
    {
        Qx::AtomicBatch batch;
        bag.lendObject("first", *first, true);
        ASSERT_TRUE(bag.flush());
        bag.releaseLent();
        ASSERT_FALSE(batch.commit());
    }
    ASSERT_TRUE(bag.flush()) << "the bytes are found in the file that the batch put in place";
    EXPECT_EQ(bag.numKept(), 3u);
    ASSERT_EQ(open(bag), TagBag::Opened);
    EXPECT_EQ(valuesOf(bag, "first"), (Values{8}));
    EXPECT_EQ(valuesOf(bag, "last"), (Values{4, 5}));
}

TEST_F(StoreTest, OwnedObjectsAreReplacedMarkedAndRemoved) {
    writeSmall();
    TagBag bag;
    ASSERT_EQ(open(bag), TagBag::Opened);
    bag.storeObject("first", numbers({6}));
    dynamic_cast<Numbers&>(*bag.openObject("last")).values = {5};
    bag.markChanged("last");
    EXPECT_TRUE(bag.removeObject("strange"));
    EXPECT_FALSE(bag.removeObject("strange"));
    ASSERT_TRUE(bag.flush());
    EXPECT_EQ(bag.numPacked(), 2u);
    ASSERT_EQ(open(bag), TagBag::Opened);
    EXPECT_EQ(bag.getNumObjects(), 2u);
    EXPECT_EQ(valuesOf(bag, "first"), (Values{6}));
    EXPECT_EQ(valuesOf(bag, "last"), (Values{5}));
    bag.storeObject("brief", numbers({1}));
    EXPECT_NE(bag.extractObject("brief"), nullptr);
    EXPECT_FALSE(bag.contains("brief")) << "nothing of it is left in the bag";
}

/// A list whose layer was written in another revision.
class OtherRevision : public Numbers {
public:
    OtherRevision(uint8_t itsMajor, uint8_t itsMinor, bool more)
        : m_major(itsMajor), m_minor(itsMinor), m_more(more) {}
    void STRM_hierarchyPack(PStream& stream) const override {
        stream.setUnsignedLong(2);
        for (const char* layer : {"somebody else's", "N"}) {
            stream.setString(layer);
            stream.setCookedChar(m_major);
            stream.setCookedChar(m_minor);
            stream.setUnsignedLong(m_more ? 8 : 4);
            stream.setUnsignedLong(0);
            if (m_more) {
                stream.setUnsignedLong(77);
            }
        }
    }

private:
    uint8_t m_major;
    uint8_t m_minor;
    bool m_more;
};

TEST_F(StoreTest, RevisionOfALayerDecidesWhetherItIsRead) {
    const struct {
        uint8_t major, minor;
        bool more, read;
    } cases[] = {
        {2, 3, false, true}, {2, 3, true, false}, {2, 4, true, true},   {2, 0, false, true},
        {1, 9, false, true}, {1, 9, true, false}, {3, 0, false, false},
    };
    for (const auto& each : cases) {
        SCOPED_TRACE(String::format("%d.%d more %d", each.major, each.minor, each.more));
        PStream out;
        OtherRevision(each.major, each.minor, each.more).STRM_hierarchyPack(out);
        PStream in(out.bytes());
        Numbers list({5});
        EXPECT_EQ(list.STRM_hierarchyUnpack(in), each.read);
        EXPECT_EQ(in.good(), each.read);
        EXPECT_EQ(list.revisionMajor(), each.read ? each.major : 2);
        PStream again;
        list.STRM_hierarchyPack(again);
        EXPECT_EQ(std::to_integer<int>(again.bytes()[9]), 2) << "what is written has the current revision";
        EXPECT_EQ(std::to_integer<int>(again.bytes()[10]), 3);
    }
}

TEST_F(StoreTest, NamesThatAreNoStoreAreToldApart) {
    TagBag bag;
    const auto result = [&](eEditOpenBehaviour behaviour = eOpenExisting) {
        const TagBag::OpenResult found = open(bag, behaviour);
        EXPECT_EQ(bag.isOpen(), found == TagBag::Opened || found == TagBag::NewStore);
        EXPECT_EQ(bag.openError().empty(), bag.isOpen()) << bag.openError();
        return found;
    };
    EXPECT_EQ(result(), TagBag::Missing);
    EXPECT_EQ(result(eOpenOrCreate), TagBag::NewStore);
    write("");
    EXPECT_EQ(result(), TagBag::Damaged);
    write(std::string("\xFF\xD8\xFF\xE0\0\x10JFIF", 10) + std::string(100, 'x'));
    EXPECT_EQ(result(), TagBag::Foreign);
    EXPECT_EQ(result(eOpenOrCreate), TagBag::Foreign);
    EXPECT_EQ(result(eOpenNew), TagBag::NewStore);
    ::unlink(folder.path(name).c_str());

    writeSmall();
    ASSERT_EQ(::rename(folder.path(name).c_str(), folder.path("elsewhere").c_str()), 0);
    ASSERT_EQ(::symlink("elsewhere", folder.path(name).c_str()), 0);
    EXPECT_EQ(result(), TagBag::NotOpened);
    EXPECT_NE(bag.openError().find("link"), String::npos);
    ::unlink(folder.path(name).c_str());
    ASSERT_EQ(::mkfifo(folder.path(name).c_str(), 0600), 0);
    EXPECT_EQ(result(), TagBag::NotOpened);
    ::unlink(folder.path(name).c_str());
    ASSERT_EQ(::mkdir(folder.path(name).c_str(), 0700), 0);
    EXPECT_EQ(result(), TagBag::NotOpened);
    EXPECT_NE(bag.openError().find("folder"), String::npos);
    ASSERT_EQ(result(eOpenNew), TagBag::NewStore);
    EXPECT_FALSE(bag.flush());
    ::rmdir(folder.path(name).c_str());

    write("");
    ASSERT_EQ(::truncate(folder.path(name).c_str(), (off_t{1} << 32) + 1), 0);
    EXPECT_EQ(result(), TagBag::NotOpened);
    EXPECT_NE(bag.openError().find("4 GiB"), String::npos);
    EXPECT_EQ(bag.open(cookie(Cookie_Type::Edit, 1 << 30, 0), folder.path(), eOpenExisting, ".qme"),
              TagBag::NotOpened);
    EXPECT_EQ(bag.open(item, folder.path(), eOpenNew, "/../x"), TagBag::NotOpened);
    EXPECT_FALSE(bag.flush()) << "a closed bag writes nothing";
}

} // namespace
