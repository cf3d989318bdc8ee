#include "edit/manager/detail/manager_state.h"
#include "edit/project/cookie_allocator.h"
#include "edit/project/project_details.h"
#include "platform/media/tv_standard.h"
#include "platform/services/current_project.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/log.h"

#include <algorithm>
#include <chrono>
#include <thread>
#include <utility>

namespace {

/// The leaving of a project that has begun. Whatever keeps another one from being adopted, edits can be
/// opened again afterwards.
class ProjectExit {
public:
    ProjectExit() = default;
    ~ProjectExit() { end(); }
    ProjectExit(const ProjectExit&) = delete;
    ProjectExit& operator=(const ProjectExit&) = delete;
    void end() {
        if (!std::exchange(m_isOver, true)) {
            managerState().setLeaving(false);
        }
    }

private:
    bool m_isOver = false;
};

/// Takes a project in the place of the one that was left, and lets edits be opened again.
eStatus adoptProject(const Qx::CurrentProject* wanted, ProjectExit& projectExit) {
    ManagerState& state = managerState();
    Qx::CurrentProject current;
    String folder;
    {
        const ManagerState::Hold hold(state.lock);
        if (wanted != nullptr) {
            Qx::setCurrentProject(*wanted);
        }
        // Asked before the project itself: when another one is set meanwhile, it is seen to be out of date.
        const unsigned generation = Qx::currentProjectGeneration();
        current = Qx::currentProject();
        folder = current.folder();
        ++state.epoch;
        state.project = folder.empty() ? invalid_cookie : current.project;
        state.projectGeneration = generation;
        if (!folder.empty()) {
            state.records.use(folder);
        }
        projectExit.end();
    }
    if (folder.empty()) {
        return eStatus::NoProject;
    }
    state.tell(edit_manager::projChangedMsgType(), current.project);
    return eStatus::Ok;
}

/// Writes and drops what belongs to the project. Nothing is opened until another one is adopted.
void dropProject(Vector<UnwrittenEdit>& lost) {
    ManagerState& state = managerState();
    closeAllEdits(lost);
    state.records.close();
    const ManagerState::Hold hold(state.lock);
    ++state.epoch;
    state.project = invalid_cookie;
    state.projectGeneration = 0;
}

/// Tells that the project is being left, and begins to. False if there is none, or another thread does.
bool beginToLeave() {
    ManagerState& state = managerState();
    const cookie project = edit_manager::get_current_project_cookie();
    if (project.is_valid()) {
        edit_manager::flush_changes();
        state.tell(edit_manager::projExitMsgType(), project);
    }
    return state.setLeaving(true);
}

/// The settings of a project that is not the current one.
bool readDetails(const cookie& project, ProjectDetails& details) {
    Qx::CurrentProject other = Qx::currentProject();
    const bool isCurrent = !project.is_valid() || project == other.project;
    details.name = other.name;
    details.frameRateCode = other.frameRateCode;
    details.dropFrame = other.dropFrame;
    if (isCurrent) {
        return true;
    }
    other.project = project;
    // `openOrCreate` would make a project that is not there.
    return !other.folder().empty() && Qx::askFile(Qx::joinPath(other.folder(), "Project.txt")).isRegular() &&
           ProjectDetails::openOrCreate(other.rootFolder, project, ProjectDetails(), details).isOk();
}

size_t numEditFiles(const cookie& project) {
    Qx::CurrentProject named = Qx::currentProject();
    if (project.is_valid()) {
        named.project = project;
    }
    std::vector<String> names;
    if (named.folder().empty() || Qx::fileSystem().list(named.folder(), names)) {
        return 0;
    }
    return static_cast<size_t>(std::count_if(names.begin(), names.end(), [](const String& name) {
        return Qx::extensionOf(name) == getEditFilenameExt() &&
               cookie(std::string_view(Qx::withoutExtension(name))).is_valid();
    }));
}

} // namespace

eStatus edit_manager::check_current_project(eEditOpenBehaviour) {
    ManagerState& state = managerState();
    cookie left;
    {
        const ManagerState::Hold hold(state.lock);
        // Who leaves a project at the moment adopts the next one too.
        if (state.projectGeneration.load() == Qx::currentProjectGeneration() || !state.setLeaving(true)) {
            return state.project.is_valid() ? eStatus::Ok : eStatus::NoProject;
        }
        left = state.project;
    }
    ProjectExit projectExit;
    // Rates are asked of the project that is current already: what would be recorded may be wrong.
    state.records.close();
    if (left.is_valid()) {
        state.tell(projExitMsgType(), left);
    }
    Vector<UnwrittenEdit> lost; // told of on the log
    dropProject(lost);
    return adoptProject(nullptr, projectExit);
}

