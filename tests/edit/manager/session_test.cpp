#include "edit/manager/session.h"
#include "platform/services/current_project.h"
#include "tests/support/faulty_file_system.h"
#include "tests/support/recording_log.h"
#include "tests/support/temporary_folder.h"

#include <filesystem>
#include <gtest/gtest.h>

namespace {

using Code = Qx::StatusCode;

/// A folder of projects, and no project current.
class SessionTest : public testing::Test {
protected:
    ~SessionTest() override { Qx::setCurrentProject({}); }

    test::RecordingLog log;
    test::TemporaryFolder root;
};

TEST_F(SessionTest, FindsTheProjectThatAFolderMeans) {
    const struct {
        std::vector<const char*> there; ///< folders with settings in them
        const char* given;              ///< behind the root
        const char* project;
    } cases[] = {
        {{}, "", "P0001000"},
        {{"P0007000"}, "", "P0007000"},
        {{"P0007000"}, "//", "P0007000"},
        {{"P0007000", "P0008000"}, "", "P0001000"},
        {{"P0001000", "P0007000"}, "", "P0001000"},
        {{"P0001000", "P0007000"}, "/P0007000", "P0007000"},
        {{"Rushes"}, "", "P0001000"},
    };
    for (const auto& [there, given, project] : cases) {
        const test::TemporaryFolder folder;
        for (const std::string name : there) {
            std::filesystem::create_directory(folder.path(name).c_str());
            folder.write(name + "/Project.txt", "PROJECT\nEND_PROJECT\n");
        }
        const Session session(folder.path() + given);
        EXPECT_EQ(session.project(), cookie(project)) << there.size() << " " << given;
        EXPECT_EQ(session.folder(), folder.path(project));
    }
}

TEST_F(SessionTest, AnswersOfWhatKindItsRefusalsAre) {
    SessionOptions options;
    const auto opens = [&](eEditOpenBehaviour behaviour, Session& session) {
        options.behaviour = behaviour;
        return session.open(options).code();
    };
    Session session(root.path("films"));
    EXPECT_EQ(opens(eOpenExisting, session), Code::NotFound);
    EXPECT_FALSE(std::filesystem::exists(root.path("films").c_str()));
    options.user = "ben";
    options.forNew.frameRateCode = 99;
    EXPECT_EQ(opens(eOpenOrCreate, session), Code::BadArgument);
    EXPECT_FALSE(session.isOpen());
    options.forNew.frameRateCode = 3;
    EXPECT_EQ(opens(eOpenNew, session), Code::Ok);
    EXPECT_EQ(Qx::currentProject().user, "ben");
    EXPECT_EQ(Qx::currentProject().name, "films");
    EXPECT_TRUE(session.close());

    EXPECT_EQ(opens(eOpenNew, session), Code::BadArgument);
    root.write("films/P0001000/Project.txt", "PROJECT\nPROJECT_RATE:int 99\nEND_PROJECT\n");
    EXPECT_EQ(opens(eOpenExisting, session), Code::Damaged);
    EXPECT_FALSE(session.isOpen());
}

TEST_F(SessionTest, AProjectThatCouldNotBeLookedForIsNotMade) {
    for (const char* const question : {"list", "info P0001000"}) {
        test::FaultyFileSystem disk;
        disk.failWhere(question, EIO);
        Session session(root.path());
        disk.reset();
        SessionOptions options;
        options.behaviour = eOpenOrCreate;
        EXPECT_EQ(session.open(options).code(), Code::Refused) << question;
        EXPECT_EQ(root.numNames(), 0U);
    }
}

TEST_F(SessionTest, StaysOpenWithTheChangesWhileTheyCannotBeWritten) {
    Session session(root.path());
    ASSERT_TRUE(session.open());
    int heard = 0;
    session.listen(edit_manager::flushChangesMsgType(), [&heard](const NotifyMsg&) { ++heard; });
    EditPtr edit(edit_manager::new_edit(), eOpenOrCreate);
    ASSERT_TRUE(edit.valid());
    const cookie item = edit->get_cookie();
    session.follow(edit, [&heard](const EditModification&) { heard += 100; });
    edit->setName("Kept");
    EXPECT_EQ(heard, 100);
    edit.invalidate();
    {
        test::FaultyFileSystem disk;
        disk.failWhere("open new", ENOSPC);
        Vector<UnwrittenEdit> unwritten;
        const Qx::Status closed = session.close(unwritten);
        EXPECT_EQ(closed.code(), Code::Full) << closed.reason();
        EXPECT_EQ(closed.systemError(), ENOSPC);
        ASSERT_EQ(unwritten.size(), 1u);
        EXPECT_EQ(unwritten[0].item, item);
        EXPECT_TRUE(session.isOpen());
        EXPECT_EQ(edit_manager::numDirty(), 1u);
    }
    EXPECT_TRUE(session.close());
    EXPECT_FALSE(session.isOpen());
    const int before = heard;
    EXPECT_FALSE(edit_manager::openEdit(item, eOpenExisting).valid()) << "the project is closed";

    Session again(root.path());
    ASSERT_TRUE(again.open());
    EXPECT_EQ(heard, before) << "nothing is heard after the end";
    edit = edit_manager::openEdit(item, eOpenExisting);
    ASSERT_TRUE(edit.valid());
    EXPECT_EQ(edit->getName(), "Kept");
    edit->setName("Lost");
    edit.invalidate();
    test::FaultyFileSystem disk;
    disk.failWhere("open new", EACCES);
    Vector<UnwrittenEdit> lost;
    again.closeAnyway(lost);
    EXPECT_FALSE(again.isOpen());
    ASSERT_EQ(lost.size(), 1u);
    EXPECT_EQ(lost[0].why.code(), Code::Refused);
    EXPECT_TRUE(log.contains("was closed with changes that could not be written"));
}

} // namespace
