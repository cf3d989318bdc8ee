#include "edit/manager/session.h"

#include "edit/persist/edit_init.h"
#include "platform/services/current_project.h"
#include "platform/services/files.h"
#include "platform/services/log.h"

#include <thread>

namespace {

constexpr cookie kUsualProject{Cookie_Type::Project, 1, 0};
constexpr const char* kSettings = "Project.txt";

/// The project that a folder is named by, with settings in it; invalid if it is none. A failure if the
/// system could not tell.
Qx::Status projectOfFolder(const String& folder, cookie& project) {
    project = invalid_cookie;
    const cookie named(std::string_view(Qx::fileNameOf(folder)));
    if (!named.isStorable() || named.type() != Cookie_Type::Project) {
        return {};
    }
    const Qx::FileAnswer settings = Qx::askFile(Qx::joinPath(folder, kSettings));
    project = settings.isRegular() ? named : invalid_cookie;
    return settings.isUnknown() ? settings.obstacle().status() : Qx::Status();
}

/// The project in a folder of projects: the usual one if it is there, else the only one. A failure if the
/// system could not tell what is there.
Qx::Status projectIn(const String& root, cookie& project) {
    project = kUsualProject;
    const Qx::FileAnswer usual = Qx::askFile(Qx::joinPath(root, kUsualProject.asString()));
    if (!usual.isMissing()) {
        return usual.isUnknown() ? usual.obstacle().status() : Qx::Status();
    }
    std::vector<String> names;
    if (const Qx::FileError error = Qx::fileSystem().list(root, names)) {
        const bool isNone = error.code == ENOENT || error.code == ENOTDIR;
        return isNone ? Qx::Status() : error.status();
    }
    cookie found;
    for (const String& name : names) {
        cookie its;
        if (Qx::Status status = projectOfFolder(Qx::joinPath(root, name), its); !status) {
            return status;
        }
        if (its.is_valid()) {
            if (found.is_valid()) {
                return {};
            }
            found = its;
        }
    }
    project = found.is_valid() ? found : kUsualProject;
    return {};
}

/// One sentence on edits that are not on the disk.
Qx::Status failureOf(const Vector<UnwrittenEdit>& unwritten) {
    if (unwritten.empty()) {
        return Qx::Status::failure("not everything could be written; see the log");
    }
    String text;
    for (const UnwrittenEdit& edit : unwritten) {
        text += (text.empty() ? String() : String("; ")) + edit.item.asString() + " could not be written";
        if (!edit.why) {
            text += ": " + edit.why.reason();
        }
    }
    const Qx::Status& first = unwritten.front().why;
    return first ? Qx::Status::failure(std::move(text)) : first.retold(std::move(text));
}

} // namespace

Session::Session(const String& folder) : m_root(folder) {
    while (m_root.size() > 1 && m_root.back() == '/') {
        m_root.pop_back();
    }
    m_found = projectOfFolder(m_root, m_project);
    if (m_project.is_valid()) {
        m_root = Qx::folderOf(m_root);
    } else if (const Qx::Status found = projectIn(m_root, m_project); m_found) {
        m_found = found;
    }
}

Session::~Session() {
    Vector<UnwrittenEdit> lost; // told of on the log
    closeAnyway(lost);
}

String Session::folder() const {
    return Qx::joinPath(m_root, m_project.asString());
}

bool Session::exists() const {
    return Qx::askFile(folder() + "/.").isFolder();
}

Qx::Status Session::open(const SessionOptions& options) {
    if (!m_found) {
        return m_found;
    }
    if (options.behaviour == eOpenNew && exists()) {
        return Qx::Status::failure(Qx::StatusCode::BadArgument,
                                   "there is a project in " + m_root +
                                       " already; open it, or name another folder");
    }
    if (Qx::Status used = options.behaviour == eOpenExisting ? useExisting() : make(options.forNew); !used) {
        return used;
    }
    if (!options.user.empty()) {
        Qx::CurrentProject current = Qx::currentProject();
        current.user = options.user;
        Qx::setCurrentProject(current);
    }
    if (options.behaviour != eOpenExisting) {
        if (const Qx::Status started = edit_init(); !started) {
            herc_printf("Session::open: %s\n", started.reason().c_str());
        }
    }
    manage();
    m_isOpen = true;
    return {};
}

