#pragma once

#include "edit/editing/editor.h"
#include "edit/manager/edit_manager.h"
#include "platform/services/current_project.h"
#include "tests/support/cel_layout.h"
#include "tests/support/edit_state.h"
#include "tests/support/recording_log.h"
#include "tests/support/temporary_folder.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace test {

/// Channels drawn as text, in the order of the index: "E", "V" or "A", a blank, the content.
using Rows = std::vector<std::string>;

/// Adds drawn channels to an edit.
inline void addRows(Edit& edit, const Rows& rows) {
    for (const std::string& row : rows) {
        const bool effects = row[0] == 'E';
        const int index = edit.addChan(row[0] == 'A' ? AudioChan : VideoChan, nullptr, false,
                                       effects ? Edit_Chan_SubType::ALIAS : Edit_Chan_SubType::NONE);
        layout::build(*edit.get_edit_cel_p(index), std::string_view(row).substr(2));
    }
    edit.set_dirty(true);
}

/// 'E', 'V' or 'A' for each channel but the levels.
inline std::string kindsOf(const Edit& edit) {
    std::string kinds;
    for (int i = 0; i < edit.getNumChans() && edit.get_edit_cel_p(i) != nullptr; ++i) {
        const bool effects = edit.getChanSubtype(i) == Edit_Chan_SubType::ALIAS;
        kinds += effects ? 'E' : edit.getChanType(i) == AudioChan ? 'A' : 'V';
    }
    return kinds;
}

/// The channels of an edit but its levels, as `addRows` reads them.
inline Rows drawRows(const Edit& edit) {
    Rows rows;
    const std::string kinds = kindsOf(edit);
    for (size_t i = 0; i < kinds.size(); ++i) {
        rows.push_back(std::string(1, kinds[i]) + " " +
                       layout::draw(*edit.get_edit_cel_p(static_cast<int>(i))));
    }
    return rows;
}

/// An edit that no manager has, with drawn channels.
inline EditPtr editOf(const Rows& rows, int number = 900) {
    EditPtr edit(new Edit);
    edit->set_cookie(cookie(Cookie_Type::Edit, number, 3));
    addRows(*edit, rows);
    edit->set_dirty(false);
    return edit;
}

/// Marks in seconds; what is not given is not set.
struct Marks {
    double in = Qx::kNoTime;
    double out = Qx::kNoTime;
    double current = 0;
};

inline EditModule moduleOf(const EditPtr& edit, const Marks& marks) {
    EditModule module(edit);
    module.setCurTime(marks.current);
    module.markAllAt(marks.in, Qx::MarkTypes::InMark);
    module.markAllAt(marks.out, Qx::MarkTypes::OutMark);
    return module;
}

/// A project of 25 frames a second in a folder of its own, with a manager.
class EditingTest : public testing::Test {
protected:
    EditingTest() : m_before(Qx::currentProject()) {
        Qx::CurrentProject project;
        project.rootFolder = m_folder.path();
        project.name = "Editing";
        project.user = "editor";
        std::filesystem::create_directories(std::string(project.folder()));
        Qx::setCurrentProject(project);
        edit_manager::theEditManager(new edit_manager);
    }
    ~EditingTest() override {
        edit_manager::theEditManager(nullptr);
        Qx::setCurrentProject(m_before);
    }

    /// An edit of the project with drawn channels and nothing else.
    EditPtr make(const Rows& rows, int number = 100) {
        const cookie item(Cookie_Type::Edit, number, 3);
        EditPtr edit = edit_manager::openEdit(item, eOpenNew);
        edit->removeChans(false);
        addRows(*edit, rows);
        edit_manager::flush_changes();
        return edit;
    }
    static EditPtr clipboard() { return edit_manager::openEdit(clipboard_cookie, eOpenExisting); }
    TemporaryFolder& folder() { return m_folder; }

private:
    TemporaryFolder m_folder;
    RecordingLog m_log; ///< keeps the manager's lines out of the tests' output

    Qx::CurrentProject m_before;
};

} // namespace test
