#include "edit/manager/folder_names.h"

#include "platform/services/files.h"

Qx::Status namesOfFolder(const String& folder, FolderLink link, std::vector<String>& names) {
    names.clear();
    // The dot makes the system follow a link.
    const String asked = folder + (link == FolderLink::Followed ? "/." : "");
    const Qx::FileAnswer found = Qx::askFile(asked);
    Qx::FileError error = found.isUnknown() ? found.obstacle("list") : Qx::FileError();
    if (found.isFolder()) {
        error = Qx::retryInterrupted([&] { return Qx::fileSystem().list(folder, names); });
    }
    if (error && !Qx::askFile(asked).isMissing()) {
        names.clear();
        return Qx::Status::failure(error.text());
    }
    return {};
}
