#include "edit/manager/milestone_ring.h"

#include "edit/model/edit.h"
#include "edit/model/edit_keys.h"
#include "platform/services/atomic_batch.h"
#include "platform/services/config_int.h"
#include "platform/services/current_project.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/files.h"

#include <algorithm>

namespace {

unsigned setting(const char* name) {
    return static_cast<unsigned>(std::max(config_int(name, 10), 0));
}

} // namespace

MilestoneRing::MilestoneRing()
    : MilestoneRing(setting("mods_per_milestone"), setting("milestones_per_edit")) {}

MilestoneRing::MilestoneRing(unsigned modsPerMilestone, unsigned milestonesPerEdit)
    : m_modsPerMilestone(modsPerMilestone), m_milestonesPerEdit(milestonesPerEdit) {}

bool MilestoneRing::isMilestoneBackupRequired(const EditPtr& edit) const {
    if (!edit.valid() || edit->get_cookie().isClipboard() || m_modsPerMilestone * m_milestonesPerEdit == 0) {
        return false;
    }
    const auto last = static_cast<uint64_t>(std::max<int64_t>(EditKeys::kMilestone.get(edit->Opts()), 0));
    return edit->getModificationCount() >= last + m_modsPerMilestone;
}

uint64_t MilestoneRing::slot(uint64_t modifications) const {
    const uint64_t ring = m_modsPerMilestone * m_milestonesPerEdit;
    return ring == 0 ? 0 : modifications % ring / m_milestonesPerEdit;
}

String MilestoneRing::getMilestoneFolder(const cookie& project, const cookie& edit) {
    const Qx::CurrentProject current = Qx::currentProject();
    const cookie& named = project.is_valid() ? project : current.project;
    const cookie folder(Cookie_Type::Project, static_cast<int>(named.word(0)),
                        static_cast<int>(named.word(1)));
    if (current.rootFolder.empty() || !folder.isStorable() || !edit.isStorable()) {
        return {};
    }
    const String milestones =
        Qx::joinPath(Qx::joinPath(current.rootFolder, folder.asString()), kMilestonesFolder);
    return Qx::joinPath(milestones, edit.asString());
}

Qx::Status MilestoneRing::makeMilestoneFolder(const cookie& edit) {
    const String folder = getMilestoneFolder(invalid_cookie, edit);
    if (folder.empty()) {
        return Qx::Status::failure("there is no folder for milestones of " + edit.asString());
    }
    const Qx::FileError error = Qx::makeFolders(folder);
    return error.status();
}

Qx::Status MilestoneRing::makeMilestoneBackup(const EditPtr& edit, const String& file) const {
    const cookie item = edit->get_cookie();
    if (m_modsPerMilestone * m_milestonesPerEdit == 0) {
        return Qx::Status::failure("milestones are switched off by the settings");
    }
    if (Qx::Status status = makeMilestoneFolder(item); !status) {
        return status;
    }
    const Qx::AtomicBatch::Pause atOnce;
    const String name = item.asString() + "." + std::to_string(slot(edit->getModificationCount()));
    const Qx::FileError error =
        Qx::copyFile(file, Qx::joinPath(getMilestoneFolder(invalid_cookie, item), name));
    return error.status();
}
