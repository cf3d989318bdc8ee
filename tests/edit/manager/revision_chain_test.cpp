#include "edit/manager/revision_chain.h"

#include "tests/support/faulty_file_system.h"
#include "tests/support/temporary_folder.h"

#include <gtest/gtest.h>

namespace {

/// A chain drawn as text: the edit file's letter, then a letter a backup, '-' for none: "E:ab-d".
class ChainFiles {
public:
    explicit ChainFiles(int depth) : m_chain(file(), RevisionChain::Undo, depth) {}

    void draw(const std::string& drawing) {
        place(file(), drawing[0]);
        for (size_t i = 2; i < drawing.size(); ++i) {
            place(m_chain.path(static_cast<int>(i) - 1), drawing[i]);
        }
    }
    [[nodiscard]] std::string drawn(int upTo) const {
        std::string drawing = letter("E0001000.qme") + ":";
        for (int i = 1; i <= upTo; ++i) {
            drawing += letter("E0001000.qme.U" + std::to_string(i));
        }
        return drawing;
    }
    [[nodiscard]] RevisionChain& chain() { return m_chain; }
    [[nodiscard]] String file() const { return m_folder.path("E0001000.qme"); }
    [[nodiscard]] const test::TemporaryFolder& folder() const { return m_folder; }

private:
    static void place(const String& path, char letter) {
        if (letter != '-') {
            std::ofstream(path.c_str()) << letter;
        }
    }
    [[nodiscard]] std::string letter(const std::string& name) const {
        const std::string bytes = m_folder.read(name);
        return bytes == "(missing)" ? "-" : bytes;
    }

    test::TemporaryFolder m_folder;
    RevisionChain m_chain;
};

TEST(RevisionChain, MovesWholeFilesAndPassesOverHoles) {
    enum Action { Push, Restore, Delete0, Delete1, Close };
    const struct {
        int depth;
        const char* before;
        Action action;
        const char* after;
        int answer;
    } cases[] = {
        {4, "E:----", Push, "-:E---", 1},     {4, "E:abcd", Push, "-:Eabc", 1},
        {4, "E:ab--", Push, "-:Eab-", 1},     {1, "E:a", Push, "-:E", 1},
        {4, "-:abcd", Push, "-:abcd", 0},     {4, "E:-bcd", Push, "-:E-bc", 1},
        {4, "E:ab-d", Push, "-:Eab-", 1},     {4, "-:abcd", Restore, "a:bcd-", 1},
        {4, "-:-bc-", Restore, "b:c---", 2},  {4, "-:--cd", Restore, "c:d---", 3},
        {4, "E:a-c-", Restore, "E:a-c-", -1}, {4, "E:----", Restore, "E:----", 0},
        {1, "-:a", Restore, "a:-", 1},        {2, "-:--c", Restore, "-:--c", 0},
        {4, "E:abcd", Delete0, "E:----", 1},  {4, "E:abcd", Delete1, "E:a---", 1},
        {4, "E:a-c-", Delete0, "E:--c-", 1},  {2, "E:abc", Delete0, "E:--c", 1},
        {2, "E:abc", Push, "-:Eac", 1},       {4, "-:a-c-", Restore, "a:-c--", 1},
        {4, "E:-b-d", Close, "E:bd--", 1},    {4, "E:abc-", Close, "E:abc-", 1},
    };
    for (const auto& [depth, before, action, after, answer] : cases) {
        SCOPED_TRACE(testing::Message() << before << " depth " << depth << " action " << action);
        ChainFiles files(depth);
        files.draw(before);
        RevisionChain& chain = files.chain();
        int restored = 0;
        const int got = action == Push      ? static_cast<int>(chain.push().isOk())
                        : action == Restore ? chain.restoreNewest(restored) ? restored : -1
                        : action == Close   ? static_cast<int>(chain.closeHoles().isOk())
                                            : static_cast<int>(chain.deleteTail(action == Delete1).isOk());
        EXPECT_EQ(got, answer);
        EXPECT_EQ(files.drawn(static_cast<int>(std::string(before).size()) - 2), after);
    }
}

TEST(RevisionChain, NamesOnlyItsOwnFiles) {
    EXPECT_EQ(getUndoExtension(3), "U3");
    EXPECT_EQ(getRedoExtension(12), "R12");
    EXPECT_EQ(getUndoExtension(-1), "U*");
    ChainFiles files(3);
    for (const char* const other :
         {"E0001000.qme.U01", "E0001000.qme.U+1", "E0001000.qme.U0", "E0001000.qme.U", "E0001000.qme.R1",
          "E0001000.qme.U2x", "E0002000.qme.U1"}) {
        files.folder().write(other, "x");
    }
    bool exists = true;
    EXPECT_TRUE(files.chain().exists(exists) && !exists);
    files.folder().write("E0001000.qme.U4", "x");
    EXPECT_TRUE(files.chain().exists(exists) && exists) << "behind the depth";
    int newest = -1;
    EXPECT_TRUE(files.chain().findNewest(newest) && newest == 0);
    EXPECT_EQ(files.chain().numbers(), std::vector<int>{4});
    files.folder().write("E0001000.qme.U2", "x");
    files.folder().write("E0001000.qme", "x");
    RevisionChain deep(files.file(), RevisionChain::Undo, 1'000'000);
    test::FaultyFileSystem system;
    int restored = 0;
    EXPECT_TRUE(deep.exists(exists) && exists && deep.push() && deep.restoreNewest(restored));
    EXPECT_EQ(system.count("list"), 0U) << "a folder may hold very many files";
    EXPECT_LT(system.numOperations(), 400U) << "nor does the depth cost anything";
}

} // namespace
