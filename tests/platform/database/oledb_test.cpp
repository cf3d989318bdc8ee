// Promises of the table of records, on real files.

#include "platform/database/oledb.h"

#include "support/temporary_folder.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <thread>

namespace {

using Fields = std::vector<String>;

const Fields kColumns{"Type", "start time", "name"};

class Oledb : public testing::Test {
protected:
    [[nodiscard]] String path() const { return folder.path() + "/table.db"; }
    test::TemporaryFolder folder;
};

TEST_F(Oledb, KeepsRecordsAndValuesBetweenOpenings) {
    const String awkward("a'\"\n\0;--", 8);
    {
        oledb table;
        ASSERT_EQ(table.open(path(), kColumns), oledb::Made);
        ASSERT_TRUE(table.putRecord("E0002000", {"edit", "", "second"}));
        ASSERT_TRUE(table.putRecord("E0001000", {"shot", "10:00:00:00", awkward}));
        ASSERT_TRUE(table.putRecord("E0002000", {"edit", "00:00:00:00", "second again"}));
        ASSERT_TRUE(table.setValue("PROJECT_NAME", "Ünïcode"));
    }
    oledb table;
    ASSERT_EQ(table.open(path(), kColumns), oledb::Opened) << table.lastError();
    EXPECT_EQ(table.numRecords(), 2u);
    Fields fields;
    ASSERT_TRUE(table.findRecord("E0001000", fields));
    EXPECT_EQ(fields, (Fields{"shot", "10:00:00:00", awkward}));
    String value = "left alone";
    EXPECT_TRUE(table.getField("E0002000", table.columnIndex("NAME"), value));
    EXPECT_EQ(value, "second again");
    EXPECT_TRUE(table.getValue("PROJECT_NAME", value));
    EXPECT_EQ(value, "Ünïcode");
    Fields keys;
    table.forEachRecord([&](const String& key, const Fields&) {
        keys.push_back(key);
        return true;
    });
    EXPECT_EQ(keys, (Fields{"E0001000", "E0002000"}));
}

TEST_F(Oledb, AnswersFalseAndChangesNothingForWhatIsNotThere) {
    oledb table;
    Fields fields{"left"};
    String field = "left";
    EXPECT_FALSE(table.findRecord("E0001000", fields));
    EXPECT_FALSE(table.putRecord("E0001000", {"a", "b", "c"}));
    ASSERT_EQ(table.open(path(), kColumns), oledb::Made);
    EXPECT_FALSE(table.findRecord("E0001000", fields));
    EXPECT_FALSE(table.getField("E0001000", 0, field));
    EXPECT_FALSE(table.getValue("none", field));
    EXPECT_FALSE(table.putRecord("E0001000", {"too", "few"}));
    EXPECT_TRUE(table.removeRecord("E0001000"));
    EXPECT_EQ(table.columnIndex("none"), -1);
    EXPECT_EQ(table.numRecords(), 0u);
    EXPECT_EQ(fields, Fields{"left"});
    EXPECT_EQ(field, "left");
}

TEST_F(Oledb, DropsATransactionThatWasNotCommitted) {
    oledb table;
    ASSERT_EQ(table.open(path(), kColumns), oledb::Made);
    {
        oledb::Transaction dropped(table);
        ASSERT_TRUE(table.putRecord("E0001000", {"a", "b", "c"}));
    }
    EXPECT_EQ(table.numRecords(), 0u);
    {
        oledb::Transaction kept(table);
        ASSERT_TRUE(table.putRecord("E0001000", {"a", "b", "c"}));
        ASSERT_TRUE(kept.commit());
    }
    EXPECT_EQ(table.numRecords(), 1u);
}

TEST_F(Oledb, SaysWhatIsWrongWithAFile) {
    std::filesystem::create_directory(std::string(path()) + ".folder");
    std::ofstream(std::string(path()) + ".text") << std::string(5000, 'x');
    oledb other;
    ASSERT_EQ(other.open(path() + ".other", {"one"}), oledb::Made);
    other.close();
    std::filesystem::create_symlink(std::string(path()) + ".other", std::string(path()) + ".link");

    oledb table;
    EXPECT_EQ(table.open(path() + ".folder", kColumns), oledb::NotOpened);
    EXPECT_EQ(table.open(path() + ".text", kColumns), oledb::Damaged);
    EXPECT_EQ(table.open(path() + ".other", kColumns), oledb::Damaged);
    EXPECT_EQ(table.open(path() + ".link", {"one"}), oledb::NotOpened);
    EXPECT_EQ(table.open(folder.path() + "/no/such/folder.db", kColumns), oledb::NotOpened);
    EXPECT_FALSE(table.isOpen());
    EXPECT_NE(table.lastError().find("/no/such/folder.db"), String::npos) << table.lastError();
}

TEST_F(Oledb, FindsDamageInsideTheFile) {
    {
        oledb table;
        ASSERT_EQ(table.open(path(), kColumns), oledb::Made);
        oledb::Transaction all(table);
        for (int i = 0; i < 2000; ++i) {
            ASSERT_TRUE(
                table.putRecord(String::format("E%04d000", i), {"edit", "", "a name of some length"}));
        }
        ASSERT_TRUE(all.commit());
    }
    std::fstream file(std::string(path()), std::ios::in | std::ios::out | std::ios::binary);
    file.seekp(8192);
    file << std::string(20000, '\xA5');
    file.close();
    oledb table;
    EXPECT_EQ(table.open(path(), kColumns), oledb::Damaged);
}

TEST_F(Oledb, SharesOneFileBetweenConnectionsAndThreads) {
    oledb first;
    oledb second;
    ASSERT_EQ(first.open(path(), kColumns), oledb::Made);
    ASSERT_EQ(second.open(path(), kColumns), oledb::Opened);
    const auto write = [](oledb& table, char letter) {
        for (int i = 0; i < 50; ++i) {
            EXPECT_TRUE(table.putRecord(String::format("%c%d", letter, i), {"a", "b", "c"}));
        }
    };
    std::thread a(write, std::ref(first), 'A');
    std::thread b(write, std::ref(second), 'B');
    std::thread c(write, std::ref(second), 'C');
    a.join();
    b.join();
    c.join();
    EXPECT_EQ(first.numRecords(), 150u);
    // What others change is noticed, what one changes oneself is not.
    const int64_t before = first.versionOfOthers();
    ASSERT_TRUE(first.putRecord("own", {"a", "b", "c"}));
    EXPECT_EQ(first.versionOfOthers(), before);
    ASSERT_TRUE(second.removeRecord("own"));
    EXPECT_NE(first.versionOfOthers(), before);
    EXPECT_EQ(second.numRecords(), 150u);
}

} // namespace
