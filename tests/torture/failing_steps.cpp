// One allocation, or the disk, fails in a step of the manager.

#include "revision_model.h"
#include "torture.h"

#include "edit/manager/edit_manager.h"
#include "tests/edit/manager/managed_project.h"
#include "tests/support/faulty_file_system.h"
#include "tests/support/memory_meter.h"

#include <new>

namespace torture {

namespace {

using test::ManagedProject;

/// How a step fared.
struct Outcome {
    bool done = false; ///< it answered true
    bool met = false;  ///< something failed on the way
    String how;
};

/// Performs a step with an allocation that fails.
Outcome withoutMemory(Case& its, const Step& step) {
    Outcome outcome;
    const size_t at = 1 + its.below(its.chance(2) ? 400 : 60);
    const test::FailingAllocations failing(at);
    try {
        outcome.done = step.perform("new");
    } catch (const std::bad_alloc&) {
        // May come out; what it leaves is looked at.
    }
    outcome.met = failing.hasFailed();
    outcome.how = String::format("allocation %zu", at);
    return outcome;
}

/// Performs a step with a file operation that fails, from which on all do, or a disk that fills up.
Outcome withoutDisk(Case& its, const Step& step) {
    static constexpr int kErrors[] = {EIO, ENOSPC, EACCES, ESTALE, EINTR, EMFILE};
    Outcome outcome;
    test::FaultyFileSystem system;
    const size_t at = 1 + its.below(60);
    const int error = its.oneOf(kErrors);
    const size_t kind = its.below(4);
    if (kind == 0) {
        system.failFrom(at, EIO);
    } else if (kind == 1) {
        system.fullAfter(its.below(5000));
    } else {
        system.failAt(at, error);
    }
    outcome.done = step.perform("new");
    const std::vector<String> operations = system.operations();
    outcome.met = kind == 1 || operations.size() >= at;
    outcome.how = kind == 1 ? String("a full disk")
                            : String(kind == 0 ? "a dead disk" : "a failed operation") +
                                  String::format(" (%d) at ", error) +
                                  (outcome.met ? operations[at - 1] : String());
    return outcome;
}

/// The edit as a manager finds it that knows nothing of this one.
Revisions foundAnew() {
    ManagedProject::stopManager();
    ManagedProject::startManager();
    return foundByManager();
}

void run(Case& its, const char* what, Outcome (*perform)(Case&, const Step&)) {
    const ManagedProject project;
    // A log that keeps its lines takes memory, too.
    Qx::setLogSink([](std::string_view) {});
    Qx::setStandardOutputSink([](std::string_view) {});
    Revisions revisions;
    for (const char* name : {"a", "b", "c"}) {
        const bool first = !revisions.current.empty();
        kSteps[first ? 1 : 0].perform(name);
        kSteps[first ? 1 : 0].promise(revisions, name);
    }
    if (its.chance(2)) {
        static_cast<void>(edit_manager::undoRequest(kItem).isOk());
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
    const Outcome outcome = perform(its, step);
    if (!outcome.met) {
        return;
    }
    const bool done = outcome.done && step.tells;
    const String where = String(" after ") + what + " in " + step.name;
    const String seen = outcome.how + (done ? ", answer true" : ", answer false") + ", before " +
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
    its.expect(found.current == current || !known,
               "what was flushed with the answer true is not on the disk" + where,
               seen + ", in memory " + current + ", found " + found.text());
    const std::set<String> reached = found.all();
    for (const String& name : after.all()) {
        if (revisions.all().contains(name) && name != held && !reached.contains(name)) {
            its.found("a revision is lost" + where, seen + ", found " + found.text());
        }
    }
}

} // namespace

const Attack kAllocations{"allocations", "a failed allocation in a step of the manager",
                          [](Case& its) { run(its, "a failed allocation", withoutMemory); }, nullptr};
const Attack kDisk{"disk", "failing file operations in a step of the manager",
                   [](Case& its) { run(its, "a failing disk", withoutDisk); }, nullptr};

} // namespace torture
