#include "tools/qmedit/project_session.h"

#include "edit/manager/leftovers.h"
#include "edit/persist/edit_init.h"
#include "edit/project/project_details.h"
#include "platform/services/files.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/suggestion.h"

#include <cstdlib>

namespace {

/// The folder that a --project option, or in its place the environment, means.
String folderOfOption(const String& option) {
    if (!option.empty()) {
        return option;
    }
    const char* environment = std::getenv("QMEDIT_PROJECT");
    return environment != nullptr && *environment != '\0' ? environment : "./quillmarch-project";
}

/// What to do about an edit of which neither the file nor an undo backup is there.
String adviceOnLost(const cookie& item) {
    return "; 'qmedit history " + item.asString() + "' shows what is left of it, 'qmedit recover " +
           item.asString() + "' brings it back";
}

} // namespace

ProjectSession::ProjectSession(const String& option)
    : m_session(folderOfOption(option)), m_items(m_session, reportWarning) {}

void ProjectSession::useUnwritten(Qx::FrameRate rate) {
    ProjectDetails usual;
    if (rate.valid()) {
        usual.frameRateCode = rate.code();
    }
    m_session.useUnwritten(usual);
}

Qx::Status ProjectSession::openExisting() {
    Qx::Status used = m_session.useExisting();
    if (used.code() == Qx::StatusCode::NotFound) {
        return used.retold(used.reason() +
                           "; name another with --project DIR, or make one with 'qmedit import FILE'");
    }
    if (!used) {
        // The edits are there all the same. What writes asks again, and fails, in `create`.
        reportWarning(used.reason() + "; the usual settings are taken");
        useUnwritten({});
    }
    return {};
}

Qx::Status ProjectSession::prepare(Qx::FrameRate rateOfFresh) {
    if (exists()) {
        return openExisting();
    }
    m_rateOfFresh = rateOfFresh;
    useUnwritten(rateOfFresh);
    return {};
}

Qx::Status ProjectSession::create() {
    const interrupts::Hold hold(false);
    ProjectDetails defaults;
    if (m_rateOfFresh.valid()) {
        defaults.frameRateCode = m_rateOfFresh.code();
    }
    if (Qx::Status made = m_session.make(defaults); !made) {
        return made;
    }
    if (const Qx::Status started = edit_init(); !started) {
        reportWarning(started.reason());
    }
    // What a writer of the project has in hand is no leftover; it cleans up itself.
    if (EditManagerLock writers(folder()); writers.take()) {
        cleanUp();
    }
    return {};
}

Qx::Status ProjectSession::findItem(const String& text, cookie& item) {
    Qx::Status found = m_items.find(text, item);
    if (found.code() == Qx::StatusCode::BadArgument) {
        return found.retold(found.reason() + "; name one by its cookie");
    }
    if (found.code() != Qx::StatusCode::NotFound) {
        return found;
    }
    std::vector<ListedEdit> edits;
    std::vector<String> others;
    static_cast<void>(list(edits, others).isOk());
    std::vector<String> names;
    for (const ListedEdit& edit : edits) {
        names.push_back(edit.item.asString());
        names.push_back(edit.name);
    }
    return found.retold(found.reason() + didYouMean(text, names, "; 'qmedit list' shows those there are"));
}

Qx::Status ProjectSession::readEdit(const cookie& item, EditPtr& edit) const {
    Qx::Status read = m_items.read(item, edit);
    if (read.code() != Qx::StatusCode::NotFound) {
        return read;
    }
    return read.retold(read.reason() + (m_items.isListed(item)
                                            ? adviceOnLost(item)
                                            : String("; 'qmedit list' shows those there are")));
}

Qx::Status ProjectSession::list(std::vector<ListedEdit>& edits, std::vector<String>& others) {
    Qx::Status listed = m_items.list(edits, others);
    for (ListedEdit& edit : edits) {
        if (!edit.damage.empty() && Qx::askFile(fileOf(edit.item)).isMissing()) {
            edit.damage += adviceOnLost(edit.item);
        }
    }
    return listed;
}

Qx::Status ProjectSession::readRevision(const String& path, EditPtr& edit) {
    Qx::Status read = ProjectItems::readFile(path, edit);
    return read.code() == Qx::StatusCode::Damaged
               ? read.retold(read.reason() + "; 'qmedit salvage' saves what is sound of it")
               : read;
}

Qx::Status ProjectSession::lockForWriting() {
    if (Qx::Status taken = m_session.lockForWriting(std::chrono::seconds(kLockPatience)); !taken) {
        return taken.retold("nothing was changed: " + taken.reason());
    }
    m_uninterrupted.emplace(true);
    cleanUp();
    return {};
}

void ProjectSession::cleanUp() {
    if (!m_isClean) {
        removeLeftovers(folder());
        m_isClean = true;
    }
}

SourceNamer ProjectSession::sourceNamer() {
    return [this](SourceReport& source) {
        const SourceFacts& facts = m_items.factsOf(source.strip);
        source.name = facts.name;
        source.problem = facts.problem;
        if (source.problem.empty()) {
            source.dropFrame = facts.dropFrame;
            source.reel = facts.reel;
        }
    };
}
