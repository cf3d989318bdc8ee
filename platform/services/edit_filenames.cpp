#include "platform/services/edit_filenames.h"

#include "platform/services/current_project.h"
#include "platform/services/files.h"

String getEditFilenameExt(bool withDot) {
    return withDot ? ".qme" : "qme";
}

String getFilenameForCookie(const cookie& item) {
    if (!item.isStorable()) {
        return {};
    }
    const String folder = Qx::currentProject().folder();
    return folder.empty() ? String() : Qx::joinPath(folder, item.asString() + getEditFilenameExt());
}
