#include "tools/qmedit/project_session.h"

#include "edit/persist/edit_init.h"
#include "edit/project/project_details.h"
#include "interchange/edl_records.h"
#include "platform/services/current_project.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/files.h"
#include "tools/qmedit/console.h"

#include <cstdlib>

namespace {

constexpr cookie kUsualProject{Cookie_Type::Project, 1, 0};

Qx::FileKind kindOf(const String& path) {
    Qx::FileInfo info;
    return Qx::fileSystem().info(path, info) ? Qx::FileKind::Missing : info.kind;
}

/// A folder named by a project's cookie, with settings in it.
cookie projectOfFolder(const String& folder) {
    const cookie project(std::string_view(Qx::fileNameOf(folder)));
    const bool isProject = project.isStorable() && project.type() == Cookie_Type::Project &&
                           Qx::fileExists(Qx::joinPath(folder, "Project.txt"));
    return isProject ? project : invalid_cookie;
}

/// The project in a folder of projects: the usual one if it is there, else the only one.
cookie projectIn(const String& root) {
    std::vector<String> names;
    if (kindOf(Qx::joinPath(root, kUsualProject.asString())) != Qx::FileKind::Missing ||
        Qx::fileSystem().list(root, names)) {
        return kUsualProject;
    }
    cookie found;
    for (const String& name : names) {
        if (const cookie project = projectOfFolder(Qx::joinPath(root, name)); project.is_valid()) {
            if (found.is_valid()) {
                return kUsualProject;
            }
            found = project;
        }
    }
    return found.is_valid() ? found : kUsualProject;
}

/// Why an edit file cannot be read, and where its newest backup is if it has one.
Qx::Status damage(const String& path, const String& reason) {
    String text = (reason.find(path) == String::npos ? path + ": " : String()) + reason;
    const String backup = path + ".U1";
    if (Qx::fileExists(backup)) {
        text += "; its newest backup is " + backup;
    }
    return Qx::Status::failure(std::move(text));
}

} // namespace

ProjectSession::ProjectSession(const String& option) : m_root(option), m_project(kUsualProject) {
    const char* environment = std::getenv("QMEDIT_PROJECT");
    if (m_root.empty()) {
        m_root = environment != nullptr && *environment != '\0' ? environment : "./quillmarch-project";
    }
    while (m_root.size() > 1 && m_root.back() == '/') {
        m_root.pop_back();
    }
    if (const cookie itself = projectOfFolder(m_root); itself.is_valid()) {
        m_project = itself;
        m_root = Qx::folderOf(m_root);
    } else {
        m_project = projectIn(m_root);
    }
}

String ProjectSession::folder() const {
    return Qx::joinPath(m_root, m_project.asString());
}

bool ProjectSession::exists() const {
    Qx::FileInfo info;
    return !Qx::fileSystem().info(folder() + "/.", info) && info.kind == Qx::FileKind::Folder;
}

void ProjectSession::makeCurrentUnwritten(Qx::FrameRate rate) const {
    Qx::CurrentProject current = Qx::currentProject();
    current.project = m_project;
    current.rootFolder = m_root;
    current.frameRateCode = rate.valid() ? rate.code() : static_cast<int>(Qx::FrameRate::Fps25);
    Qx::setCurrentProject(current);
}

Qx::Status ProjectSession::openExisting() {
    if (!exists()) {
        return Qx::Status::failure(
            "there is no project in " + m_root +
            "; name another with --project DIR, or make one with 'qmedit import FILE'");
    }
    // Settings that are not there are not written by reading.
    if (!Qx::fileExists(Qx::joinPath(folder(), "Project.txt"))) {
        makeCurrentUnwritten({});
        return {};
    }
    ProjectDetails details;
    if (const Qx::Status opened = ProjectDetails::openOrCreate(m_root, m_project, {}, details); !opened) {
        // The edits are there all the same. What writes asks again, and fails, in `create`.
        reportWarning(opened.reason() + "; the usual settings are taken");
        makeCurrentUnwritten({});
        return {};
    }
    details.makeCurrent();
    return {};
}

Qx::Status ProjectSession::prepare(Qx::FrameRate rateOfFresh) {
    if (exists()) {
        return openExisting();
    }
    m_rateOfFresh = rateOfFresh;
    makeCurrentUnwritten(rateOfFresh);
    return {};
}

Qx::Status ProjectSession::create() {
    ProjectDetails defaults;
    defaults.name = Qx::fileNameOf(m_root);
    if (!Qx::isUtf8(defaults.name)) {
        defaults.name.clear();
    }
    if (m_rateOfFresh.valid()) {
        defaults.frameRateCode = m_rateOfFresh.code();
    }
    ProjectDetails details;
    if (Qx::Status opened = ProjectDetails::openOrCreate(m_root, m_project, defaults, details); !opened) {
        return opened;
    }
    details.makeCurrent();
    if (const Qx::Status started = edit_init(); !started) {
        reportWarning(started.reason());
    }
    return {};
}

Qx::Status ProjectSession::readEdit(const cookie& item, EditPtr& edit) const {
    const String path = getFilenameForCookie(item);
    if (kindOf(path) == Qx::FileKind::Missing) {
        return Qx::Status::failure("there is no edit " + item.asString() + " in the project " + m_root +
                                   "; 'qmedit list' shows those there are");
    }
    EditPtr read(new Edit);
    if (read->read_file(item, eOpenExisting) != Edit::kReadOk) {
        return damage(path, read->lastFileError());
    }
    edit = read;
    return {};
}

ListedEdit ProjectSession::listed(const cookie& item) const {
    ListedEdit entry;
    entry.item = item;
    EditPtr edit(new Edit);
    if (edit->read_file(item, eOpenExisting) != Edit::kReadOk) {
        const String& reason = edit->lastFileError();
        entry.damage = reason.empty() ? String("cannot be read") : reason;
        return entry;
    }
    entry.type = Edit::log_type_string_get_ms(edit->get_log_type());
    entry.name = edit->getName();
    entry.rate = edit->getFrameRate();
    entry.duration = edit->getEndTime() - edit->getStartTime();
    entry.channels = edit->getNumChans();
    entry.modified = edit->getModificationTime();
    return entry;
}

Qx::Status ProjectSession::list(std::vector<ListedEdit>& edits, std::vector<String>& others) const {
    std::vector<String> names;
    if (const Qx::FileError error = Qx::fileSystem().list(folder(), names); error) {
        return Qx::Status::failure(error.text());
    }
    for (const String& name : names) {
        if (Qx::extensionOf(name) != getEditFilenameExt()) {
            continue;
        }
        const cookie item(std::string_view(Qx::withoutExtension(name)));
        if (item.isStorable()) {
            edits.push_back(listed(item));
        } else {
            others.push_back(name);
        }
    }
    return {};
}

SourceNamer ProjectSession::sourceNamer() {
    return [this](SourceReport& source) {
        const auto [place, added] = m_known.try_emplace(source.strip);
        if (added) {
            place->second = look(source.strip);
        }
        source.name = place->second.name;
        source.problem = place->second.problem;
        if (source.problem.empty()) {
            source.dropFrame = place->second.dropFrame;
        }
    };
}

ProjectSession::Known ProjectSession::look(const cookie& item) const {
    EditPtr edit;
    if (const Qx::Status read = readEdit(item, edit); !read) {
        return {{}, read.reason(), false};
    }
    const bool dropFrame = std::as_const(*edit).Opts().getBool(interchange::EdlKey::kDropFrame);
    return {edit->getName(), {}, dropFrame && edit->getFrameRate().hasDropFrame()};
}
