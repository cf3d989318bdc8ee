// Many threads on the edits of one project, with observers that edit.

#include "torture.h"

#include "edit/manager/edit_manager.h"
#include "tests/edit/manager/managed_project.h"

#include <atomic>
#include <thread>

namespace torture {

namespace {

using test::ManagedProject;

constexpr int kItems = 3;

cookie itemOf(size_t number) {
    return cookie(Cookie_Type::Edit, static_cast<int>(1 + number % kItems), 0);
}

/// What one thread does, drawn before it begins.
struct Act {
    size_t what;
    size_t item;
    size_t other;
};

std::atomic<size_t> written{0};

void perform(const Act& act, size_t thread) {
    const cookie item = itemOf(act.item);
    const String name = String::format("t%zu-%zu", thread, ++written);
    switch (act.what) {
    case 0:
        static_cast<void>(edit_manager::flush_edit(item));
        break;
    case 1:
        static_cast<void>(edit_manager::backup_edit(item).isOk());
        break;
    case 2:
        static_cast<void>(edit_manager::undoRequest(item).isOk());
        break;
    case 3:
        static_cast<void>(edit_manager::redoRequest(item).isOk());
        break;
    case 4:
        static_cast<void>(edit_manager::flush_changes());
        break;
    case 5:
        static_cast<void>(edit_manager::invalidateCache(item));
        break;
    case 6:
        edit_manager::reloadRequest(item, true);
        break;
    case 7:
        edit_manager::limitEditCache(1);
        break;
    case 8: {
        // Inside one edit, another one is looked after.
        const EditPtr edit(item, eOpenExisting);
        if (edit.valid()) {
            const std::lock_guard<criticalSection> hold(edit->section());
            const cookie other = itemOf(act.item + 1 + act.other % (kItems - 1));
            static_cast<void>(act.other % 2 == 0 ? edit_manager::flush_edit(other)
                                                 : edit_manager::backup_edit(other).isOk());
            edit_manager::reloadRequest(other, true);
        }
        break;
    }
    default: {
        const EditPtr edit(item, eOpenExisting);
        if (edit.valid()) {
            const std::lock_guard<criticalSection> hold(edit->section());
            edit->setName(name);
        }
    }
    }
}

void run(Case& its) {
    const ManagedProject project;
    for (size_t i = 0; i < kItems; ++i) {
        ManagedProject::save("start", itemOf(i));
    }
    // Each other case leaves out what reaches from one edit into another.
    const size_t kinds = its.chance(2) ? 14 : 8;
    auto flushing =
        edit_manager::registerNotification(edit_manager::flushChangesMsgType(), [](const NotifyMsg&) {
            const EditPtr edit(itemOf(0), eOpenExisting);
            if (edit.valid()) {
                const std::lock_guard<criticalSection> hold(edit->section());
                edit->setName("observer");
            }
        });
    std::vector<std::vector<Act>> plans(4);
    for (auto& plan : plans) {
        for (int i = 0; i < 60; ++i) {
            const size_t what = its.below(kinds + 6);
            plan.push_back({what >= kinds             ? 9
                            : kinds == 8 && what == 8 ? 9
                                                      : what,
                            its.below(kItems), its.below(4)});
        }
    }
    std::vector<std::thread> threads;
    for (size_t i = 0; i < plans.size(); ++i) {
        threads.emplace_back([&plans, i] {
            for (const Act& act : plans[i]) {
                perform(act, i);
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    its.tried(plans.size() * plans[0].size());
    edit_manager::deregisterNotification(flushing);
    // What is in memory when all have ended is what is on the disk after a flush.
    its.expect(edit_manager::flush_changes(), "a flush after all threads have ended answers false");
    String names[kItems];
    for (size_t i = 0; i < kItems; ++i) {
        ManagedProject::change(String::format("end %zu", i), itemOf(i));
        its.expect(ManagedProject::nameOf(itemOf(i)) == String::format("end %zu", i),
                   "an edit is not the one that was changed");
    }
    its.expect(edit_manager::flush_changes(), "a flush after all threads have ended answers false");
    ManagedProject::stopManager();
    ManagedProject::startManager();
    for (size_t i = 0; i < kItems; ++i) {
        const String name = ManagedProject::nameOf(itemOf(i));
        its.expect(name == String::format("end %zu", i), "what was flushed is not on the disk", name);
    }
}

} // namespace

const Attack kThreads{"threads", "many threads on the edits of a project", run, nullptr, 10};

} // namespace torture
