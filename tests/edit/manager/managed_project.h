#pragma once

#include "edit/manager/edit_manager.h"
#include "platform/services/current_project.h"
#include "tests/support/recording_log.h"
#include "tests/support/temporary_folder.h"

#include <filesystem>

namespace test {

inline const cookie kEdit("E0001000");

/// A project in a fresh folder with a manager, as the application has one, and a log that is kept.
class ManagedProject {
public:
    explicit ManagedProject(bool withManager = true) {
        Qx::CurrentProject project;
        project.rootFolder = m_root.path();
        project.user = "anna";
        project.name = "Feature";
        std::filesystem::create_directory(std::filesystem::path(project.folder()));
        Qx::setCurrentProject(project);
        if (withManager) {
            startManager();
        }
    }
    ~ManagedProject() {
        stopManager();
        Qx::setCurrentProject({});
    }
    ManagedProject(const ManagedProject&) = delete;
    ManagedProject& operator=(const ManagedProject&) = delete;

    static void startManager() { new edit_manager; }
    static void stopManager() { edit_manager::theEditManager(nullptr); }

    [[nodiscard]] String folder() const { return m_root.path("P0001000"); }
    [[nodiscard]] const TemporaryFolder& root() const { return m_root; }
    /// The bytes of a name in the project's folder; "(missing)" without it.
    [[nodiscard]] std::string read(const std::string& name) const { return m_root.read("P0001000/" + name); }
    void write(const std::string& name, const std::string& bytes) const {
        m_root.write("P0001000/" + name, bytes);
    }
    [[nodiscard]] bool has(const std::string& name) const { return read(name) != "(missing)"; }
    RecordingLog log;

    /// Changes an edit (made when it is not there) as a user does: its name, under its section.
    static void change(const String& name, const cookie& item = kEdit) {
        const EditPtr edit(item, eOpenOrCreate);
        const std::lock_guard<criticalSection> hold(edit->section());
        edit->setName(name);
    }
    /// Changes an edit and writes it.
    static bool save(const String& name, const cookie& item = kEdit) {
        change(name, item);
        return edit_manager::flush_edit(item);
    }
    /// The name that an edit has; "(null)" when it does not open.
    [[nodiscard]] static String nameOf(const cookie& item = kEdit) {
        const EditPtr edit(item, eOpenExisting);
        return edit.valid() ? edit->getName() : String("(null)");
    }

private:
    TemporaryFolder m_root;
};

} // namespace test
