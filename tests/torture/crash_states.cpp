// What a crash leaves: the file operations of some steps are recorded, and the folder as it is after each of
// them is opened by another manager.

#include "revision_model.h"
#include "torture.h"

#include "edit/manager/edit_manager.h"
#include "platform/services/config_int.h"
#include "recording_file_system.h"
#include "tests/edit/manager/managed_project.h"

#include <algorithm>
#include <filesystem>
#include <memory>

namespace torture {

namespace {

using test::CrashKind;
using test::ManagedProject;

/// A step that was made, and what was promised before and after it.
struct Made {
    const char* name;
    size_t begin; ///< operations that were recorded before
    size_t end;
    Revisions before;
    Revisions after;
    String batch; ///< the name that the batch's edits have afterwards
};

class CrashStates {
public:
    CrashStates(Case& its, CrashKind kind) : m_case(its), m_kind(kind) {
        Qx::setConfigInt("mods_per_milestone", static_cast<int>(1 + its.below(3)));
        m_depth = its.chance(3) ? 2 : 10;
        Qx::setConfigInt("backup_depth", m_depth);
    }

    void run() {
        record();
        if (m_kind == CrashKind::Ordered) {
            for (size_t count = 0; count <= m_system->size(); ++count) {
                check(count, CrashKind::Ordered);
            }
        } else {
            for (int i = 0; i < 60; ++i) {
                check(m_case.below(m_system->size() + 1),
                      m_case.chance(2) ? CrashKind::NamesInOrder : CrashKind::AnyOrder);
            }
        }
    }

private:
    void record() {
        m_project = std::make_unique<ManagedProject>(false);
        m_system = std::make_unique<test::RecordingFileSystem>(m_project->root().path());
        ManagedProject::startManager();
        Revisions revisions;
        String batch;
        const size_t steps = 4 + m_case.below(6);
        for (size_t i = 0; i < steps; ++i) {
            const Step& step = stepFor(m_case, revisions);
            const String fresh = String::format("n%zu", i);
            Made made{step.name, m_system->size(), 0, revisions, revisions, batch};
            const bool done = step.perform(fresh);
            m_case.expect(done, String(step.name) + " fails although nothing stands in its way",
                          revisions.text());
            step.promise(revisions, fresh);
            if (std::string_view(step.name) == "batch") {
                batch = fresh;
            }
            finish(made, revisions, batch);
        }
        // What is left unwritten is written when the manager closes, also after a backup alone.
        Made last{"a backup and the shut-down", m_system->size(), 0, revisions, revisions, batch};
        if (!revisions.current.empty()) {
            m_case.expect(edit_manager::backup_edit(kItem).isOk(),
                          "a last backup fails although nothing stands in its way");
            revisions.undo.insert(revisions.undo.begin(), revisions.current);
            revisions.redo.clear();
        }
        ManagedProject::stopManager();
        m_case.expect(revisions.current.empty() || m_project->has(kItem.asString() + ".qme"),
                      "a clean exit after a backup leaves no file under the edit's name", revisions.text());
        finish(last, revisions, batch);
    }

    void finish(Made& made, Revisions& revisions, const String& batch) {
        if (revisions.undo.size() > static_cast<size_t>(m_depth)) {
            revisions.undo.resize(static_cast<size_t>(m_depth));
        }
        made.end = m_system->size();
        made.after = revisions;
        made.batch = batch;
        m_made.push_back(made);
    }

    /// Opens what a crash after `count` operations leaves, and holds it against what was promised by then.
    void check(size_t count, CrashKind kind) {
        std::mt19937_64 random(m_case.number() * 7919 + m_case.below(1 << 30));
        const test::TemporaryFolder root;
        std::filesystem::create_directory(root.path("P0001000").c_str());
        m_system->materialise(root.path(), count, kind, random);
        Qx::CurrentProject project = Qx::currentProject();
        project.rootFolder = root.path();
        Qx::setCurrentProject(project);
        Qx::FileSystem* const recording = Qx::setFileSystem(nullptr);
        ManagedProject::startManager();
        judge(count, kind, root);
        ManagedProject::stopManager();
        Qx::setFileSystem(recording);
        m_case.tried(1);
    }

    void judge(size_t count, CrashKind kind, const test::TemporaryFolder& root) {
        const Revisions found = foundByManager();
        Made now{"the start", 0, 0, {}, {}, {}};
        bool within = false;
        for (const Made& made : m_made) {
            if (made.begin <= count) {
                within = count < made.end;
                now = made;
            }
        }
        static constexpr const char* kKinds[] = {"", " (names in order)", " (any order)"};
        const String suffix = String(" after a crash") + (within ? " in " : " after ") + now.name +
                              kKinds[static_cast<int>(kind)];
        const String seen = String::format("operation %zu of %zu, %s: found ", count, m_system->size(),
                                           count < m_system->size() ? m_system->text(count).c_str() : "end") +
                            found.text() + ", before " + now.before.text() + ", after " + now.after.text() +
                            ", files " + names(root);
        const bool isAfter = found.current == now.after.current;
        m_case.expect(isAfter || (within && found.current == now.before.current),
                      "the edit is not one that was promised" + suffix, seen);
        const std::set<String> reached = found.all();
        // Where names take their places in any order, one of the older revisions may go with a rotation.
        const bool mayMiss = kind == CrashKind::AnyOrder;
        for (const String& name : now.after.all()) {
            if (!mayMiss && (!within || now.before.all().contains(name)) && !reached.contains(name)) {
                m_case.found("a revision is lost" + suffix, seen);
                break;
            }
        }
        if (!within && isAfter && reached == now.after.all()) {
            m_case.expect(found.inOrder() == now.after.inOrder(),
                          "the revisions are in another order" + suffix, seen);
        }
        if (!within && !now.batch.empty()) {
            for (const cookie& item : kBatch) {
                m_case.expect(nameOf(item) == now.batch, "an edit of a batch is lost" + suffix, seen);
            }
        }
        m_case.expect(names(root).find("CORRUPT") == String::npos, "a file is set aside" + suffix, seen);
    }

    static String names(const test::TemporaryFolder& root) {
        String text;
        for (const auto& entry : std::filesystem::directory_iterator(root.path("P0001000").c_str())) {
            text += entry.path().filename().string() + " ";
        }
        return text;
    }

    Case& m_case;
    CrashKind m_kind;
    int m_depth = 10;
    std::unique_ptr<ManagedProject> m_project;
    std::unique_ptr<test::RecordingFileSystem> m_system;
    std::vector<Made> m_made;
};

} // namespace

const Attack kCrashStates{"crashes", "what a crash between two file operations leaves",
                          [](Case& its) { CrashStates(its, CrashKind::Ordered).run(); }, nullptr};
const Attack kReorderedCrashStates{"reordered", "the same where what was not synced is lost in any part",
                                   [](Case& its) { CrashStates(its, CrashKind::AnyOrder).run(); }, nullptr};

} // namespace torture
