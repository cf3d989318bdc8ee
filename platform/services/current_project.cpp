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

struct State {
    std::mutex mutex;
    CurrentProject project;
    std::atomic<unsigned> generation{1};

    State() { project.user = userOfProcess(); }
};

State& state() {
    static auto& shared = *new State;
    return shared;
}

} // namespace

String CurrentProject::folder() const {
    return rootFolder.empty() || !project.isStorable() ? String() : joinPath(rootFolder, project.asString());
}

CurrentProject currentProject() {
    const std::lock_guard hold(state().mutex);
    return state().project;
}

void setCurrentProject(const CurrentProject& project) {
    const std::lock_guard hold(state().mutex);
    const bool isAnother =
        state().project.project != project.project || state().project.rootFolder != project.rootFolder;
    state().project = project;
    if (isAnother) {
        ++state().generation;
    }
}

unsigned currentProjectGeneration() {
    return state().generation.load();
}

} // namespace Qx
