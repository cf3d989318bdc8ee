#pragma once

#include "interchange/export.h"
#include "platform/base/qx_string.h"

#include <vector>

namespace interchange {

/// One thing that could not be carried over, or that was odd, and where.
struct Loss {
    int line = 0; ///< line of the file, from 1; 0 for the file as a whole
    String what;
    bool operator==(const Loss&) const = default;
};

/// What an import or export reports besides its result. A loss is something that the other side cannot hold;
/// a warning is something that was read by a guess or that its author should look at; a note tells of what is
/// kept, in another form; an error is why a line cannot be read, where several are told of at once. Not
/// thread-safe.
class QM_INTERCHANGE_API LossReport {
public:
    /// The name that stands before each line.
    void setFile(String name) { m_file = std::move(name); }
    [[nodiscard]] const String& file() const { return m_file; }

    void addLoss(int line, String what) { m_losses.push_back({line, std::move(what)}); }
    void addWarning(int line, String what) { m_warnings.push_back({line, std::move(what)}); }
    void addNote(int line, String what) { m_notes.push_back({line, std::move(what)}); }
    void addError(int line, String what) { m_errors.push_back({line, std::move(what)}); }
    [[nodiscard]] const std::vector<Loss>& losses() const { return m_losses; }
    [[nodiscard]] const std::vector<Loss>& warnings() const { return m_warnings; }
    [[nodiscard]] const std::vector<Loss>& notes() const { return m_notes; }
    [[nodiscard]] const std::vector<Loss>& errors() const { return m_errors; }

    /// Everything as lines in the file's order: "cut.edl:12: loss: a dissolve of 24 frames became a cut",
    /// "cut.edl:14: warning: ...".
    [[nodiscard]] std::vector<String> lines() const;

private:
    String m_file;
    std::vector<Loss> m_losses;
    std::vector<Loss> m_warnings;
    std::vector<Loss> m_notes;
    std::vector<Loss> m_errors;
};

} // namespace interchange
