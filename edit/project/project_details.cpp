#include "edit/project/project_details.h"

#include "edit/project/detail/project_files.h"
#include "platform/media/frame_rate.h"
#include "platform/services/current_project.h"

#include <algorithm>

using namespace Qx::detail;

namespace {

constexpr const char* kNameKey = "PROJECT_NAME";
constexpr const char* kRateKey = "PROJECT_RATE";
constexpr const char* kDropFrameKey = "DROP_FRAME";
constexpr const char* kMediumKey = "DEFAULT_MEDIUM";

} // namespace

Qx::Status ProjectDetails::check() const {
    if (!Qx::isUtf8(name)) {
        return Qx::Status::failure(Qx::StatusCode::BadArgument, "the project's name is not UTF-8 text");
    }
    const Qx::FrameRate rate(frameRateCode);
    if (!rate.valid()) {
        return Qx::Status::failure(Qx::StatusCode::BadArgument,
                                   String::format("%d is not the code of a frame rate", frameRateCode));
    }
    if (dropFrame && !rate.hasDropFrame()) {
        return Qx::Status::failure(Qx::StatusCode::BadArgument,
                                   "there is no drop frame at " + rate.asString() +
                                       " frames a second; use 29.97 or 59.94, or no drop frame");
    }
    if (defaultEditMedium < 0) {
        return Qx::Status::failure(Qx::StatusCode::BadArgument,
                                   String::format("%d is not the code of a medium", defaultEditMedium));
    }
    return {};
}

Qx::Status ProjectDetails::takeFrom(const configb& settings, const String& path) {
    ProjectDetails read = *this;
    read.name = settings.getString(kNameKey, name);
    read.frameRateCode = settings.getInt(kRateKey, frameRateCode);
    read.dropFrame = settings.getBool(kDropFrameKey, dropFrame);
    read.defaultEditMedium = settings.getInt(kMediumKey, defaultEditMedium);
    if (auto status = readNextEditNumber(settings, path, read.m_nextEditNumber); !status) {
        return status;
    }
    if (auto status = read.check(); !status) {
        return Qx::Status::failure(Qx::StatusCode::Damaged, path + ": " + status.reason());
    }
    *this = read;
    return {};
}

void ProjectDetails::giveTo(configb& settings) const {
    settings.setString(kNameKey, name);
    settings.setInt(kRateKey, frameRateCode);
    settings.setBool(kDropFrameKey, dropFrame);
    settings.setInt(kMediumKey, defaultEditMedium);
    // A count that nothing was taken from is none: there may be edits whose count was lost.
    if (m_nextEditNumber > 1 || settings.contains(kNextEditKey)) {
        settings.setInt(kNextEditKey, m_nextEditNumber);
    }
}

Qx::Status ProjectDetails::openOrCreate(const String& rootFolder, const cookie& project,
                                        const ProjectDetails& defaultsForNew, ProjectDetails& out) {
    if (rootFolder.empty()) {
        return Qx::Status::failure(Qx::StatusCode::BadArgument, "no folder is given for the projects");
    }
    if (project.type() != Cookie_Type::Project || !project.isStorable()) {
        return Qx::Status::failure(Qx::StatusCode::BadArgument,
                                   project.asString() + " does not name a project (as P0001000 does)");
    }
    ProjectDetails details = defaultsForNew;
    details.m_rootFolder = rootFolder;
    details.m_project = project;
    details.m_nextEditNumber = 1;
    const String path = settingsPath(details.folder());

    configb settings = emptySettings();
    bool found = false;
    if (auto status = readStore(path, settings, found); !status) {
        return status;
    }
    if (found) {
        auto status = details.takeFrom(settings, path);
        if (status) {
            out = details;
        }
        return status;
    }
    if (auto status = details.check(); !status) {
        return status;
    }
    if (auto error = Qx::makeFolders(details.folder())) {
        return error.status();
    }
    auto status = details.save();
    if (status) {
        out = details;
    }
    return status;
}

Qx::Status ProjectDetails::save() {
    if (m_rootFolder.empty()) {
        return Qx::Status::failure(Qx::StatusCode::BadArgument,
                                   "the project was not opened, so there is no file to save its settings in");
    }
    if (auto status = check(); !status) {
        return status;
    }
    Qx::FileLock lock(lockPath(folder()));
    if (auto status = lock.take(); !status) {
        return status;
    }
    const String path = settingsPath(folder());
    configb settings = emptySettings();
    bool found = false;
    int next = 1;
    if (auto status = readStore(path, settings, found); !status) {
        return status;
    }
    if (auto status = readNextEditNumber(settings, path, next); !status) {
        return status;
    }
    ProjectDetails saved = *this;
    saved.m_nextEditNumber = std::max(next, m_nextEditNumber);
    const configb before = settings;
    saved.giveTo(settings);
    if (!found || !(settings == before)) {
        if (auto status = writeStore(path, settings); !status) {
            return status;
        }
    }
    m_nextEditNumber = saved.m_nextEditNumber;
    return {};
}

void ProjectDetails::makeCurrent() const {
    Qx::CurrentProject current = Qx::currentProject();
    current.project = m_project;
    current.rootFolder = m_rootFolder;
    current.name = name;
    current.frameRateCode = frameRateCode;
    current.dropFrame = dropFrame;
    current.defaultEditMedium = defaultEditMedium;
    Qx::setCurrentProject(current);
}

String ProjectDetails::folder() const {
    return m_rootFolder.empty() ? String() : Qx::joinPath(m_rootFolder, m_project.asString());
}
