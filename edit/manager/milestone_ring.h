#pragma once

#include "edit/model/edit_ptr.h"
#include "platform/base/qx_string.h"
#include "platform/base/status.h"

#include <cstdint>

/// Milestones: copies of an edit's file that are made while it is flushed, once enough changes have come
/// together, in a ring of slots that are used over and over. They stay when the edit is deleted, and keep
/// its cookie from being handed out again.
///
/// The copies of an edit lie in the projects' root folder under the project's cookie, "Milestones" and the
/// edit's cookie, and are named by the edit's cookie and the slot: "P0001000/Milestones/E0001000/E0001000.3".
class QM_API MilestoneRing {
public:
    /// With the settings "mods_per_milestone" and "milestones_per_edit", each 10 unless set.
    MilestoneRing();
    MilestoneRing(unsigned modsPerMilestone, unsigned milestonesPerEdit);

    /// True if a milestone is due: the edit is not the clipboard edit and its count of modifications is at
    /// least `modsPerMilestone` above that at the last milestone (header "MILESTONE"). Never when either
    /// setting is 0.
    [[nodiscard]] bool isMilestoneBackupRequired(const EditPtr& edit) const;
    /// The slot for a count of modifications: (count mod (K M)) div K in 64 bits, with K milestones an edit
    /// and M modifications a milestone; 0 when either is 0.
    [[nodiscard]] uint64_t slot(uint64_t modifications) const;
    /// Copies the edit's file, as it lies in `file`, to the slot for its count of modifications, durably. A
    /// copy that fails leaves what the slot held.
    Qx::Status makeMilestoneBackup(const EditPtr& edit, const String& file) const;

    /// The folder of an edit's milestones; an invalid project stands for the current one. Empty when there is
    /// no root folder or a cookie cannot name a folder.
    [[nodiscard]] static String getMilestoneFolder(const cookie& project, const cookie& edit);
    /// Makes the missing levels of the folder in the current project.
    static Qx::Status makeMilestoneFolder(const cookie& edit);

private:
    uint64_t m_modsPerMilestone;
    uint64_t m_milestonesPerEdit;
};