Qx::Status Session::useExisting() {
    if (!exists()) {
        return Qx::Status::failure(Qx::StatusCode::NotFound, "there is no project in " + m_root);
    }
    // Settings that are not there are not written by reading.
    if (Qx::askFile(Qx::joinPath(folder(), kSettings)).isMissing()) {
        useUnwritten({});
        return {};
    }
    ProjectDetails details;
    Qx::Status opened = ProjectDetails::openOrCreate(m_root, m_project, {}, details);
    if (opened) {
        details.makeCurrent();
    }
    return opened;
}

void Session::useUnwritten(const ProjectDetails& settings) {
    Qx::CurrentProject current = Qx::currentProject();
    current.project = m_project;
    current.rootFolder = m_root;
    current.name = settings.name;
    current.frameRateCode = settings.frameRateCode;
    current.dropFrame = settings.dropFrame;
    current.defaultEditMedium = settings.defaultEditMedium;
    Qx::setCurrentProject(current);
}

Qx::Status Session::make(const ProjectDetails& forNew) {
    ProjectDetails defaults = forNew;
    if (const String name = Qx::fileNameOf(m_root); defaults.name.empty() && Qx::isUtf8(name)) {
        defaults.name = name;
    }
    ProjectDetails details;
    Qx::Status made = ProjectDetails::openOrCreate(m_root, m_project, defaults, details);
    if (made) {
        details.makeCurrent();
    }
    return made;
}

void Session::manage() {
    if (edit_manager::theEditManager() == nullptr) {
        m_manager = new edit_manager;
    } else {
        static_cast<void>(edit_manager::check_current_project(eOpenExisting));
    }
}

Qx::Status Session::lockForWriting(std::chrono::milliseconds patience) {
    using Clock = std::chrono::steady_clock;
    constexpr std::chrono::milliseconds kPause{20};
    const Clock::time_point end = Clock::now() + patience;
    m_writers = std::make_unique<EditManagerLock>(folder());
    Qx::Status taken = m_writers->take();
    while (taken.code() == Qx::StatusCode::Locked && Clock::now() < end) {
        std::this_thread::sleep_for(kPause);
        taken = m_writers->take();
    }
    return taken;
}

void Session::listen(NotifyMsgType type, Notifier::Listener listener) {
    m_listening.push_back(edit_manager::registerNotification(type, std::move(listener)));
}

void Session::follow(const EditPtr& edit, ValServer<EditModification>::Listener listener) {
    if (edit.valid()) {
        m_listening.push_back(edit->getChangeDescriptionServer().addListener(std::move(listener)));
    }
}

Qx::Status Session::close() {
    Vector<UnwrittenEdit> unwritten;
    return close(unwritten);
}

Qx::Status Session::close(Vector<UnwrittenEdit>& unwritten) {
    unwritten.clear();
    if (m_isOpen && !edit_manager::flush_changes()) {
        unwritten = edit_manager::unwrittenEdits();
        return failureOf(unwritten);
    }
    // An edit without changes may still want its file back, which a backup took.
    closeAnyway(unwritten);
    return unwritten.empty() ? Qx::Status() : failureOf(unwritten);
}

void Session::closeAnyway(Vector<UnwrittenEdit>& lost) {
    if (m_isOpen) {
        edit_manager::exitProject(lost);
    }
    letGo();
}

void Session::letGo() {
    m_isOpen = false;
    if (m_manager != nullptr && edit_manager::theEditManager() == m_manager) {
        edit_manager::theEditManager(nullptr);
    }
    m_manager = nullptr;
    // Heard to the end: what is closed is told of.
    m_listening.clear();
    m_writers.reset();
}
