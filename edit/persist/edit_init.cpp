#include "edit/persist/edit_init.h"

#include "edit/persist/revision_history.h"
#include "platform/services/current_project.h"
#include "platform/services/files.h"
#include "platform/store/configb.h"
#include "platform/store/text_file.h"

std::span<const EditRevision> editRevisionHistory() {
    static constexpr EditRevision kHistory[] = {
        {310, "Track sound levels are now saved in edits"},
        {400, "Logs are saved in a more efficient format"},
        {401, "Fusion/Combustion effects are stored differently"},
        {501, "Change MediumRollIdents/frame-origins/pulldown"},
        {502, "Add source format details"},
        {503, "Add inter-project-invarient shot length"},
        {504, "Add compression-format"},
        {600, "Added moveable wipes"},
        {601, "Track groups can be stereoscopic"},
        {602, "Added stereoscopic effects"},
    };
    return kHistory;
}

Qx::Status edit_init() {
    const String root = Qx::currentProject().rootFolder;
    if (root.empty()) {
        return {};
    }
    configb versions("VERSION", "END_VERSION");
    versions.setString("Version", "11.1.0.0");
    versions.setString("CosmeticVersion", "Quillmarch 11.1");
    versions.setInt("EditRevision", kCurrentEditRevision);
    for (const EditRevision& row : editRevisionHistory()) {
        versions.setString("History" + std::to_string(row.revision), row.description);
    }
    TextFile file;
    versions.writeTo(file);
    return file.save(Qx::joinPath(root, "Last.Version.Used.txt"));
}
