#include "edit/manager/edit_info.h"
#include "edit/manager/edit_record.h"
#include "edit/manager/edit_search.h"
#include "edit/material/log_attributes.h"
#include "edit/model/cel.h"
#include "edit/project/projdb.h"
#include "tests/edit/manager/managed_project.h"
#include "tests/support/faulty_file_system.h"
#include "tests/support/tree_snapshot.h"

#include <fstream>
#include <gtest/gtest.h>

namespace {

using test::kEdit;
using test::ManagedProject;

const cookie kOther("E0002000");

/// A channel with one clip of ten seconds and twelve frames.
void addClip(const EditPtr& edit, Edit_Chan_Type type, Edit_Chan_SubType subtype = Edit_Chan_SubType::NONE) {
    cel* const content = edit->get_edit_cel_p(edit->addChan(type, nullptr, true, subtype));
    content->appendEventPair(cookie("M0001000"), 0, 2, 10.48);
}

/// Makes an edit with so many audio and effects channels beside its video channel, and writes it.
void makeEdit(const cookie& item, int audio, int effects) {
    const EditPtr edit(item, eOpenNew);
    for (int i = 0; i < audio; ++i) {
        addClip(edit, AudioChan);
    }
    for (int i = 0; i < effects; ++i) {
        addClip(edit, VideoChan, Edit_Chan_SubType::ALIAS);
    }
    edit->setName("named");
    ASSERT_TRUE(edit_manager::flush_edit(item));
}

TEST(EditInfo, GivesTheSameAnswersOpenOrNot) {
    const struct {
        int audio;
        int effects;
        const char* chans;
    } cases[] = {{0, 0, "V1"}, {1, 1, "V1a1f1"}, {2, 1, "V1A2f1"}, {4, 2, "V1A4F2"}};
    for (const auto& [audio, effects, chans] : cases) {
        SCOPED_TRACE(chans);
        const ManagedProject project;
        makeEdit(kEdit, audio, effects);
        EditPtr(kEdit, eOpenExisting)->set_hidden(audio);
        ASSERT_TRUE(edit_manager::flush_edit(kEdit));
        EditPtr open(kEdit, eOpenExisting);
        const EditInfo opened(open);
        String answers[2];
        for (const bool isOpen : {true, false}) {
            if (!isOpen) {
                open.invalidate();
                edit_manager::close_all_edits();
            }
            const EditInfo info = isOpen ? opened : EditInfo(kEdit, eOpenExisting);
            answers[isOpen ? 1 : 0] =
                String::format("%d %d %d %d %d %d %.2f %.2f %.2f", info.hasAudioTracks(), info.hasFxTracks(),
                               info.isHidden(), info.isSoundOnlyShot(), info.getFlags(), info.getLogType(),
                               info.getStartTime(), info.getEndTime(), info.getDuration());
            EXPECT_EQ(info.getAttrib("CHANS"), chans);
            EXPECT_EQ(info.getAttribW("name"), L"named");
            EXPECT_EQ(info.getAttrib("no such"), "");
            if (!isOpen) {
                EXPECT_FALSE(edit_manager::get_present(kEdit)) << "answered without opening";
                EXPECT_EQ(info.m_get_event_count(-2), -1);
                EXPECT_FALSE(edit_manager::get_present(kEdit));
                EXPECT_EQ(info.m_get_num_chans(), 1 + audio + effects);
                EXPECT_TRUE(edit_manager::get_present(kEdit));
                EXPECT_EQ(info.m_get_event_count(0), effects == 0 ? 0 : 2);
                EXPECT_EQ(info.m_get_channel_type(0), VideoChan);
                EXPECT_EQ(info.m_get_real_channel(17), 17);
            }
        }
        EXPECT_EQ(answers[0], answers[1]);
    }
}

TEST(EditInfo, ReadsTheKindOfItemFromItsRow) {
    const struct {
        const char* type;
        const char* flags;
        edit_log_type_t expected;
    } cases[] = {{"ghost", "1536", kLogGhost4}, {"ghost", "3072", kLogGhost3}, {"ghost", "2176", kLogGhost5},
                 {"ghost", "128", kLogGhost6},  {"ghost", "8", kLogNone},      {"ghost", "", kLogNone},
                 {"shot", "1536", kLogShot},    {"FXT", "0", kLogTemplate},    {"", "x", kLogNone}};
    const ManagedProject project;
    for (const auto& [type, flags, expected] : cases) {
        projdb::Record record;
        record[projdb::Type] = type;
        record[projdb::Flags] = flags;
        record[projdb::Chans] = "A2";
        record[projdb::StartTime] = "00:00:01:05";
        record[projdb::EndTime] = "00:01:00:00";
        ASSERT_TRUE(edit_manager::get_projdb()->put(kEdit, record));
        const EditInfo info(kEdit, eOpenExisting);
        EXPECT_EQ(info.getLogType(), expected) << type << " " << flags;
        EXPECT_TRUE(info.hasAudioTracks() && info.isSoundOnlyShot() && !info.hasFxTracks());
        EXPECT_EQ(info.isHidden(), String(flags) == "8");
        EXPECT_DOUBLE_EQ(info.getStartTime(), 1.2);
        EXPECT_DOUBLE_EQ(info.getDuration(), 58.8);
    }
}

TEST(EditInfo, TimesGoOnBeyondADay) {
    const ManagedProject project;
    for (const double length : {86399.96, 86400.0, 90061.04, 1e8}) {
        SCOPED_TRACE(length);
        {
            const EditPtr edit(kEdit, eOpenNew);
            edit->get_edit_cel_p(0)->appendEventPair(cookie("M0001000"), 0, 0, length);
            ASSERT_TRUE(edit_manager::flush_edit(kEdit));
        }
        edit_manager::close_all_edits();
        const EditInfo info(kEdit, eOpenExisting);
        EXPECT_NEAR(info.getDuration(), length, 0.021);
        EXPECT_FALSE(edit_manager::get_present(kEdit));
    }
}

/// The edit files of a project with all that is beside them.
auto editFiles(const std::string& folder) {
    auto files = test::treeSnapshot(folder);
    std::erase_if(files, [](const auto& file) { return !file.first.starts_with("E000"); });
    return files;
}

/// Each state of the files of an edit of three audio channels, and what is known of the edit then. Asking
/// changes no file.
TEST(EditInfo, AsksTheFileAndMovesNothing) {
    const struct {
        const char* what;
        std::function<void(const std::string& file)> make;
        bool known;
    } cases[] = {
        {"whole", [](const std::string&) {}, true},
        {"damaged", [](const std::string& file) { std::filesystem::resize_file(file, 100); }, false},
        {"no edit", [](const std::string& file) { std::ofstream(file) << "no edit"; }, false},
        {"removed", [](const std::string& file) { std::filesystem::remove(file); }, false},
        {"away, with a backup", [](const std::string& file) { std::filesystem::rename(file, file + ".U1"); },
         true},
        {"a link",
         [](const std::string& file) {
             std::filesystem::rename(file, file + ".kept");
             std::filesystem::create_symlink(file + ".kept", file);
         },
         false},
        {"a folder",
         [](const std::string& file) {
             std::filesystem::remove(file);
             std::filesystem::create_directory(file);
         },
         false},
    };
    for (const auto& [what, make, known] : cases) {
        for (const bool isRecorded : {true, false}) {
            SCOPED_TRACE(String(what) + (isRecorded ? ", recorded" : ""));
            const ManagedProject project;
            makeEdit(kEdit, 3, 0);
            edit_manager::close_all_edits();
            if (!isRecorded) {
                ASSERT_TRUE(edit_manager::get_projdb()->remove(kEdit).isOk());
            }
            make(project.folder() + "/E0001000.qme");
            const auto before = editFiles(project.folder());
            const EditInfo info(kEdit, eOpenExisting);
            EXPECT_EQ(info.getAttrib("name"), known ? "named" : "");
            EXPECT_EQ(info.hasAudioTracks(), known);
            EXPECT_EQ(info.getEndTime() != Qx::kNoTime, known);
            EXPECT_EQ(info.getLogType() != kLogNone, known);
            EXPECT_EQ(editFiles(project.folder()), before);
            EXPECT_FALSE(edit_manager::get_present(kEdit));
        }
    }
    // A question that is not answered is no answer.
    const ManagedProject project;
    makeEdit(kEdit, 3, 0);
    edit_manager::close_all_edits();
    ASSERT_EQ(EditInfo(kEdit, eOpenExisting).getAttrib("name"), "named");
    test::FaultyFileSystem system;
    system.failWhere("info E0001000.qme", EIO);
    EXPECT_EQ(EditInfo(kEdit, eOpenExisting).getAttrib("name"), "named");
}

TEST(EditInfo, KnowsNothingWithoutRecords) {
    const ManagedProject project;
    Qx::setCurrentProject({});
    const EditInfo info(kEdit, eOpenExisting);
    EXPECT_EQ(info.getFlags(), 0);
    EXPECT_FALSE(info.isHidden() || info.hasAudioTracks() || info.isSoundOnlyShot());
    EXPECT_EQ(info.getStartTime(), Qx::kNoTime);
    EXPECT_EQ(info.getDuration(), Qx::kNoTime);
    EXPECT_EQ(info.getLogType(), kLogNone);
    EXPECT_EQ(info.m_get_num_chans(), 0);
    EXPECT_EQ(edit_manager::get_projdb(), nullptr);
    EXPECT_FALSE(edit_manager::setProjDBValue("a", "b"));
}

TEST(EditInfo, NeverAnswersFromARowThatItsFileHasLeftBehind) {
    const ManagedProject project;
    makeEdit(kEdit, 2, 0);
    const std::string two = project.read("E0001000.qme");
    makeEdit(kOther, 1, 0);
    edit_manager::close_all_edits();
    EXPECT_TRUE(EditInfo(kEdit, eOpenExisting).hasAudioTracks());
    ASSERT_TRUE(edit_manager::delete_edit_file_and_backups(kEdit, false));
    EXPECT_FALSE(EditInfo(kEdit, eOpenExisting).hasAudioTracks());
    project.write("E0001000.qme", two); // by another program
    EXPECT_TRUE(EditInfo(kEdit, eOpenExisting).hasAudioTracks());
    project.write("E0001000.qme", project.read("E0002000.qme")); // by another program again
    EXPECT_FALSE(EditInfo(kEdit, eOpenExisting).hasAudioTracks());
    // A change that is not written yet shows at once, and not as what the file says.
    const EditPtr open(kOther, eOpenExisting);
    open->addChan(AudioChan);
    projdb::Record record;
    ASSERT_TRUE(edit_manager::get_projdb()->find(kOther, record));
    EXPECT_EQ(record[projdb::Chans], "V1A2");
    EXPECT_EQ(record[projdb::FileSize], "");
    ASSERT_TRUE(edit_manager::flush_changes());
    ASSERT_TRUE(edit_manager::get_projdb()->find(kOther, record));
    EXPECT_EQ(record[projdb::FileSize], std::to_string(project.read("E0002000.qme").size()));
}

/// All records as text.
String recordsText() {
    String text;
    edit_manager::get_projdb()->forEach([&](const cookie& item, const projdb::Record& record) {
        text += item.asString();
        for (int i = 0; i < projdb::kNumColumns; ++i) {
            text += "|" + record[static_cast<projdb::Column>(i)];
        }
        text += "\n";
        return true;
    });
    return text;
}

TEST(ProjectRecords, AreMadeAgainWhenTheyAreLostOrDamaged) {
    const ManagedProject project;
    for (int i = 1; i <= 5; ++i) {
        makeEdit(cookie(Cookie_Type::Edit, i, 0), i, 0);
    }
    project.write("E0006000.qme", "no edit");
    edit_manager::close_all_edits();
    ASSERT_TRUE(edit_manager::update_projdb());
    const String records = recordsText();
    EXPECT_EQ(edit_manager::get_projdb()->numRecords(), 6U);
    EXPECT_NE(records.find("E0006000.qme"), std::string::npos) << "says why it cannot be read";
    const struct {
        const char* what;
        const char* bytes;
    } faults[] = {{"deleted", nullptr}, {"damaged", "This is no table of records."}};
    for (const auto& [what, bytes] : faults) {
        SCOPED_TRACE(what);
        ManagedProject::stopManager();
        for (const char* const name : {"Project.db", "Project.db-wal", "Project.db-shm"}) {
            std::filesystem::remove(std::filesystem::path(project.folder() + "/" + name));
        }
        if (bytes != nullptr) {
            project.write("Project.db", bytes);
        }
        ManagedProject::startManager();
        ASSERT_NE(edit_manager::get_projdb(), nullptr);
        EXPECT_EQ(edit_manager::get_projdb()->numRecords(), 0U);
        EXPECT_TRUE(edit_manager::get_projdb()->isNew());
        EXPECT_EQ(project.read("Project.db.DAMAGED"), bytes == nullptr ? "(missing)" : bytes);
        ASSERT_TRUE(edit_manager::update_projdb());
        EXPECT_EQ(recordsText(), records);
    }
    EXPECT_TRUE(project.has("E0006000.qme")) << "listing sets nothing aside";
}

TEST(ProjectRecords, AnUpdateReadsOnlyWhatChangedAndCanBeInterrupted) {
    const ManagedProject project;
    makeEdit(kEdit, 1, 0);
    makeEdit(kOther, 1, 0);
    edit_manager::close_all_edits();
    test::FaultyFileSystem system;
    ASSERT_TRUE(edit_manager::update_projdb());
    EXPECT_EQ(system.count("open read E000"), 0U) << "written a moment ago";
    project.write("E0003000.qme", project.read("E0001000.qme"));
    EXPECT_FALSE(edit_manager::update_projdb([](size_t done, size_t total) {
        EXPECT_EQ(total, 3U);
        return done < 1;
    }));
    EXPECT_EQ(system.count("open read E000"), 0U);
    ASSERT_TRUE(edit_manager::update_projdb());
    EXPECT_EQ(system.count("open read E000"), 1U);
    std::filesystem::remove(std::filesystem::path(project.folder() + "/E0001000.qme"));
    std::vector<size_t> steps;
    ASSERT_TRUE(
        edit_manager::update_projdb([&](size_t done, size_t) { return steps.push_back(done), true; }));
    EXPECT_EQ(steps, (std::vector<size_t>{0, 1, 2}));
    EXPECT_EQ(edit_manager::get_projdb()->numRecords(), 2U);
    edit_manager::setConfirmUpdateFn([&] {
        system.failWhere("list P0001000", EIO);
        return true;
    });
    ManagedProject::stopManager();
    EXPECT_TRUE(project.log.contains("edit_manager::~edit_manager: projdb update interrupted\n"));
}

TEST(ProjectRecords, OfAnotherRateAreDropped) {
    const ManagedProject project;
    makeEdit(kEdit, 1, 0);
    ASSERT_NE(edit_manager::get_projdb(), nullptr);
    ManagedProject::stopManager();
    Qx::CurrentProject faster = Qx::currentProject();
    faster.frameRateCode = Qx::FrameRate::Fps50;
    Qx::setCurrentProject(faster);
    ManagedProject::startManager();
    EXPECT_EQ(edit_manager::get_projdb()->numRecords(), 0U);
    EXPECT_NEAR(EditInfo(kEdit, eOpenExisting).getEndTime(), 12.48, 0.021);
}

} // namespace

