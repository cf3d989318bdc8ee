#include "revision_model.h"

#include "edit/manager/edit_manager.h"
#include "platform/services/atomic_batch.h"

#include <algorithm>

namespace torture {

namespace {

bool has(const Revisions& revisions) {
    return !revisions.current.empty();
}

void become(Revisions& revisions, const String& name, bool backup) {
    if (backup) {
        revisions.undo.insert(revisions.undo.begin(), revisions.current);
        revisions.redo.clear();
    }
    revisions.current = name;
}

bool go(Revisions& revisions, std::vector<String>& from, std::vector<String>& to) {
    if (from.empty()) {
        return false;
    }
    to.insert(to.begin(), revisions.current);
    revisions.current = from.front();
    from.erase(from.begin());
    return true;
}

bool save(const String& fresh, const cookie& item) {
    return changeName(fresh, item) && edit_manager::flush_edit(item);
}

bool batch(const String& fresh) {
    Qx::AtomicBatch together;
    for (const cookie& item : kBatch) {
        if (!save(fresh, item)) {
            return false;
        }
    }
    return !together.commit();
}

bool switchProject(const String& fresh) {
    const bool changed = changeName(fresh);
    edit_manager::exitProject();
    return changed && edit_manager::set_current_project(cookie("P0001000"), eOpenExisting) == eStatus::Ok;
}

} // namespace

const std::vector<Step> kSteps = {
    {"save", [](const String& fresh) { return save(fresh, kItem); },
     [](Revisions& its, const String& fresh) { return become(its, fresh, false), true; }},
    {"backup and save",
     [](const String& fresh) { return edit_manager::backup_edit(kItem) && save(fresh, kItem); },
     [](Revisions& its, const String& fresh) { return has(its) && (become(its, fresh, true), true); }},
    {"change, backup, flush",
     [](const String& fresh) {
         return changeName(fresh) && edit_manager::backup_edit(kItem) && edit_manager::flush_edit(kItem);
     },
     [](Revisions& its, const String& fresh) {
         if (!has(its)) {
             return false;
         }
         its.current = fresh;
         become(its, fresh, true);
         return true;
     }},
    {"flush all", [](const String& fresh) { return changeName(fresh) && edit_manager::flush_changes(); },
     [](Revisions& its, const String& fresh) { return become(its, fresh, false), true; }},
    {"undo", [](const String&) { return edit_manager::undoRequest(kItem).isOk(); },
     [](Revisions& its, const String&) { return go(its, its.undo, its.redo); }},
    {"redo", [](const String&) { return edit_manager::redoRequest(kItem).isOk(); },
     [](Revisions& its, const String&) { return go(its, its.redo, its.undo); }},
    {"backup, leave project",
     [](const String&) {
         const bool done = edit_manager::backup_edit(kItem).isOk();
         edit_manager::exitProject();
         return done && edit_manager::set_current_project(cookie("P0001000"), eOpenExisting) == eStatus::Ok;
     },
     [](Revisions& its, const String&) {
         return has(its) && (become(its, String(its.current), true), true);
     }},
    {"delete", [](const String&) { return edit_manager::delete_edit_file_and_backups(kItem, true); },
     [](Revisions& its, const String&) { return has(its) && (its = {}, true); }},
    {"batch", batch, [](Revisions&, const String&) { return true; }},
    {"switch project", switchProject,
     [](Revisions& its, const String& fresh) { return become(its, fresh, false), true; }, false},
};

std::vector<String> Revisions::inOrder() const {
    std::vector<String> order(undo.rbegin(), undo.rend());
    order.push_back(current);
    order.insert(order.end(), redo.begin(), redo.end());
    order.erase(std::unique(order.begin(), order.end()), order.end());
    return order;
}

std::set<String> Revisions::all() const {
    const std::vector<String> order = inOrder();
    std::set<String> names(order.begin(), order.end());
    names.erase(String());
    return names;
}

String Revisions::text() const {
    String text;
    for (auto at = undo.rbegin(); at != undo.rend(); ++at) {
        text += *at + " ";
    }
    text += "[" + current + "]";
    for (const String& name : redo) {
        text += " " + name;
    }
    return text;
}

const Step& stepFor(Case& its, const Revisions& revisions) {
    while (true) {
        // Deletions are rare, so that the chains grow.
        const Step& step = its.oneOf(kSteps);
        Revisions after = revisions;
        if (step.promise(after, "?") && (!after.current.empty() || its.chance(3))) {
            return step;
        }
    }
}

bool changeName(const String& fresh, const cookie& item) {
    const EditPtr edit(item, eOpenOrCreate);
    if (!edit.valid()) {
        return false;
    }
    const std::lock_guard<criticalSection> hold(edit->section());
    edit->setName(fresh);
    return true;
}

String nameOf(const cookie& item) {
    const EditPtr edit(item, eOpenExisting);
    return edit.valid() ? edit->getName() : String();
}

Revisions foundByManager() {
    Revisions found;
    found.current = nameOf(kItem);
    // A chain is longer than this only if it goes in a circle.
    constexpr size_t kMost = 64;
    while (found.undo.size() < kMost && edit_manager::undoRequest(kItem)) {
        found.undo.push_back(nameOf(kItem));
    }
    for (size_t i = 0; i < found.undo.size() && edit_manager::redoRequest(kItem); ++i) {
    }
    while (found.redo.size() < kMost && edit_manager::redoRequest(kItem)) {
        found.redo.push_back(nameOf(kItem));
    }
    return found;
}

} // namespace torture
