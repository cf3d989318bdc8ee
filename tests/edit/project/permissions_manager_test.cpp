#include "edit/project/permissions_manager.h"

#include "platform/services/current_project.h"
#include "support/child_process.h"
#include "support/faulty_file_system.h"
#include "support/recording_log.h"
#include "support/temporary_folder.h"

#include <filesystem>
#include <gtest/gtest.h>

namespace {

const cookie kEdit("E0001000");
const cookie kOther("E0002000");

/// A current project in a folder of its own.
class PermissionsManagerTest : public testing::Test {
protected:
    void SetUp() override {
        m_before = Qx::currentProject();
        for (const char* name : {"P0001000", "P0002000"}) {
            std::filesystem::create_directory(folder.path(name).c_str());
        }
        open("P0001000");
    }
    void TearDown() override {
        Qx::setCurrentProject(m_before);
        PermissionsManager::reload();
    }
    void open(const char* project) {
        Qx::CurrentProject current = m_before;
        current.rootFolder = folder.path();
        current.project = cookie(project);
        current.user = "anna";
        Qx::setCurrentProject(current);
    }

    test::TemporaryFolder folder;

private:
    Qx::CurrentProject m_before;
};

TEST_F(PermissionsManagerTest, RecordsOutliveTheMemory) {
    EXPECT_EQ(PermissionsManager::getOwner(kEdit), "");
    EXPECT_FALSE(PermissionsManager::getReadOnly(kEdit));
    ASSERT_TRUE(PermissionsManager::setOwner(kEdit, "Ben \xC3\xA9:\n", false));
    ASSERT_TRUE(PermissionsManager::setReadOnly(kOther, true));
    PermissionsManager::reload();
    EXPECT_EQ(PermissionsManager::getOwner(kEdit), "Ben \xC3\xA9:\n");
    EXPECT_FALSE(PermissionsManager::getReadOnly(kEdit));
    EXPECT_TRUE(PermissionsManager::getReadOnly(kOther));
    ASSERT_TRUE(PermissionsManager::setReadOnly(kOther, false));
    PermissionsManager::reload();
    EXPECT_FALSE(PermissionsManager::getReadOnly(kOther));
}

TEST_F(PermissionsManagerTest, AnotherSeatsRecordsStay) {
    ASSERT_TRUE(PermissionsManager::setOwner(kEdit, "anna", false));
    ASSERT_EQ(test::runInChild([] { return bool(PermissionsManager::setOwner(kOther, "ben", false)); }),
              test::ChildEnd::Succeeded);
    ASSERT_TRUE(PermissionsManager::setReadOnly(kEdit, true));
    {
        test::FaultyFileSystem disk;
        ASSERT_TRUE(PermissionsManager::setOwner(kEdit, "cleo", false));
        EXPECT_EQ(disk.count("read Permissions.txt"), 0u) << "nobody has replaced the file since";
        EXPECT_EQ(disk.count("rename"), 1u);
    }
    PermissionsManager::reload();
    EXPECT_EQ(PermissionsManager::getOwner(kOther), "ben");
    EXPECT_TRUE(PermissionsManager::getReadOnly(kEdit));
}

TEST_F(PermissionsManagerTest, AFailureChangesNothing) {
    ASSERT_TRUE(PermissionsManager::setOwner(kEdit, "anna", false));
    const std::string before = folder.read("P0001000/Permissions.txt");
    test::FaultyFileSystem disk;
    disk.failWhere("write *.tmp", ENOSPC);
    EXPECT_FALSE(PermissionsManager::setOwner(kEdit, "ben", false));
    EXPECT_FALSE(PermissionsManager::setReadOnly(kEdit, true));
    EXPECT_EQ(PermissionsManager::getOwner(kEdit), "anna");
    EXPECT_FALSE(PermissionsManager::getReadOnly(kEdit));
    EXPECT_EQ(folder.read("P0001000/Permissions.txt"), before);
    EXPECT_FALSE(PermissionsManager::setOwner(invalid_cookie, "anna", false));
    EXPECT_FALSE(PermissionsManager::setOwner(kEdit, "\xff", false));
}

TEST_F(PermissionsManagerTest, ADamagedFileIsReportedAndNeverWrittenOver) {
    folder.write("P0001000/Permissions.txt", "PERMISSIONS\nREAD_ONLY_E0001000:bool perhaps\n");
    PermissionsManager::reload();
    const test::RecordingLog log;
    EXPECT_FALSE(PermissionsManager::getReadOnly(kEdit));
    EXPECT_EQ(PermissionsManager::getOwner(kEdit), "");
    EXPECT_TRUE(log.contains("Permissions.txt")) << log.log();
    EXPECT_EQ(log.log().split('\n', true).size(), 1u) << "said once";
    EXPECT_FALSE(PermissionsManager::setReadOnly(kEdit, true));
    EXPECT_NE(folder.read("P0001000/Permissions.txt").find("perhaps"), std::string::npos);
}

TEST_F(PermissionsManagerTest, WhatIsNeverStoredLivesInMemory) {
    const cookie transient(Cookie_Type::Transient, 1, 0);
    const cookie beyond(Cookie_Type::Edit, -1, -1);
    for (const cookie& item : {transient, beyond}) {
        ASSERT_TRUE(PermissionsManager::setOwner(item, "anna", true));
        EXPECT_EQ(PermissionsManager::getOwner(item), "anna");
    }
    EXPECT_EQ(folder.read("P0001000/Permissions.txt"), "(missing)");
    Qx::CurrentProject none = Qx::currentProject();
    none.rootFolder = "";
    Qx::setCurrentProject(none);
    ASSERT_TRUE(PermissionsManager::setReadOnly(kEdit, true));
    EXPECT_TRUE(PermissionsManager::getReadOnly(kEdit));
}

TEST_F(PermissionsManagerTest, EachProjectHasItsOwnRecords) {
    ASSERT_TRUE(PermissionsManager::setReadOnly(kEdit, true));
    open("P0002000");
    EXPECT_FALSE(PermissionsManager::getReadOnly(kEdit));
    open("P0001000");
    EXPECT_TRUE(PermissionsManager::getReadOnly(kEdit));
}

} // namespace