TEST(ProjectRecords, HaveAColumnForEveryAttributeThatIsKeptInThem) {
    const ManagedProject project;
    const projdb* const records = edit_manager::get_projdb();
    for (uint32_t number = 1; number <= LogAttributes::kLast; ++number) {
        const char* const field = LogAttributes::getProjDBFieldNameForAttrib(LogAttribute{number});
        EXPECT_EQ(field != nullptr && records->columnIndex(field) >= 0,
                  LogAttributes::isStoredInProjectDatabase(LogAttribute{number}))
            << number;
    }
}

TEST(ProjectRecords, FindItemsByTheirLogs) {
    const ManagedProject project;
    const char* const logs[][3] = {
        {"12", "A001", "wide"}, {"12A", "a002", "50% _close_"}, {"13", "B001", ""}};
    for (int i = 0; i < 3; ++i) {
        const cookie item(Cookie_Type::Edit, i + 1, 0);
        makeEdit(item, 1, 0);
        const EditPtr edit(item, eOpenExisting);
        LogAttributes::Map map;
        map.add(LogAttributes::kScene, logs[i][0]);
        map.add(LogAttributes::kReel, logs[i][1]);
        map.add(LogAttributes::kDescription, logs[i][2]);
        ASSERT_TRUE(edit->setAttributes(map));
    }
    ASSERT_TRUE(edit_manager::flush_changes());
    project.write("E0009000.qme", "no edit");
    edit_manager::close_all_edits();
    ASSERT_TRUE(edit_manager::update_projdb());
    const struct {
        std::vector<String> conditions;
        const char* found; ///< "!" where it is refused
    } cases[] = {
        {{"scene=12"}, "1"},         {{"scene=12*"}, "12"},          {{"Scene=12?"}, "2"},
        {{"reel=A*"}, "12"},         {{"reel=a*", "scene=12"}, "1"}, {{"description=?*"}, "12"},
        {{"description=50%*"}, "2"}, {{"description=% *"}, ""},      {{"description=*_close_"}, "2"},
        {{"type=edit"}, "123"},      {{"snd_reel=*"}, "123"},        {{"snd reel=R*"}, ""},
        {{"cookie=e0002000"}, "2"},  {{"date=20*Z"}, "123"},         {{"scene"}, "!"},
        {{"nothing=1"}, "!"},        {{"scene=12", "=1"}, "!"},      {{}, "123"},
    };
    test::FaultyFileSystem system;
    for (const auto& c : cases) {
        std::vector<FoundEdit> found;
        const Qx::Status looked = findEdits(c.conditions, found);
        String text = looked ? "" : "!";
        for (const FoundEdit& edit : found) {
            text += std::to_string(edit.item.word(0));
        }
        EXPECT_EQ(text, c.found) << (c.conditions.empty() ? String() : c.conditions.front());
    }
    EXPECT_EQ(system.count("open read E000"), 0U) << "no edit file was opened";
}

// Many items, so that a look-up which reads edits, or is not linear, shows.
TEST(ProjectRecords, FindAmongManyItems) {
    const ManagedProject project;
    projdb* const records = edit_manager::get_projdb();
    constexpr int kItems = 10000;
    {
        projdb::Transaction all(*records);
        for (int i = 0; i < kItems; ++i) {
            projdb::Record record;
            record[projdb::Type] = "shot";
            record[projdb::Name] = String::format("%d/%d", i / 10, i % 10);
            record[projdb::Scene] = std::to_string(i / 10);
            record[projdb::Reel] = String::format("%c%03d", 'A' + i % 26, i / 26);
            record[projdb::Date] = "2026-11-22T00:00:00Z";
            ASSERT_TRUE(records->put(cookie(Cookie_Type::Edit, i + 1, 0), record));
        }
        ASSERT_TRUE(all.commit());
    }
    std::vector<FoundEdit> found;
    ASSERT_TRUE(findEdits({"scene=12*", "reel=A*"}, found));
    EXPECT_EQ(found.size(), 3u) << "scenes 12 and 120 to 129, every 26th reel: items 1222, 1248 and 1274";
}
