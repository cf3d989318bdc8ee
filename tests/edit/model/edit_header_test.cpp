#include "edit/model/edit.h"
#include "platform/services/clock.h"
#include "platform/services/current_project.h"
#include "tests/support/edit_builder.h"
#include "tests/support/edit_state.h"
#include "tests/support/recording_log.h"

#include <gtest/gtest.h>

#include <limits>

using test::EditBuilder;

namespace {

/// Another project while it lives: 29.97 frames a second, user "Jo".
class ProjectInForce {
public:
    ProjectInForce() : m_before(Qx::currentProject()) {
        Qx::CurrentProject project = m_before;
        project.project = cookie("P0007001");
        project.frameRateCode = Qx::FrameRate::Fps29_97;
        project.defaultEditMedium = 5;
        project.user = "Jo";
        project.rootFolder.clear();
        Qx::setCurrentProject(project);
    }
    ~ProjectInForce() { Qx::setCurrentProject(m_before); }

private:
    Qx::CurrentProject m_before;
};

TEST(NewEdit, IsCleanAndHasTheDefaultsOfTheProject) {
    const ProjectInForce project;
    const Qx::Clock before = Qx::setClock([] { return int64_t{0x1'2345'6789}; });
    const uint64_t constructed = Edit::numConstructed();
    const Edit edit;
    Qx::setClock(before);
    EXPECT_EQ(Edit::numConstructed(), constructed + 1);
    EXPECT_EQ(edit.refCount(), 0);
    EXPECT_FALSE(edit.get_dirty());
    EXPECT_EQ(edit.Opts().getCookie("PROJECT_COOKIE"), cookie("P0007001"));
    EXPECT_EQ(edit.getCreationTime(), 0x2345'6789) << "32 bits of the clock";
    EXPECT_EQ(edit.get_ed2_revision(), 602);
    EXPECT_EQ(edit.Opts().getInt("SOURCE_MEDIUM"), 5);
    EXPECT_EQ(edit.getOwner(), "Jo");
    EXPECT_TRUE(edit.isEdit());
    EXPECT_FALSE(edit.mark_is_valid());
    EXPECT_EQ(edit.getFrameRate(), Qx::FrameRate(Qx::FrameRate::Fps29_97));
    EXPECT_EQ(edit.getChangeDescription().type(), kNotDescribed);
}

TEST(Header, EveryChangeOfItDirtiesTheEditAndNoOther) {
    const EditPtr edit = EditBuilder().build();
    edit->set_hidden(0);
    edit->Opts().setInt("TRANSFER", 3);
    EXPECT_FALSE(edit->get_dirty());
    edit->Opts().setInt("ANYTHING", 1);
    EXPECT_TRUE(edit->get_dirty());
    edit->set_dirty(false);
    EXPECT_FALSE(edit->get_dirty());
    edit->set_hidden(1);
    EXPECT_TRUE(edit->get_dirty());
}

TEST(Header, MissingAndUnfitValuesGiveTheDefaults) {
    const ProjectInForce project;
    Edit edit;
    edit.Opts().clear();
    edit.clear_cache_flags();
    EXPECT_FALSE(edit.get_read_only());
    EXPECT_EQ(edit.get_ed2_revision(), 1);
    EXPECT_EQ(edit.getPermissions(), Edit::kPermissionsAll);
    EXPECT_EQ(edit.get_undo_cookie(), invalid_cookie);
    EXPECT_EQ(edit.getModificationCount(), 0U);
    EXPECT_EQ(edit.getSourceMediumDuration(), Qx::kNoTime);
    EXPECT_EQ(edit.get_elapsed_time_origin(), 0.0);
    EXPECT_EQ(edit.get_log_type(), kLogNone);

    edit.Opts().setInt("PERMISSIONS", -7);
    EXPECT_EQ(edit.getPermissions(), Edit::kPermissionsAll);
    edit.Opts().setInt64("MOD_COUNT", -5);
    EXPECT_EQ(edit.getModificationCount(), 0U);
    edit.Opts().setInt64("MOD_COUNT", INT64_MAX);
    edit.incModificationCount();
    EXPECT_EQ(edit.getModificationCount(), static_cast<uint64_t>(INT64_MAX));
    edit.set_ed2_revision(602);
    edit.Opts().setInt("FRAME_RATE", 77);
    edit.clear_cache_flags();
    EXPECT_EQ(edit.getFrameRate(), Qx::FrameRate(Qx::FrameRate::Fps29_97));
}

TEST(Header, DurationOfTheSourceCountsFromRevision503On) {
    Edit edit;
    edit.setSourceMediumDuration(12.5);
    for (const auto& [revision, seconds] : {std::pair(502, Qx::kNoTime), std::pair(503, 12.5)}) {
        edit.set_ed2_revision(revision);
        edit.clear_cache_flags();
        EXPECT_EQ(edit.getSourceMediumDuration(), seconds) << revision;
    }
}

TEST(FrameRate, OfAnOldEditComesFromItsTelevisionStandard) {
    struct Case {
        int revision;
        const char* standard;
        bool readOnly;
        int code;       ///< of the answer
        int storedCode; ///< in the header after the question; 0 none
    };
    const ProjectInForce project; // 29.97
    for (const Case& c : {Case{500, "pal", false, Qx::FrameRate::Fps25, Qx::FrameRate::Fps25},
                          Case{-1, "pal", false, Qx::FrameRate::Fps25, Qx::FrameRate::Fps25},
                          Case{500, "pal", true, Qx::FrameRate::Fps25, 0},
                          Case{500, "secam?", false, Qx::FrameRate::Fps29_97, 0},
                          Case{501, "pal", false, Qx::FrameRate::Fps29_97, 0}}) {
        SCOPED_TRACE(String::format("%d %s %d", c.revision, c.standard, c.readOnly ? 1 : 0));
        Edit edit;
        edit.Opts().remove("FRAME_RATE");
        edit.Opts().setString("tvtype", c.standard);
        edit.set_ed2_revision(c.revision);
        edit.set_read_only(c.readOnly);
        edit.clear_cache_flags();
        const test::RecordingLog log;
        EXPECT_EQ(edit.getFrameRate().code(), c.code);
        EXPECT_EQ(edit.Opts().getInt("FRAME_RATE"), c.storedCode);
        EXPECT_EQ(log.log(), "");
        EXPECT_DOUBLE_EQ(edit.get_frame_time(), Qx::FrameRate(c.code).frameDuration());
    }
}

TEST(LogType, FollowsCookieAndHeader) {
    struct Case {
        const char* what;
        cookie item;
        int original;
        bool hidden;
        int dupe;
        int slashDupe;
        int entireMedium;
        const char* wiring;
        edit_log_type_t type;
    };
    constexpr int kNone = -9;
    const cookie plain(Cookie_Type::Edit, 1, 1);
    for (const Case& c : {
             Case{"magic", black_cookie, 1, false, kNone, kNone, 0, "", kLogMagic},
             Case{"alias is not magic", alias_cookie, 0, false, kNone, kNone, 0, "", kLogEdit},
             Case{"no original_material", plain, kNone, false, 1, 1, 1, "w", kLogNone},
             Case{"shot", plain, 1, false, kNone, kNone, 0, "", kLogShot},
             Case{"shot of dupe 0", plain, 2, false, 0, 0, 1, "", kLogShot},
             Case{"slash dupe without its item", plain, 1, false, 0, 1, 0, "", kLogNone},
             Case{"dupe 1", plain, 1, false, 1, kNone, 0, "", kLogGhost3},
             Case{"dupe 2", plain, 1, false, 2, 1, 0, "", kLogGhost4},
             Case{"dupe 3", plain, 1, false, 3, kNone, 0, "", kLogGhost5},
             Case{"dupe 4", plain, 1, false, 4, kNone, 0, "", kLogNone},
             Case{"hidden", plain, 1, true, 1, 0, 0, "", kLogGhost6},
             Case{"hidden slash dupe", plain, 1, true, 1, 1, 0, "", kLogGhost7},
             Case{"reel before template", plain, 0, false, kNone, kNone, 1, "w", kLogReel},
             Case{"template", plain, 0, false, kNone, kNone, 0, "w", kLogTemplate},
             Case{"empty wiring", plain, 0, false, kNone, kNone, 0, "", kLogEdit},
         }) {
        SCOPED_TRACE(c.what);
        Edit edit;
        edit.set_cookie(c.item);
        configb& header = edit.Opts();
        header.remove("ORIGINAL_MATERIAL");
        const auto set = [&](const char* key, int value) {
            if (value != kNone) {
                header.setInt(key, value);
            }
        };
        set("Original_Material", c.original);
        set("is_dupe", c.dupe);
        set("is_slash_dupe", c.slashDupe);
        set("entire_medium", c.entireMedium);
        header.setString("FX_TEMPLATE", c.wiring);
        if (c.hidden) {
            header.setCookie("hidden_cookie", plain);
        }
        EXPECT_EQ(edit.log_type_get_m(), c.type);
        EXPECT_EQ(edit.get_log_type(), c.type);
        EXPECT_EQ(edit.is_original(), (c.type >= 1 && c.type <= 7 && c.type != 2));
    }
}

TEST(Times, SetAnEditDirtyOnlyWhenTheyChange) {
    const EditPtr edit = EditBuilder().build();
    const String before = test::editState(*edit);
    const double nan = std::numeric_limits<double>::quiet_NaN();
    edit->set_current_time(0, 0.0);
    edit->mark_invalidate();
    edit->set_current_time(0, nan);
    edit->set_mark_time(0, std::numeric_limits<double>::infinity());
    EXPECT_EQ(test::editState(*edit), before);

    edit->set_current_time_raw(0, 4.0);
    edit->set_mark_time_raw(3, 2.0);
    EXPECT_FALSE(edit->get_dirty());
    EXPECT_EQ(edit->get_current_time(7), 4.0);
    EXPECT_TRUE(edit->mark_is_valid());
    edit->mark_invalidate();
    EXPECT_TRUE(edit->get_dirty());
    EXPECT_FALSE(edit->mark_is_valid());
    edit->set_dirty(false);
    edit->set_current_time(0, 5.0);
    EXPECT_TRUE(edit->get_dirty());
}

} // namespace
