#pragma once

#include "platform/base/cookie.h"
#include "platform/base/export.h"
#include "platform/base/status.h"
#include "platform/store/configb.h"

/// The settings of a project, kept in the file "Project.txt" of the project's folder in the text form of a
/// `configb` (name "PROJECT", end marker "END_PROJECT"):
///
///     PROJECT_NAME:string  PROJECT_RATE:int  DROP_FRAME:bool  DEFAULT_MEDIUM:int  NEXT_EDIT:int
///
/// Keys that this version does not know are kept and written back. The file changes under the lock of the
/// project's folder ("Project.lock"), so that any number of processes may share a project. A plain value; one
/// object is used on one thread at a time.
class QM_API ProjectDetails {
public:
    ProjectDetails() = default;

    String name;               ///< for people, UTF-8
    int frameRateCode = 3;     ///< a `Qx::FrameRate` code; 3 is 25 frames a second
    bool dropFrame = false;    ///< timecode display; only for the rates that have drop frame
    int defaultEditMedium = 1; ///< the medium code that a new edit gets

    /// Reads the settings of a project, or makes the project (its folder and file) from `defaultsForNew` when
    /// there is none. Settings that the file lacks are taken from there too. An existing file is only read,
    /// so a project on a write-protected disk opens.
    ///
    /// Fails, leaving `out` and the disk as they were, for a project cookie that is not of kind 'P' or not
    /// storable, an empty root folder, a folder that cannot be made, a file that cannot be read (its line is
    /// named) and settings out of range.
    static Qx::Status openOrCreate(const String& rootFolder, const cookie& project,
                                   const ProjectDetails& defaultsForNew, ProjectDetails& out);

    /// Writes the settings. The next edit number of the file is never set back: the greater one stays. Fails,
    /// leaving the file as it was, for settings out of range or a file that cannot be written.
    Qx::Status save();

    /// Makes this the current project (`Qx::setCurrentProject`). The current user and output image rate stay.
    void makeCurrent() const;

    [[nodiscard]] const cookie& project() const { return m_project; }
    [[nodiscard]] const String& rootFolder() const { return m_rootFolder; }
    /// The folder that holds the project's files; empty before `openOrCreate`.
    [[nodiscard]] String folder() const;
    /// The first word of the next edit's cookie, from 1, as it was when the file was last read or written
    /// here. `CookieAllocator` moves it on in the file.
    [[nodiscard]] int nextEditNumber() const { return m_nextEditNumber; }

private:
    Qx::Status check() const;
    Qx::Status takeFrom(const configb& settings, const String& path);
    void giveTo(configb& settings) const;

    String m_rootFolder;
    cookie m_project;
    int m_nextEditNumber = 1;
};
