#pragma once

#include "torture.h"

#include "platform/base/cookie.h"

#include <functional>
#include <set>
#include <vector>

/// Steps of the manager on one edit, and what is promised after each. A state of the edit is known by its
/// name.
namespace torture {

/// What undo, the edit and redo hold. Equal neighbours count once: a backup of an unchanged edit is no new
/// state.
struct Revisions {
    String current;           ///< empty when there is no edit
    std::vector<String> undo; ///< nearest first
    std::vector<String> redo; ///< nearest first

    /// From the furthest undo to the furthest redo.
    [[nodiscard]] std::vector<String> inOrder() const;
    [[nodiscard]] std::set<String> all() const;
    [[nodiscard]] String text() const;
};

/// One step: its name, and what it does to the manager (true if it answers true).
struct Step {
    const char* name;
    bool (*perform)(const String& fresh);
    /// What is promised once it has answered true; false if the step does not fit.
    bool (*promise)(Revisions& revisions, const String& fresh);
    /// False for a step that leaves a project, which has no answer that would tell of what could not be
    /// written.
    bool tells = true;
};

/// The edit that the steps are made on.
inline const cookie kItem("E0001000");
/// Two others, which the step "batch" writes together.
inline const cookie kBatch[] = {cookie("E0002000"), cookie("E0003000")};

extern const std::vector<Step> kSteps;

/// A step that fits the revisions.
const Step& stepFor(Case& its, const Revisions& revisions);

/// Changes the edit, made when it is not there, as a user does: its name, under its section. False if it does
/// not open.
bool changeName(const String& fresh, const cookie& item = kItem);

/// The name of an edit as it opens; empty when it does not.
String nameOf(const cookie& item);

/// What a manager that has just started finds: the edit first, then by undoing and redoing as far as it goes.
Revisions foundByManager();

} // namespace torture
