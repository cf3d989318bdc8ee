#include "edit/project/detail/project_files.h"

#include "platform/services/atomic_batch.h"
#include "platform/store/text_file.h"

namespace Qx::detail {

configb emptySettings() {
    return configb("PROJECT", "END_PROJECT");
}

String settingsPath(const String& folder) {
    return joinPath(folder, "Project.txt");
}

String lockPath(const String& folder) {
    return joinPath(folder, "Project.lock");
}

Status readStore(const String& path, configb& store, bool& found) {
    found = false;
    const FileAnswer present = askFile(path);
    if (auto error = present.obstacle("read")) {
        return Status::failure(error.text());
    }
    if (present.isMissing()) {
        return {};
    }
    TextFile file;
    if (auto loaded = file.load(path, kProjectTextLimit); !loaded) {
        return loaded;
    }
    unsigned after = 0;
    if (auto built = store.buildFrom(file, 0, after); !built) {
        return Status::failure(path + ": " + built.reason());
    }
    found = true;
    return {};
}

Status writeStore(const String& path, const configb& store) {
    TextFile file;
    store.writeTo(file);
    const AtomicBatch::Pause pause;
    return file.save(path);
}

Status readNextEditNumber(const configb& settings, const String& path, int& number) {
    const int next = settings.getInt(kNextEditKey, settings.contains(kNextEditKey) ? 0 : 1);
    if (next < 1 || next > kLastEditNumber + 1) {
        return Status::failure(String::format(
            "%s: %s must be a whole number from 1 to %d; set it above every edit of the project",
            path.c_str(), kNextEditKey, kLastEditNumber + 1));
    }
    number = next;
    return {};
}

} // namespace Qx::detail
