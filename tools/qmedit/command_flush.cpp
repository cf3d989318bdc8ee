#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/project_session.h"

#include "platform/services/files.h"

#include <memory>

namespace {

int runFlush(const String& project) {
    ProjectSession session(project);
    if (const Qx::Status opened = session.openExisting(); !opened) {
        return failed(opened);
    }
    session.manage();
    size_t total = 0;
    size_t percent = 101;
    const bool updated = edit_manager::update_projdb([&](size_t done, size_t of) {
        total = of;
        const size_t reached = of == 0 ? 100 : done * 100 / of;
        if (reached != percent) {
            percent = reached;
            showProgress(String::format("%zu of %zu edits", done, of));
        }
        return true;
    });
    showProgress("");
    const projdb* const records = updated ? edit_manager::get_projdb() : nullptr;
    if (records == nullptr || records->numRecords() < total) {
        return failed(Qx::Status::failure("the record " + Qx::joinPath(session.folder(), projdb::kFileName) +
                                          " could not be brought up to date; see whether the project can be "
                                          "written. No edit is concerned"));
    }
    writeOut(String::format("%zu edit%s recorded\n", total, total == 1 ? "" : "s"));
    return kDone;
}

} // namespace

Command flushCommand() {
    const auto project = std::make_shared<String>();
    return {"flush",
            "Bring the project's record of its edits up to date, or make it",
            {projectOption(*project)},
            "Example:\n  qmedit flush --project ~/feature\n\n"
            "The record (Project.db) makes listings of large projects quick. It is only a cache.",
            [project] { return runFlush(*project); }};
}
