#pragma once

#include "edit_states.h"
#include "tests/support/run_program.h"

#include <string>
#include <vector>

/// qmedit on a project of a fixed kind.
namespace torture {

/// What meets a command on its way: see fault_shim.cpp.
struct Interference {
    size_t at = 0;            ///< the number of the call; 0 for none
    int error = 0;            ///< that it fails with
    int signal = 0;           ///< or that comes before it
    const char* mode = "one"; ///< "one", "rest" or "full"
    bool outputFull = false;  ///< standard output takes nothing
};

struct Met {
    test::ProgramResult result;
    std::string call; ///< the call that was met, with its path; empty if the command did not come to it
    size_t calls = 0; ///< how many there were; 0 if the command was killed
};

/// A folder with a project in it, fresh for every case: the edit "E1" with two undo backups and one redo
/// backup, a second edit, one whose file is damaged beside a sound backup, their shots, and a record.
///
/// In the arguments of a command "$1", "$2", "$3" stand for the three edits' cookies and "$D" for the folder.
class Workplace {
public:
    /// In an empty folder.
    explicit Workplace(std::string folder);

    Met run(const std::vector<std::string>& arguments, const Interference& interference = {}) const;
    [[nodiscard]] std::string folder() const { return m_folder; }
    /// The project's inner folder.
    [[nodiscard]] std::string project() const { return m_folder + "/project/P0001000"; }
    [[nodiscard]] ProjectStates states() const { return statesOf(project()); }
    [[nodiscard]] static std::string cookieOf(int edit);
    /// The path of an edit's file below the inner folder.
    [[nodiscard]] static std::string fileOf(int edit) { return cookieOf(edit) + ".qme"; }

    /// Makes what all of them are copied from. Called once, before the first, in the process of them all.
    static void prepare();

private:
    std::string m_folder;
};

} // namespace torture
