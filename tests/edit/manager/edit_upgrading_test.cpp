#include "edit/manager/edit_upgrading.h"
#include "edit/model/cel.h"
#include "platform/store/configb.h"
#include "tests/edit/manager/managed_project.h"
#include "tests/support/faulty_file_system.h"

#include <algorithm>
#include <gtest/gtest.h>

using test::kEdit;
using test::ManagedProject;

namespace {

/// Writes an edit of a revision: a picture channel in 30 frames a second, with `adjust` on its header.
void writeOld(const ManagedProject& project, const cookie& item, int revision,
              const std::function<void(Edit&)>& adjust = {}) {
    EditPtr edit(new Edit);
    edit->set_cookie(item);
    edit->addChan(VideoChan, nullptr, false);
    edit->get_edit_cel_p(0)->appendEventPair(cookie("M0001000"), 0, 0, 1);
    edit->setFrameRate(Qx::FrameRate(Qx::FrameRate::Fps30));
    edit->set_ed2_revision(revision);
    if (adjust) {
        adjust(*edit);
    }
    edit->init_dirty();
    ASSERT_TRUE(edit->write_file(Qx::widen(project.folder() + "/" + item.asString() + ".qme")))
        << edit->lastFileError();
}

} // namespace

TEST(EditUpgrading, ReplacesTheFileAndKeepsTheOldOne) {
    const ManagedProject project;
    const struct {
        int revision;
        std::function<void(Edit&)> adjust;
        UpgradedEdit::Outcome outcome;
    } cases[] = {
        {225, {}, UpgradedEdit::Upgraded},
        {501, {}, UpgradedEdit::Current},
        {400, [](Edit& edit) { edit.Opts().setBool("READ_ONLY", true); }, UpgradedEdit::Failed},
        // A time that the other rate has no place for.
        {400,
         [](Edit& edit) {
             edit.get_edit_cel_p(0)->appendEventPair(cookie("M0001000"), 0, cel::kGreatestTime - 10, 9.99);
         },
         UpgradedEdit::NotWhole},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.revision);
        writeOld(project, kEdit, c.revision, c.adjust);
        const std::string old = project.read("E0001000.qme");
        const UpgradedEdit wanted = upgradeEdit(kEdit, true);
        EXPECT_EQ(wanted.outcome, c.outcome == UpgradedEdit::Upgraded || c.outcome == UpgradedEdit::Failed
                                      ? UpgradedEdit::WouldUpgrade
                                      : c.outcome);
        EXPECT_EQ(project.read("E0001000.qme"), old);
        EXPECT_FALSE(project.has("E0001000.qme.U1"));
        const UpgradedEdit done = upgradeEdit(kEdit, false);
        ASSERT_EQ(done.outcome, c.outcome) << done.status.reason();
        EXPECT_EQ(done.upgrade.done, wanted.upgrade.done);
        if (c.outcome != UpgradedEdit::Upgraded) {
            EXPECT_EQ(project.read("E0001000.qme"), old);
            EXPECT_FALSE(project.has("E0001000.qme.U1"));
            continue;
        }
        EXPECT_EQ(project.read("E0001000.qme.U1"), old);
        EXPECT_NE(project.read("E0001000.qme"), old);
        EXPECT_EQ(done.upgrade.from, 225);
        EXPECT_NE(std::find(done.upgrade.done.begin(), done.upgrade.done.end(),
                            "its times went from 30 to 29.97 frames a second"),
                  done.upgrade.done.end());
        EXPECT_EQ(upgradeEdit(kEdit, false).outcome, UpgradedEdit::Current);
        std::filesystem::remove(std::filesystem::path(project.folder() + "/E0001000.qme.U1"));
    }
    writeOld(project, kEdit, 225);
    const EditPtr open(kEdit, eOpenExisting);
    EXPECT_EQ(upgradeEdit(kEdit, false).outcome, UpgradedEdit::Failed) << "is open";
    project.write("E0002000.qme", "no edit");
    EXPECT_EQ(upgradeEdit(cookie("E0002000"), false).outcome, UpgradedEdit::Failed);
    EXPECT_EQ(project.read("E0002000.qme"), "no edit");
}

// Whatever operation fails, or is the last: the old file is under its name or its backup, and nothing is half.
TEST(EditUpgrading, LosesNothingWhateverFails) {
    for (const bool isGone : {false, true}) {
        for (size_t n = 1;; ++n) {
            const ManagedProject project;
            writeOld(project, kEdit, 225);
            const std::string old = project.read("E0001000.qme");
            test::FaultyFileSystem system;
            system.reset();
            isGone ? system.failFrom(n, EIO) : system.failAt(n, EIO);
            const UpgradedEdit done = upgradeEdit(kEdit, false);
            const bool wasReached = system.operations().size() >= n;
            system.reset();
            SCOPED_TRACE(String::format("operation %zu, %d", n, isGone));
            const std::string now = project.read("E0001000.qme");
            if (done.outcome == UpgradedEdit::Upgraded) {
                EXPECT_EQ(project.read("E0001000.qme.U1"), old);
                EXPECT_EQ(upgradeEdit(kEdit, false).outcome, UpgradedEdit::Current);
            } else {
                EXPECT_EQ(done.outcome, UpgradedEdit::Failed);
                EXPECT_FALSE(done.status.reason().empty());
                EXPECT_TRUE(now == old || (isGone && project.read("E0001000.qme.U1") == old));
                EXPECT_TRUE(EditPtr(kEdit, eOpenExisting).valid());
            }
            if (!wasReached) {
                break;
            }
        }
    }
}
