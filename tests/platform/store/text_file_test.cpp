#include "platform/services/files.h"
#include "platform/store/text_file.h"
#include "support/temporary_folder.h"

#include <gtest/gtest.h>

namespace {

TEST(TextFile, TakesEveryLineEnd) {
    const struct {
        std::string_view text;
        std::vector<String> lines;
    } cases[] = {
        {"", {}},
        {"a", {"a"}},
        {"a\n", {"a"}},
        {"\n", {""}},
        {"a\nb\r\nc\rd", {"a", "b", "c", "d"}},
        {"a\r\n\r\nb\n\n", {"a", "", "b", ""}},
        {"a\n\rb", {"a", "", "b"}},
        {"\xEF\xBB\xBFmarked\n", {"marked"}},
        {"\xEF\xBB\xBF", {}},
        {" blanks \t\n", {" blanks \t"}},
        {std::string_view("z\0z\n", 4), {String(std::string_view("z\0z", 3))}},
    };
    for (const auto& each : cases) {
        TextFile file;
        file.setText(each.text);
        ASSERT_EQ(file.numLines(), each.lines.size()) << each.text;
        for (unsigned i = 0; i < file.numLines(); ++i) {
            EXPECT_EQ(file[i], each.lines[i]) << each.text;
        }
    }
}

TEST(TextFile, SavesAndLoadsWhole) {
    const test::TemporaryFolder folder;
    TextFile file;
    file.setText("one\r\ntwo");
    ASSERT_TRUE(file.save(folder.path("a.txt")));
    String saved;
    ASSERT_FALSE(Qx::readWholeFile(folder.path("a.txt"), saved, 100));
    EXPECT_EQ(saved, "one\ntwo\n");
    TextFile read;
    read.setText("before");
    EXPECT_FALSE(read.load(folder.path("a.txt"), 7));
    const Qx::Status missing = read.load(folder.path("none.txt"));
    EXPECT_NE(missing.reason().find("none.txt"), String::npos);
    EXPECT_EQ(read.text(), "before\n");
    ASSERT_TRUE(read.load(folder.path("a.txt")));
    EXPECT_EQ(read.text(), "one\ntwo\n");
    EXPECT_EQ(read.path(), folder.path("a.txt"));
    folder.write("lines.txt", std::string((size_t{1} << 24) + 1, '\n'));
    EXPECT_FALSE(read.load(folder.path("lines.txt"))) << "a flood of lines takes no memory";
    EXPECT_FALSE(file.save(folder.path("no folder/a.txt")));
}

} // namespace
