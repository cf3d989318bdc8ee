// Threads that open and change edits while the current project changes. Every edit carries the mark of its
// project, and the two projects have edits of the same cookies.

#include "edit_states.h"
#include "torture.h"

#include "edit/manager/edit_manager.h"
#include "platform/store/configb.h"
#include "tests/edit/manager/managed_project.h"

#include <atomic>
#include <chrono>
#include <thread>

namespace torture {

namespace {

using test::ManagedProject;

constexpr const char* kMark = "TORTURE_PROJECT";
const cookie kFolders[] = {cookie("P0001000"), cookie("P0002000")};
const cookie kShared("E0001000");
const cookie kOwn("E0002000"); ///< of the thread that switches

String markOf(const cookie& item) {
    const EditPtr edit(item, eOpenExisting);
    return edit.valid() ? edit->Opts().getString(kMark) : String("(null)");
}

void make(const cookie& project) {
    static_cast<void>(edit_manager::set_current_project(project, eOpenOrCreate));
    for (const cookie& item : {kShared, kOwn}) {
        {
            const EditPtr edit(item, eOpenOrCreate);
            edit->Opts().set(kMark, project.asString());
            edit->setName("start");
        }
        static_cast<void>(edit_manager::flush_edit(item));
    }
}

/// Opens and changes the shared edit, whichever project it is of, until it is told to stop.
void change(const std::atomic<bool>& stop, bool flushes) {
    for (int i = 0; !stop; ++i) {
        {
            const EditPtr edit(kShared, eOpenExisting);
            if (edit.valid()) {
                const std::lock_guard<criticalSection> hold(edit->section());
                edit->setName(edit->Opts().getString(kMark) + String::format(" %d", i));
            }
        }
        if (flushes && i % 5 == 0) {
            static_cast<void>(edit_manager::flush_edit(kShared));
        }
        std::this_thread::sleep_for(std::chrono::microseconds(200));
    }
}

void run(Case& its) {
    const ManagedProject project;
    for (const cookie& each : kFolders) {
        make(each);
    }
    std::atomic<bool> stop{false};
    std::vector<std::thread> threads;
    for (size_t i = 0, n = 1 + its.below(3); i < n; ++i) {
        threads.emplace_back([&stop, flushes = i % 2 == 0] { change(stop, flushes); });
    }
    const size_t rounds = 12;
    String names[2] = {"start", "start"};
    for (size_t i = 0; i < rounds; ++i) {
        const size_t now = i % 2;
        its.expect(edit_manager::set_current_project(kFolders[now], eOpenExisting) == eStatus::Ok,
                   "a project cannot be switched to");
        const String mark = markOf(kShared);
        its.expect(mark == kFolders[now].asString(), "an edit of another project is found", mark);
        const String name = ManagedProject::nameOf(kOwn);
        its.expect(name == names[now], "a change made before the project was left is lost",
                   name + " instead of " + names[now]);
        names[now] = String::format("own %zu", i);
        ManagedProject::change(names[now], kOwn);
        if (its.chance(2)) {
            std::this_thread::sleep_for(std::chrono::milliseconds(its.below(4)));
        }
    }
    stop = true;
    for (std::thread& thread : threads) {
        thread.join();
    }
    ManagedProject::stopManager();
    its.tried(rounds);
    for (size_t i = 0; i < 2; ++i) {
        // The shared edit's names, of all its revisions, begin with the mark of the project that it was
        // opened for.
        const String folder = kFolders[i].asString();
        const String strange = kFolders[1 - i].asString();
        for (const auto& [path, digest] : statesOf(project.root().path(folder))) {
            its.expect(!digest.starts_with(strange), "an edit is written into another project",
                       folder + "/" + path + " holds " + digest);
            its.expect(digest != kDamaged, "a file is damaged", folder + "/" + path);
        }
        const String own = project.root().path(folder + "/" + kOwn.asString() + ".qme");
        its.expect(digestOf(own).starts_with(names[i] + ":"),
                   "a change made before the project was left is lost",
                   digestOf(own) + " instead of " + names[i]);
    }
}

} // namespace

const Attack kProjects{"projects", "threads that edit while the project changes", run, nullptr};

} // namespace torture
