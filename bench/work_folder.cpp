#include "bench/work_folder.h"

#include "platform/services/files.h"

#include <cstdio>
#include <cstdlib>
#include <filesystem>

namespace bench {

namespace {

class Folder {
public:
    Folder() {
        std::string form = (std::filesystem::current_path() / "bench-work.XXXXXX").string();
        if (::mkdtemp(form.data()) == nullptr) {
            std::fprintf(stderr, "No folder for the files of the measures can be made in %s\n",
                         std::filesystem::current_path().c_str());
            std::exit(1);
        }
        m_path = form;
    }
    ~Folder() {
        std::error_code ignored;
        std::filesystem::remove_all(m_path.c_str(), ignored);
    }
    Folder(const Folder&) = delete;
    Folder& operator=(const Folder&) = delete;
    [[nodiscard]] const String& path() const { return m_path; }

private:
    String m_path;
};

} // namespace

const String& workFolder() {
    static const Folder folder;
    return folder.path();
}

String workPath(const String& name) {
    return Qx::joinPath(workFolder(), name);
}

void settleDisk() {
    // Where that is refused the figures vary more.
    static_cast<void>(Qx::machineFileSystem().syncAll(workFolder()).code);
}

} // namespace bench
