#include "edit/manager/edit_manager_lock.h"
#include "edit/project/permissions_manager.h"
#include "edit/project/projdb.h"
#include "platform/media/tv_standard.h"
#include "platform/services/config_int.h"
#include "platform/services/crash_flag.h"
#include "platform/services/local_service.h"
#include "platform/services/timed_task.h"
#include "support/memory_meter.h"
#include "tests/edit/manager/managed_project.h"
#include "tests/support/child_process.h"
#include "tests/support/faulty_file_system.h"

#include <gtest/gtest.h>

#include <thread>

namespace {

using test::kEdit;
using test::ManagedProject;

const cookie kOther("E0002000");

TEST(Cache, AnOpenThatIsCachedCostsNoFileAndNoMemory) {
    const ManagedProject project;
    ManagedProject::save("a");
    const cookie missing("E0009000");
    test::FaultyFileSystem system;
    EXPECT_FALSE(EditPtr(missing, eOpenExisting).valid());
    EXPECT_EQ(system.count("list"), 0U) << "a long folder is not gone through for each shot that is missing";
    system.reset();
    const uint64_t timed = Qx::TimedTask::named("editman").section("open").calls();
    for (const cookie& item : {kEdit, missing}) {
        const test::MemoryMeter meter;
        const EditPtr edit = edit_manager::openEdit(item, eOpenOrCreate);
        EXPECT_EQ(meter.numAllocations(), 0U);
        EXPECT_EQ(edit.valid(), item == kEdit);
    }
    EXPECT_EQ(system.numOperations(), 0U);
    EXPECT_EQ(Qx::TimedTask::named("editman").section("open").calls(), timed);
    edit_manager::close_all_edits();
    EXPECT_TRUE(EditPtr(kEdit, eOpenExisting).valid());
    EXPECT_EQ(Qx::TimedTask::named("editman").section("open").calls(), timed + 1);
}

TEST(Cache, AnOpenTakesNoticeOfTheOwnerWithoutWritingIt) {
    const ManagedProject project;
    ManagedProject::save("a");
    EXPECT_EQ(PermissionsManager::getOwner(kEdit), "anna");
    ASSERT_TRUE(PermissionsManager::setOwner(kOther, "bert", false));
    const std::string written = project.read("Permissions.txt");
    EXPECT_EQ(written.find("E0001000"), std::string::npos);
    EXPECT_TRUE(EditPtr(kOther, eOpenNew).valid());
    EXPECT_EQ(PermissionsManager::getOwner(kOther), "anna") << "an edit says itself whose it is";
    EXPECT_EQ(project.read("Permissions.txt"), written);
    ASSERT_TRUE(PermissionsManager::setOwner(kOther, "carl", true));
    EXPECT_EQ(PermissionsManager::getOwner(kOther), "anna");
    ASSERT_TRUE(PermissionsManager::setOwner(kOther, "carl", false));
    EXPECT_EQ(PermissionsManager::getOwner(kOther), "carl");
}

TEST(Cache, ThreadsThatOpenOneItemReadItsFileOnce) {
    const ManagedProject project;
    ManagedProject::save("a");
    edit_manager::close_all_edits();
    test::FaultyFileSystem system;
    std::vector<EditPtr> opened(16);
    {
        std::vector<std::thread> threads;
        for (EditPtr& edit : opened) {
            threads.emplace_back([&edit] { edit.open(kEdit, eOpenExisting); });
        }
        for (std::thread& thread : threads) {
            thread.join();
        }
    }
    EXPECT_EQ(system.count("open read E0001000.qme"), 1U);
    for (const EditPtr& edit : opened) {
        EXPECT_TRUE(edit.valid() && edit == opened.front());
    }
}

TEST(Cache, IsLimitedByOneUnreferencedEditAnOpenInTheOrderOfCookies) {
    Qx::setConfigInt("edit_cache_size", 2);
    const ManagedProject project;
    const cookie third("E0003000");
    const cookie fourth("E0004000");
    {
        const EditPtr held(kEdit, eOpenNew);
        ManagedProject::change("two", kOther);
        EXPECT_EQ(edit_manager::numCached(), 2U);
        const EditPtr also(third, eOpenNew);
        EXPECT_FALSE(edit_manager::get_present(kOther)) << "the first that nobody holds";
        EXPECT_TRUE(project.has("E0002000.qme")) << "written first";
        EXPECT_EQ(edit_manager::numDirty(), 0U);
        EXPECT_TRUE(EditPtr(fourth, eOpenNew).valid());
        EXPECT_EQ(edit_manager::numCached(), 3U) << "nobody could go";
    }
    edit_manager::limitEditCache(-1);
    EXPECT_EQ(edit_manager::numCached(), 3U);
    edit_manager::theEditManager()->purge();
    EXPECT_EQ(edit_manager::numCached(), 2U);
    edit_manager::theEditManager()->limitUsage();
    EXPECT_EQ(edit_manager::numCached(), 0U);
    ManagedProject::change("unwritten", kOther);
    test::FaultyFileSystem system;
    system.failWhere("open new", ENOSPC);
    edit_manager::limitEditCache(0);
    EXPECT_TRUE(edit_manager::get_present(kOther)) << "what cannot be written stays";
    system.reset();
    Qx::clearConfigInt("edit_cache_size");
}

TEST(Cache, WhatIsNoItemOpensNothing) {
    {
        const ManagedProject project;
        for (const cookie& item : {black_cookie, invalid_cookie, cookie::fromWords(0, 0, 0)}) {
            EXPECT_FALSE(edit_manager::openEdit(item, eOpenNew).valid());
        }
        EXPECT_FALSE(edit_manager::openEdit(cookie(Cookie_Type::Edit, -1, 0), eOpenNew).valid());
    }
    EXPECT_FALSE(edit_manager::openEdit(kEdit, eOpenNew).valid()) << "without a manager";
}

TEST(Cache, EditsStayWithTheProjectThatTheyWereOpenedIn) {
    const ManagedProject project;
    std::vector<String> heard;
    const auto exit =
        edit_manager::registerNotification(edit_manager::projExitMsgType(), [&](const NotifyMsg& message) {
            heard.push_back("-" + message.text());
        });
    const auto change =
        edit_manager::registerNotification(edit_manager::projChangedMsgType(), [&](const NotifyMsg& message) {
            heard.push_back(message.text());
        });
    ManagedProject::change("in the first");
    // The application goes to another project without a word to the manager.
    Qx::CurrentProject other = Qx::currentProject();
    other.project = cookie("P0002000");
    std::filesystem::create_directory(std::filesystem::path(other.folder()));
    Qx::setCurrentProject(other);
    EXPECT_EQ(ManagedProject::nameOf(), "(null)");
    EXPECT_TRUE(project.has("E0001000.qme"));
    EXPECT_EQ(edit_manager::set_current_project(cookie("P0003000"), eOpenExisting), eStatus::NotFound);
    EXPECT_EQ(edit_manager::set_current_project(cookie("E0003000"), eOpenOrCreate), eStatus::NoProject);
    EXPECT_EQ(edit_manager::get_current_project_cookie(), cookie("P0002000"));
    EXPECT_EQ(edit_manager::set_current_project(cookie("P0001000"), eOpenExisting), eStatus::Ok);
    EXPECT_EQ(ManagedProject::nameOf(), "in the first");
    EXPECT_EQ(edit_manager::set_current_project(cookie("P0003000"), eOpenOrCreate), eStatus::Ok);
    EXPECT_TRUE(edit_manager::projectIsEmpty());
    EXPECT_EQ(edit_manager::new_edit(), kEdit);
    EXPECT_EQ(heard, (std::vector<String>{"-P0001000", "P0002000", "-P0002000", "P0001000", "-P0001000",
                                          "P0003000"}));
    EXPECT_EQ(edit_manager::getProjectSummary(cookie("P0003000")), "P0003000, 25 frames a second, 0 edits");
    EXPECT_EQ(edit_manager::getProjectTvStd(cookie("P0003000")), Qx::Ed2Support::tvStdFromText("pal"));
    // There are no settings in the first; its records know what it was when it was flushed.
    EXPECT_EQ(edit_manager::getProjectSummary(cookie("P0001000")), "");
    String rate;
    EXPECT_TRUE(edit_manager::getProjDBValue("PROJECT_RATE", rate, cookie("P0001000")));
    EXPECT_EQ(edit_manager::getProjectTvStd(cookie("P0001000")), Qx::Ed2Support::tvStdFromText("pal"));
    EXPECT_FALSE(edit_manager::getProjDBValue("PROJECT_RATE", rate, cookie("P0009000")));
    ASSERT_NE(edit_manager::get_current_project(), nullptr);
    EXPECT_EQ(edit_manager::get_current_project()->get_cookie(), cookie("P0003000"));
}

TEST(Closing, WritesEveryEditAndTellsOfThoseThatAreHeld) {
    ManagedProject project;
    const EditPtr held(kEdit, eOpenNew);
    held->setName("held");
    ManagedProject::change("free", kOther);
    edit_manager::close_all_edits();
    EXPECT_TRUE(project.has("E0001000.qme") && project.has("E0002000.qme"));
    EXPECT_TRUE(project.log.contains("edit_manager::close_all_edits(): edit E0001000 has 3 references\n"));
    EXPECT_FALSE(project.log.contains("E0002000 has"));
    EXPECT_EQ(edit_manager::numCached(), 0U);
    EXPECT_EQ(held->refCount(), 1);
}

TEST(Closing, TheLastWordsDependOnACrash) {
    for (const bool crashed : {false, true}) {
        ManagedProject project;
        ManagedProject::change("unsaved");
        bool uiTold = false;
        edit_manager::setUiDeleteFn([&](bool deletes) { uiTold = deletes; });
        ASSERT_NE(edit_manager::get_projdb(), nullptr);
        edit_manager::setConfirmUpdateFn([] { return true; });
        size_t flushes = 0;
        const auto guard = edit_manager::registerNotification(edit_manager::flushChangesMsgType(),
                                                              [&](const NotifyMsg&) { ++flushes; });
        Qx::setCrashFlag(crashed ? 1 : 0);
        project.log.clear();
        edit_exit();
        Qx::setCrashFlag(0);
        const String words = "edit_exit: closing down edit manager\n"
                             "edit_manager::~edit_manager: closing down edit manager\n"
                             "edit_exit: closed down edit manager\n";
        const String report = "edit_manager : Num cached edits  - 1\n"
                              "edit_manager : Last opened edit  - E0001000\n";
        EXPECT_EQ(project.log.log(), (crashed ? report : String()) + words);
        EXPECT_EQ(project.log.standardOutput(), crashed ? report : String());
        EXPECT_EQ(flushes, crashed ? 1U : 0U);
        EXPECT_TRUE(uiTold);
        EXPECT_TRUE(project.has("E0001000.qme"));
        EXPECT_EQ(edit_manager::theEditManager(), nullptr);
    }
}

TEST(Flushing, LetsEditorsFinishFirstAndKeepsWhatCannotBeWrittenForLater) {
    const ManagedProject project;
    const auto guard =
        edit_manager::registerNotification(edit_manager::flushChangesMsgType(), [](const NotifyMsg&) {
            ManagedProject::change("pushed", kOther);
        });
    ManagedProject::change("a");
    {
        test::FaultyFileSystem system;
        system.failWhere("rename", EROFS);
        EXPECT_FALSE(edit_manager::flush_changes());
        EXPECT_EQ(edit_manager::numDirty(), 2U);
    }
    EXPECT_TRUE(edit_manager::flush_changes());
    EXPECT_EQ(edit_manager::numDirty(), 0U);
    EXPECT_TRUE(project.has("E0001000.qme") && project.has("E0002000.qme"));
    String value;
    EXPECT_TRUE(edit_manager::getProjDBValue("PROJECT_NAME", value));
    EXPECT_EQ(value, "Feature");
    EXPECT_TRUE(edit_manager::getProjDBValue("PROJECT_RATE", value));
    EXPECT_EQ(value, "25");
    test::FaultyFileSystem system;
    EXPECT_TRUE(edit_manager::flush_edit(kEdit));
    EXPECT_EQ(system.count("rename"), 0U) << "a clean edit is not written";
}

TEST(Deleting, TakesTheFileWithItsBackupsUnlessTheEditIsInUse) {
    const ManagedProject project;
    std::vector<String> heard;
    const auto guard =
        edit_manager::registerNotification(edit_manager::editDeletedMsgType(), [&](const NotifyMsg& message) {
            heard.push_back(message.text());
            EXPECT_FALSE(edit_manager::getEditFiles(kEdit).empty()) << "told before the files go";
        });
    const auto make = [] {
        ManagedProject::save("a");
        ASSERT_TRUE(edit_manager::backup_edit(kEdit));
        ManagedProject::save("b");
        ASSERT_TRUE(edit_manager::backup_edit(kEdit));
        ManagedProject::save("c");
        ASSERT_TRUE(edit_manager::undoRequest(kEdit));
    };
    make();
    const Vector<String> files = edit_manager::getEditFiles(kEdit);
    ASSERT_EQ(files.size(), 3U);
    {
        test::FaultyFileSystem system;
        system.failWhere("list P0001000", EIO);
        Vector<String> untold{"as it was"};
        EXPECT_EQ(edit_manager::getEditFiles(kEdit, untold).code(), Qx::StatusCode::Refused);
        EXPECT_EQ(untold, Vector<String>{"as it was"});
    }
    EXPECT_TRUE(files[0].ends_with(".qme") && files[1].ends_with(".U1") && files[2].ends_with(".R1"));
    {
        const EditPtr held(kEdit, eOpenExisting);
        EXPECT_FALSE(edit_manager::delete_edit_file_and_backups(kEdit, false));
        EXPECT_TRUE(heard.empty());
        test::FaultyFileSystem system;
        system.failWhere("remove E0001000.qme", EACCES);
        EXPECT_FALSE(edit_manager::delete_edit_file_and_backups(kEdit, true));
    }
    EXPECT_EQ(edit_manager::getEditFiles(kEdit), files);
    heard.clear();
    ASSERT_TRUE(PermissionsManager::setReadOnly(kEdit, true));
    EXPECT_FALSE(edit_manager::deleteEditFilesAndBackups({kEdit}, false));
    ASSERT_TRUE(PermissionsManager::setReadOnly(kEdit, false));
    EXPECT_TRUE(edit_manager::deleteEditFilesAndBackups({kEdit}, false));
    EXPECT_EQ(heard, std::vector<String>{"E0001000"});
    EXPECT_TRUE(edit_manager::getEditFiles(kEdit).empty());
    EXPECT_FALSE(edit_manager::get_present(kEdit));
    EXPECT_FALSE(edit_manager::delete_edit_file_and_backups(kEdit, true)) << "there is none";

    make();
    EditPtr(kEdit, eOpenExisting)->set_hidden(1);
    heard.clear();
    EXPECT_TRUE(edit_manager::delete_edit_file_and_backups(kEdit, false));
    EXPECT_TRUE(heard.empty()) << "nobody is told of a hidden one";
}

TEST(Deleting, OfManyListsTheFolderOnceAndLeavesWhatMustStay) {
    const ManagedProject project;
    const CookieVec items{kEdit, kOther, cookie("E0003000"), cookie("E0004000")};
    for (const cookie& item : items) {
        ManagedProject::save("a", item);
    }
    for (const char* const backup : {"E0001000.qme.U2", "E0001000.qme.U12", "E0004000.qme.R1"}) {
        project.write(backup, "x");
    }
    size_t told = 0;
    {
        /// Another thread makes a backup as soon as the folder was listed.
        struct Listed : test::FaultyFileSystem {
            const ManagedProject* project = nullptr;
            Qx::FileError list(const String& path, std::vector<String>& names) override {
                auto error = FaultyFileSystem::list(path, names);
                project->write("E0004000.qme.U1", "x");
                return error;
            }
        } system;
        system.project = &project;
        const auto guard =
            edit_manager::registerNotification(edit_manager::editDeletedMsgType(), [&](const NotifyMsg&) {
                EXPECT_TRUE(project.has("E0001000.qme")) << "told before the files go";
                ++told;
            });
        const EditPtr held(kOther, eOpenExisting);
        system.failWhere("remove E0003000.qme", EACCES);
        EXPECT_FALSE(edit_manager::deleteEditFilesAndBackups(items, false));
        EXPECT_EQ(system.count("list"), 1U);
        EXPECT_EQ(system.count("sync folder"), 4U) << "each edit goes after its backups";
    }
    EXPECT_EQ(told, 3U);
    for (const cookie& item : items) {
        const bool stays = item == kOther || item == cookie("E0003000");
        EXPECT_EQ(edit_manager::getEditFiles(item).size(), stays ? 1U : 0U) << item.asString();
        EXPECT_EQ(edit_manager::get_present(item), stays);
        projdb::Record record;
        EXPECT_EQ(edit_manager::get_projdb()->find(item, record), stays);
    }
    EXPECT_TRUE(edit_manager::deleteEditFilesAndBackups({kOther, cookie("E0003000")}, false));
}

TEST(Network, SeatsHearWhatTheOthersDo) {
    const auto seat = Qx::Network::LocalService::firstSeat();
    Qx::Network::setService(seat->anotherSeat());
    PermissionsManager::setRight(PermissionsManager::NetworkRight, true);
    {
        const ManagedProject project;
        Qx::Network::setNetworkMode(true);
        std::vector<String> heard;
        const auto listening = seat->listen([&](const Qx::Network::Message& message) {
            heard.push_back(String::format("%d %s", message.kind, message.item.asString().c_str()));
        });
        ManagedProject::save("first");
        const std::string first = project.read("E0001000.qme");
        ManagedProject::save("second");
        EXPECT_EQ(heard, (std::vector<String>{"2 E0001000", "2 E0001000"}));
        // Another seat stores the edit; who has it open gets the stored one.
        project.write("E0001000.qme", first);
        seat->send({Qx::Network::EditWritten, kEdit, "bert"});
        EXPECT_TRUE(edit_manager::get_present(kEdit));
        EXPECT_EQ(ManagedProject::nameOf(), "first");
        // With changes on both sides both are kept.
        ManagedProject::change("ours");
        project.write("E0001000.qme", first + "");
        seat->send({Qx::Network::EditWritten, kEdit, "bert"});
        EXPECT_EQ(ManagedProject::nameOf(), "ours");
        EXPECT_TRUE(edit_manager::flush_changes());
        EXPECT_EQ(project.read("E0001000.qme.U1"), first);
        // Deleting there drops the edit here, unwritten; deleting here is told there.
        ManagedProject::change("dropped");
        std::filesystem::remove(std::filesystem::path(project.folder() + "/E0001000.qme"));
        seat->send({Qx::Network::EditDeleted, kEdit, "bert"});
        EXPECT_FALSE(edit_manager::get_present(kEdit));
        EXPECT_TRUE(edit_manager::flush_changes());
        EXPECT_FALSE(project.has("E0001000.qme"));
        ManagedProject::save("mine", kOther);
        heard.clear();
        EXPECT_TRUE(edit_manager::delete_edit_file_and_backups(kOther, false));
        EXPECT_EQ(heard, std::vector<String>{"3 E0002000"});
    }
    PermissionsManager::setRight(PermissionsManager::NetworkRight, false);
    Qx::Network::setNetworkMode(false);
    Qx::Network::setService(nullptr);
}

TEST(WritersLock, NamesTheProcessThatHasItAndIsSharedWithinOne) {
    const ManagedProject project(false);
    int ready[2];
    ASSERT_EQ(::pipe(ready), 0);
    const pid_t child = ::fork();
    if (child == 0) {
        EditManagerLock lock;
        const bool taken = lock.take().isOk();
        const char answer = taken ? 'y' : 'n';
        static_cast<void>(::write(ready[1], &answer, 1) == 1);
        ::pause();
        ::_exit(0);
    }
    char answer = 0;
    ASSERT_EQ(::read(ready[0], &answer, 1), 1);
    EXPECT_EQ(answer, 'y');
    EditManagerLock lock;
    const Qx::Status refused = lock.take(false);
    EXPECT_FALSE(refused);
    EXPECT_NE(refused.reason().find("process " + std::to_string(child)), std::string::npos)
        << refused.reason();
    ManagedProject::startManager();
    ManagedProject::change("a");
    std::thread ending([child] {
        std::this_thread::sleep_for(std::chrono::milliseconds(50));
        ::kill(child, SIGKILL);
    });
    EXPECT_TRUE(edit_manager::flush_changes()) << "waits for the other process";
    ending.join();
    ::waitpid(child, nullptr, 0);
    ::close(ready[0]);
    ::close(ready[1]);
    ASSERT_TRUE(lock.take(false));
    EditManagerLock inner;
    EXPECT_TRUE(inner.take(false));
    EXPECT_TRUE(ManagedProject::save("b"));
    lock.release();
    EXPECT_FALSE(lock.isHeld());
    EXPECT_TRUE(inner.isHeld());
}

} // namespace
