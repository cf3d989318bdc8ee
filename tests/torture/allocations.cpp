// Every allocation of a step of the manager fails once.

#include "revision_model.h"
#include "torture.h"

#include "edit/manager/edit_manager.h"
#include "tests/edit/manager/managed_project.h"

#include "tests/support/memory_meter.h"

#include <new>

namespace torture {

namespace {

using test::ManagedProject;

/// Performs a step with an allocation that fails. True if it answered true.
bool performFailing(const Step& step, const String& fresh, size_t at, bool& ran) {
    bool done = false;
    const test::FailingAllocation failing(at);
    try {
        done = step.perform(fresh);
    } catch (const std::bad_alloc&) {
        // May come out; what it leaves is looked at.
    }
    ran = failing.cameToIt();
    return done;
}

/// The edit as a manager finds it that knows nothing of this one.
Revisions foundAnew() {
    ManagedProject::stopManager();
    ManagedProject::startManager();
    return foundByManager();
}

void run(Case& its) {
    const ManagedProject project;
    Revisions revisions;
    for (const char* name : {"a", "b", "c"}) {
        const bool first = !revisions.current.empty();
        kSteps[first ? 1 : 0].perform(name);
        kSteps[first ? 1 : 0].promise(revisions, name);
    }
    if (its.chance(2)) {
        edit_manager::undoRequest(kItem);
        kSteps[4].promise(revisions, "");
    }
    if (its.chance(2)) {
        // Nothing is in memory: the step opens the edit.
        ManagedProject::stopManager();
        ManagedProject::startManager();
    }
    const Step& step = stepFor(its, revisions);
    Revisions after = revisions;
    step.promise(after, "new");
    bool ran = false;
    const size_t at = 1 + its.below(its.chance(2) ? 400 : 60);
    const bool done = performFailing(step, "new", at, ran);
    if (!ran) {
        return;
    }
    const String where = String(" after a failed allocation in ") + step.name;
    const String seen = String::format("allocation %zu, answer %d, before ", at, done ? 1 : 0) +
                        revisions.text() + ", after " + after.text();

    // A later save must work, and be true.
    const String held = nameOf(kItem);
    const bool known = held == revisions.current || held == after.current || held == "new";
    its.expect(known, "the edit in memory is neither old nor new" + where, seen + ", is " + held);
    its.expect(!done || held == after.current, "the edit is not what was answered" + where,
               seen + ", is " + held);
    const bool later = its.chance(2) && changeName("later");
    its.expect(edit_manager::flush_changes(), "a later flush answers false" + where, seen);
    const String current = later ? String("later") : nameOf(kItem);
    const Revisions found = foundAnew();
    its.expect(found.current == current, "what was flushed with the answer true is not on the disk" + where,
               seen + ", in memory " + current + ", found " + found.text());
    const std::set<String> reached = found.all();
    for (const String& name : after.all()) {
        if (revisions.all().contains(name) && name != held && !reached.contains(name)) {
            its.found("a revision is lost" + where, seen + ", found " + found.text());
        }
    }
}

} // namespace

const Attack kAllocations{"allocations", "a failed allocation in a step of the manager", run, nullptr};

} // namespace torture