eStatus edit_manager::set_current_project(const cookie& project, eEditOpenBehaviour behaviour) {
    Qx::CurrentProject wanted = Qx::currentProject();
    wanted.project = project;
    if (project.type() != Cookie_Type::Project || wanted.folder().empty()) {
        return eStatus::NoProject;
    }
    const bool mayMake = behaviour == eOpenNew || behaviour == eOpenOrCreate;
    const Qx::FileAnswer folder = Qx::askFile(wanted.folder());
    const Qx::FileAnswer settings = Qx::askFile(Qx::joinPath(wanted.folder(), "Project.txt"));
    if (folder.isUnknown() || settings.isUnknown()) {
        herc_printf("edit_manager::set_current_project( %s ) : %s\n", cookie_string(project).c_str(),
                    (folder.isUnknown() ? folder : settings).obstacle().text().c_str());
        return eStatus::NotFound;
    }
    const bool isThere = folder.isFolder();
    if (!isThere && !mayMake) {
        return eStatus::NotFound;
    }
    ProjectDetails details;
    details.frameRateCode = wanted.frameRateCode;
    details.dropFrame = wanted.dropFrame;
    details.defaultEditMedium = wanted.defaultEditMedium;
    if (mayMake || settings.isRegular()) {
        const Qx::Status opened = ProjectDetails::openOrCreate(wanted.rootFolder, project, details, details);
        if (!opened) {
            herc_printf("edit_manager::set_current_project( %s ) : %s\n", cookie_string(project).c_str(),
                        opened.reason().c_str());
            return isThere ? eStatus::NotFound : eStatus::NotWritable;
        }
        wanted.name = details.name;
        wanted.frameRateCode = details.frameRateCode;
        wanted.dropFrame = details.dropFrame;
        wanted.defaultEditMedium = details.defaultEditMedium;
    } else {
        String rate;
        wanted.name = getProjectName(project);
        if (getProjDBValue("PROJECT_RATE", rate, project) && Qx::FrameRate::fromString(rate).valid()) {
            wanted.frameRateCode = Qx::FrameRate::fromString(rate).code();
        }
        wanted.dropFrame = wanted.dropFrame && Qx::FrameRate(wanted.frameRateCode).hasDropFrame();
    }
    // Two threads that set projects do so one after the other.
    while (!beginToLeave()) {
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
    ProjectExit projectExit;
    Vector<UnwrittenEdit> lost; // told of on the log
    dropProject(lost);
    return adoptProject(&wanted, projectExit);
}

void edit_manager::exitProject() {
    Vector<UnwrittenEdit> lost;
    exitProject(lost);
}

void edit_manager::exitProject(Vector<UnwrittenEdit>& lost) {
    if (beginToLeave()) {
        const ProjectExit projectExit;
        dropProject(lost);
    }
}

Edit* edit_manager::get_current_project() {
    ManagerState& state = managerState();
    const cookie project = get_current_project_cookie();
    if (!project.is_valid()) {
        return nullptr;
    }
    {
        const ManagerState::Hold hold(state.lock);
        if (state.projectEdit.valid()) {
            return state.projectEdit;
        }
    }
    const EditPtr opened = openEdit(project, eOpenOrCreate);
    const ManagerState::Hold hold(state.lock);
    const ManagerState::CachedEdit* const found = state.findCacheEntry(project);
    // Not one of a project that was left meanwhile.
    if (!state.projectEdit.valid() && !state.isLeaving && found != nullptr && found->edit == opened) {
        state.projectEdit = opened;
    }
    return state.projectEdit;
}

cookie edit_manager::get_current_project_cookie() {
    ManagerState& state = managerState();
    const ManagerState::Hold hold(state.lock);
    return state.project;
}

bool edit_manager::projectIsEmpty() {
    return numEditFiles(invalid_cookie) == 0;
}

String edit_manager::getProjectName(const cookie& project) {
    ProjectDetails details;
    String name;
    if (readDetails(project, details)) {
        return details.name;
    }
    return getProjDBValue("PROJECT_NAME", name, project) ? name : String();
}

Qx::Ed2Support::TVStd edit_manager::getProjectTvStd(const cookie& project) {
    ProjectDetails details;
    String rateText;
    Qx::FrameRate rate;
    if (readDetails(project, details)) {
        rate = Qx::FrameRate(details.frameRateCode);
    } else if (getProjDBValue("PROJECT_RATE", rateText, project)) {
        rate = Qx::FrameRate::fromString(rateText);
    }
    switch (rate.code()) {
    case Qx::FrameRate::Fps24:
        return Qx::Ed2Support::tvStdFromText("pal_24");
    case Qx::FrameRate::Fps25:
        return Qx::Ed2Support::tvStdFromText("pal");
    case Qx::FrameRate::Fps29_97:
        return Qx::Ed2Support::tvStdFromText("ntsc");
    default:
        return {};
    }
}

String edit_manager::getProjectSummary(const cookie& project) {
    ProjectDetails details;
    if (!readDetails(project, details)) {
        return {};
    }
    const String name = details.name.empty() ? project.asString() : details.name;
    const size_t edits = numEditFiles(project);
    return name + ", " + Qx::FrameRate(details.frameRateCode).asString() + " frames a second, " +
           std::to_string(edits) + (edits == 1 ? " edit" : " edits");
}

cookie edit_manager::new_edit(std::span<const cookie> taken) {
    const String folder = Qx::currentProject().folder();
    return folder.empty() ? invalid_cookie : CookieAllocator(folder).allocateOne(taken);
}
