#include "tools/qmedit/revisions.h"

#include "edit/manager/edit_manager.h"
#include "edit/manager/milestone_ring.h"
#include "edit/manager/revision_chain.h"
#include "edit/model/edit_modification.h"
#include "edit/persist/edit_salvage.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/files.h"
#include "platform/store/edit_header_proxy.h"
#include "platform/store/tag_bag.h"

#include <algorithm>
#include <ctime>

namespace {

constexpr const char* kCorrupt = ".CORRUPT";

/// What the header of a file says, as far as it can be read.
void readHeader(Revision& revision) {
    TagBag bag;
    std::vector<StoredObjectInfo> lost;
    const TagBag::OpenResult result = bag.openSalvaging(revision.path, lost);
    revision.refused = result == TagBag::NotOpened || result == TagBag::Newer;
    const auto* const proxy =
        bag.isOpen() ? dynamic_cast<EditHeaderProxy*>(bag.openObject(EditHeaderProxy::EditHeaderId))
                     : nullptr;
    if (proxy == nullptr) {
        return;
    }
    const configb& header = proxy->header();
    revision.name = header.getString("NAME");
    revision.modifications = header.getInt64("MOD_COUNT", 0);
    revision.change = changeText(EditModification::fromString(header.getString("CHANGE_DESCRIPTION")));
    if (const int64_t time = header.getInt("MODIFICATION_TIME"); time > 0) {
        revision.time = time;
    }
}

/// Adds a file that is there.
void add(std::vector<Revision>& to, Revision::Kind kind, String which, const String& path) {
    const Qx::FileAnswer found = Qx::askFile(path);
    if (found.isMissing()) {
        return;
    }
    const Qx::FileInfo& info = found.info();
    Revision& revision = to.emplace_back();
    revision.kind = kind;
    revision.which = std::move(which);
    revision.path = path;
    revision.size = info.size;
    revision.time = info.modifiedNs / 1'000'000'000;
    std::vector<String> faults;
    verifyEditFile(path, faults);
    for (const String& fault : faults) {
        revision.damage += (revision.damage.empty() ? "" : "; ") + fault;
    }
    readHeader(revision);
}

/// Adds the files of a folder whose names begin with `lead`, newest first.
void addOthers(std::vector<Revision>& to, Revision::Kind kind, const String& folder, const String& lead,
               const char* letter) {
    std::vector<String> names;
    // A link in the folder's place is not followed.
    if (!Qx::askFile(folder).isFolder() || Qx::fileSystem().list(folder, names)) {
        return;
    }
    std::vector<Revision> found;
    for (const String& name : names) {
        if (name.starts_with(lead)) {
            add(found, kind, letter + name.substr(lead.size()), Qx::joinPath(folder, name));
        }
    }
    std::stable_sort(found.begin(), found.end(),
                     [](const Revision& a, const Revision& b) { return a.time > b.time; });
    to.insert(to.end(), found.begin(), found.end());
}

/// Orders by the last change; the counts of changes tell apart what was saved in one second.
bool isNewer(const Revision& a, const Revision& b) {
    return a.time != b.time ? a.time > b.time : a.modifications > b.modifications;
}

} // namespace

std::vector<Revision> revisionsOf(const cookie& item) {
    std::vector<Revision> revisions;
    const int depth = edit_manager::backupDepth();
    const RevisionChain redo(item, RevisionChain::Redo, depth);
    const RevisionChain undo(item, RevisionChain::Undo, depth);
    std::vector<int> numbers = redo.numbers();
    std::reverse(numbers.begin(), numbers.end());
    for (const int number : numbers) {
        add(revisions, Revision::Redo, RevisionChain::extension(RevisionChain::Redo, number),
            redo.path(number));
    }
    add(revisions, Revision::Itself, "edit", undo.file());
    for (const int number : undo.numbers()) {
        add(revisions, Revision::Undo, RevisionChain::extension(RevisionChain::Undo, number),
            undo.path(number));
    }
    addOthers(revisions, Revision::Milestone, MilestoneRing::getMilestoneFolder(invalid_cookie, item),
              item.asString() + ".", "M");
    addOthers(revisions, Revision::Corrupt, Qx::folderOf(undo.file()), Qx::fileNameOf(undo.file()) + kCorrupt,
              "CORRUPT");
    return revisions;
}

const Revision* newestSound(const std::vector<Revision>& revisions) {
    const Revision* newest = nullptr;
    for (const bool redo : {false, true}) {
        for (const Revision& revision : revisions) {
            const bool counts = revision.isSound() && revision.kind != Revision::Itself &&
                                (revision.kind == Revision::Redo) == redo;
            if (counts && (newest == nullptr || isNewer(revision, *newest))) {
                newest = &revision;
            }
        }
        if (newest != nullptr) {
            break;
        }
    }
    return newest;
}

String changeText(const EditModification& change) {
    switch (change.type()) {
    case kNoModification:
    case kInitial:
    case kNotDescribed:
        return {};
    default:
        return String(change.inverted() ? "undoing of " : "") + change.name();
    }
}

String localTimeText(int64_t seconds) {
    const auto time = static_cast<std::time_t>(seconds);
    std::tm fields{};
    char text[32];
    if (seconds <= 0 || localtime_r(&time, &fields) == nullptr ||
        std::strftime(text, sizeof text, "%Y-%m-%d %H:%M", &fields) == 0) {
        return "-";
    }
    return text;
}
