#include "bench/projects.h"

#include "bench/work_folder.h"
#include "edit/manager/edit_manager.h"
#include "edit/model/cel.h"
#include "edit/project/cookie_allocator.h"
#include "platform/services/atomic_batch.h"
#include "platform/services/current_project.h"
#include "platform/services/files.h"

#include <cstdio>
#include <cstdlib>

namespace bench {

namespace {

constexpr unsigned kNumMany = 10000;

cookie projectItem(Project project) {
    return {Cookie_Type::Project, project == Project::Few ? 1 : 2, 0};
}

[[noreturn]] void giveUp(const char* what) {
    std::fprintf(stderr, "The project of the measures could not be made: %s\n", what);
    std::exit(1);
}

/// Writes the edits in one batch, without the manager: making them is not what is measured.
std::vector<cookie> makeMany() {
    CookieVec items;
    CookieAllocator allocator(folderOf(Project::Many));
    if (!allocator.allocate(kNumMany, items)) {
        giveUp("no items could be had");
    }
    Qx::AtomicBatch batch;
    for (const cookie& item : items) {
        Edit edit;
        edit.set_cookie(item);
        edit.setName(item.asString());
        cel* const content = edit.get_edit_cel_p(edit.addChan(VideoChan, nullptr, false));
        content->appendEventPair(cookie(Cookie_Type::Video, 1, 0), 0, 0, 5);
        edit.set_dirty(true);
        if (!edit.write_file()) {
            giveUp(edit.lastFileError().c_str());
        }
    }
    if (batch.commit()) {
        giveUp("the batch was refused");
    }
    return {items.begin(), items.end()};
}

const std::vector<cookie>& itemsMadeOnce() {
    static const std::vector<cookie> items = makeMany();
    return items;
}

} // namespace

String projectsFolder() {
    return workPath("projects");
}

String folderOf(Project project) {
    return Qx::joinPath(projectsFolder(), projectItem(project).asString());
}

void enterProject(Project project) {
    if (edit_manager::theEditManager() == nullptr) {
        Qx::CurrentProject settings;
        settings.rootFolder = projectsFolder();
        settings.user = "bench";
        settings.project = invalid_cookie;
        if (Qx::makeFolders(settings.rootFolder)) {
            giveUp("no folder could be made");
        }
        Qx::setCurrentProject(settings);
        edit_manager::theEditManager(new edit_manager);
    }
    const cookie item = projectItem(project);
    if (edit_manager::get_current_project_cookie() != item &&
        edit_manager::set_current_project(item, eOpenOrCreate) != eStatus::Ok) {
        giveUp("it could not be entered");
    }
    if (project == Project::Many) {
        static_cast<void>(itemsMadeOnce());
    }
}

const std::vector<cookie>& manyItems() {
    enterProject(Project::Many);
    return itemsMadeOnce();
}

} // namespace bench
