#include "edit/project/project_details.h"

#include "edit/project/cookie_allocator.h"
#include "platform/services/current_project.h"
#include "support/faulty_file_system.h"
#include "support/temporary_folder.h"

#include <filesystem>
#include <fstream>
#include <gtest/gtest.h>

namespace {

const cookie kProject("P0001000");

ProjectDetails feature() {
    ProjectDetails details;
    details.name = "Night \"train\"\nreel \xC3\xA9";
    details.frameRateCode = 4;
    details.dropFrame = true;
    details.defaultEditMedium = 7;
    return details;
}

TEST(ProjectDetails, MakesAProjectAndReadsItBack) {
    const test::TemporaryFolder folder;
    const String root = folder.path("a/projects");
    ProjectDetails made;
    ASSERT_TRUE(ProjectDetails::openOrCreate(root, kProject, feature(), made));
    EXPECT_EQ(made.folder(), root + "/P0001000");
    ProjectDetails read;
    ASSERT_TRUE(ProjectDetails::openOrCreate(root, kProject, ProjectDetails(), read));
    EXPECT_EQ(read.name, feature().name);
    EXPECT_EQ(read.frameRateCode, 4);
    EXPECT_TRUE(read.dropFrame);
    EXPECT_EQ(read.defaultEditMedium, 7);
    EXPECT_EQ(read.nextEditNumber(), 1);

    const Qx::CurrentProject before = Qx::currentProject();
    read.makeCurrent();
    const Qx::CurrentProject current = Qx::currentProject();
    EXPECT_EQ(current.folder(), read.folder());
    EXPECT_EQ(current.name, read.name);
    EXPECT_EQ(current.frameRateCode, 4);
    EXPECT_TRUE(current.dropFrame);
    EXPECT_EQ(current.defaultEditMedium, 7);
    EXPECT_EQ(current.user, before.user);
    Qx::setCurrentProject(before);
}

TEST(ProjectDetails, SavingNeverSetsTheCountBack) {
    const test::TemporaryFolder folder;
    ProjectDetails details;
    ASSERT_TRUE(ProjectDetails::openOrCreate(folder.path(), kProject, feature(), details));
    std::vector<cookie> edits;
    ASSERT_TRUE(CookieAllocator(details.folder()).allocate(9, edits));
    EXPECT_EQ(details.nextEditNumber(), 1);
    details.name = "renamed";
    ASSERT_TRUE(details.save());
    EXPECT_EQ(details.nextEditNumber(), 10);
    ASSERT_TRUE(CookieAllocator(details.folder()).allocate(1, edits));
    EXPECT_EQ(edits.back(), cookie(Cookie_Type::Edit, 10, 0));
    ProjectDetails read;
    ASSERT_TRUE(ProjectDetails::openOrCreate(folder.path(), kProject, ProjectDetails(), read));
    EXPECT_EQ(read.name, "renamed");
    // Settings that are made anew do not know where the count was.
    folder.write("P0001000/E000C000.qme.U1", "");
    std::filesystem::remove(folder.path("P0001000/Project.txt").c_str());
    ASSERT_TRUE(ProjectDetails::openOrCreate(folder.path(), kProject, feature(), read));
    ASSERT_TRUE(CookieAllocator(details.folder()).allocate(1, edits));
    EXPECT_EQ(edits.back(), cookie(Cookie_Type::Edit, 13, 0));
}

TEST(ProjectDetails, KeepsWhatItDoesNotKnow) {
    const test::TemporaryFolder folder;
    ASSERT_TRUE(std::filesystem::create_directory(folder.path("P0001000").c_str()));
    folder.write("P0001000/Project.txt",
                 "PROJECT\nPROJECT_NAME:string Old\nCOLOUR:lookup film 3\nEND_PROJECT\n");
    ProjectDetails details;
    ASSERT_TRUE(ProjectDetails::openOrCreate(folder.path(), kProject, feature(), details));
    EXPECT_EQ(details.name, "Old");
    EXPECT_EQ(details.frameRateCode, 4) << "what the file lacks";
    ASSERT_TRUE(details.save());
    EXPECT_NE(folder.read("P0001000/Project.txt").find("COLOUR:lookup film 3\n"), std::string::npos);
}

TEST(ProjectDetails, RefusesWhatIsOutOfRangeAndLeavesAllAsItWas) {
    const test::TemporaryFolder folder;
    ProjectDetails out;
    out.name = "untouched";
    ProjectDetails noRate = feature();
    noRate.frameRateCode = 99;
    ProjectDetails noDrop = feature();
    noDrop.frameRateCode = 3;
    ProjectDetails noText = feature();
    noText.name = "\xff";
    for (const ProjectDetails& bad : {noRate, noDrop, noText}) {
        EXPECT_FALSE(ProjectDetails::openOrCreate(folder.path(), kProject, bad, out));
    }
    for (const cookie& item : {invalid_cookie, cookie("E0001000"), cookie(Cookie_Type::Project, -1, 0)}) {
        EXPECT_FALSE(ProjectDetails::openOrCreate(folder.path(), item, feature(), out)) << item.asString();
    }
    EXPECT_FALSE(ProjectDetails::openOrCreate("", kProject, feature(), out));
    EXPECT_FALSE(ProjectDetails().save());
    EXPECT_EQ(out.name, "untouched");
    EXPECT_EQ(folder.numNames(), 0u);
}

TEST(ProjectDetails, ADamagedFileIsNamedAndLeftAlone) {
    const test::TemporaryFolder folder;
    std::filesystem::create_directory(folder.path("P0001000").c_str());
    ProjectDetails out;
    for (const char* text :
         {"", "PROJECT\nPROJECT_RATE:int x\nEND_PROJECT\n", "PROJECT\nPROJECT_RATE:int 99\nEND_PROJECT\n",
          "PROJECT\nPROJECT_NAME:string a\n", "OTHER\nEND_OTHER\n"}) {
        folder.write("P0001000/Project.txt", text);
        const auto status = ProjectDetails::openOrCreate(folder.path(), kProject, feature(), out);
        ASSERT_FALSE(status) << text;
        EXPECT_NE(status.reason().find("Project.txt"), String::npos) << status.reason();
        EXPECT_EQ(folder.read("P0001000/Project.txt"), text);
    }
}

} // namespace
