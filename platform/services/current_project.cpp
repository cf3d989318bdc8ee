#include "platform/services/current_project.h"

#include "platform/services/files.h"

#include <atomic>
#include <mutex>
#include <pwd.h>
#include <unistd.h>
#include <vector>

namespace Qx {

namespace {

String userOfProcess() {
    std::vector<char> buffer(16384);
    passwd entry{};
    passwd* found = nullptr;
    const uid_t id = ::geteuid();
    if (::getpwuid_r(id, &entry, buffer.data(), buffer.size(), &found) == 0 && found != nullptr) {
        return found->pw_name;
    }
    return String::format("user %u", static_cast<unsigned>(id));
}

struct ProjectState {
    std::mutex mutex;
    CurrentProject project;
    std::atomic<unsigned> generation{1};

    ProjectState() { project.user = userOfProcess(); }
};

ProjectState& projectState() {
    static auto& shared = *new ProjectState;
    return shared;
}

} // namespace

String CurrentProject::folder() const {
    return rootFolder.empty() || !project.isStorable() ? String() : joinPath(rootFolder, project.asString());
}

CurrentProject currentProject() {
    const std::lock_guard hold(projectState().mutex);
    return projectState().project;
}

void setCurrentProject(const CurrentProject& project) {
    const std::lock_guard hold(projectState().mutex);
    const bool isAnother = projectState().project.project != project.project ||
                           projectState().project.rootFolder != project.rootFolder;
    projectState().project = project;
    if (isAnother) {
        ++projectState().generation;
    }
}

unsigned currentProjectGeneration() {
    return projectState().generation.load();
}

} // namespace Qx
