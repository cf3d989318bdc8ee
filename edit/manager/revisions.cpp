#include "edit/manager/revisions.h"

#include "edit/manager/edit_manager.h"
#include "edit/manager/folder_names.h"
#include "edit/manager/milestone_ring.h"
#include "edit/manager/revision_chain.h"
#include "edit/model/edit_keys.h"
#include "edit/model/edit_modification.h"
#include "edit/persist/edit_salvage.h"
#include "platform/services/edit_filenames.h"
#include "platform/store/edit_header_proxy.h"
#include "platform/store/tag_bag.h"

#include <algorithm>

namespace {

constexpr const char* kCorrupt = ".CORRUPT";

/// What the header of a file says, as far as it can be read.
void readHeader(Revision& revision) {
    TagBag bag;
    std::vector<StoredObjectInfo> lost;
    const TagBag::OpenResult result = bag.openSalvaging(revision.path, lost);
    if (result == TagBag::NotOpened || result == TagBag::Newer) {
        revision.refused = true;
        revision.damage = revision.isSound() ? bag.openError() : revision.damage;
    }
    const auto* const proxy =
        bag.isOpen() ? dynamic_cast<EditHeaderProxy*>(bag.openObject(EditHeaderProxy::EditHeaderId))
                     : nullptr;
    if (proxy == nullptr) {
        return;
    }
    const configb& header = proxy->header();
    revision.name = header.getString("NAME");
    revision.modifications = header.getInt64("MOD_COUNT", 0);
    revision.change = changeText(revision.kind == Revision::Itself
                                     ? EditModification::fromString(EditKeys::kChangeDescription.get(header))
                                     : ownChangeOf(header));
    if (const int64_t time = header.getInt("MODIFICATION_TIME"); time > 0) {
        revision.time = time;
    }
}

/// Gathers the states of one edit.
class RevisionCollector {
public:
    explicit RevisionCollector(const cookie& item)
        : m_item(item), m_redo(item, RevisionChain::Redo, edit_manager::backupDepth()),
          m_undo(item, RevisionChain::Undo, edit_manager::backupDepth()) {}

    RevisionList run();

private:
    /// Adds a file, unless there is none for certain.
    void add(std::vector<Revision>& to, Revision::Kind kind, String which, const String& path);
    /// Adds the files of a folder whose names begin with `lead`, newest first.
    void addOthers(Revision::Kind kind, const String& folder, const std::vector<String>& names,
                   const String& lead, const char* letter);
    [[nodiscard]] std::vector<String> namesIn(const String& folder, FolderLink link);

    cookie m_item;
    RevisionChain m_redo;
    RevisionChain m_undo;
    RevisionList m_list;
};

void RevisionCollector::add(std::vector<Revision>& to, Revision::Kind kind, String which,
                            const String& path) {
    const Qx::FileAnswer found = Qx::askFile(path);
    if (found.isMissing()) {
        return;
    }
    Revision& revision = to.emplace_back();
    revision.kind = kind;
    revision.which = std::move(which);
    revision.path = path;
    revision.file = found.info();
    revision.time = revision.file.modifiedNs / 1'000'000'000;
    if (found.isUnknown()) {
        revision.refused = true;
        revision.damage = found.obstacle("look at").text();
        m_list.unanswered.push_back(revision.damage);
        return;
    }
    std::vector<String> faults;
    revision.refused = !verifyEditFile(path, faults);
    for (const String& fault : faults) {
        revision.damage += (revision.damage.empty() ? "" : "; ") + fault;
    }
    readHeader(revision);
}

void RevisionCollector::addOthers(Revision::Kind kind, const String& folder, const std::vector<String>& names,
                                  const String& lead, const char* letter) {
    std::vector<Revision> found;
    for (const String& name : names) {
        if (name.starts_with(lead)) {
            add(found, kind, letter + name.substr(lead.size()), Qx::joinPath(folder, name));
        }
    }
    std::stable_sort(found.begin(), found.end(),
                     [](const Revision& a, const Revision& b) { return a.time > b.time; });
    m_list.revisions.insert(m_list.revisions.end(), found.begin(), found.end());
}

std::vector<String> RevisionCollector::namesIn(const String& folder, FolderLink link) {
    std::vector<String> names;
    if (const Qx::Status listed = namesOfFolder(folder, link, names); !listed) {
        m_list.unanswered.push_back(listed.reason());
    }
    return names;
}

RevisionList RevisionCollector::run() {
    const String& file = m_undo.file();
    if (file.empty()) {
        return {};
    }
    const String folder = Qx::folderOf(file);
    const std::vector<String> names = namesIn(folder, FolderLink::Followed);
    std::vector<int> numbers = m_redo.numbers(names);
    std::reverse(numbers.begin(), numbers.end());
    for (const int number : numbers) {
        add(m_list.revisions, Revision::Redo, RevisionChain::extension(RevisionChain::Redo, number),
            m_redo.path(number));
    }
    add(m_list.revisions, Revision::Itself, "edit", file);
    for (const int number : m_undo.numbers(names)) {
        add(m_list.revisions, Revision::Undo, RevisionChain::extension(RevisionChain::Undo, number),
            m_undo.path(number));
    }
    const String milestones = MilestoneRing::getMilestoneFolder(invalid_cookie, m_item);
    addOthers(Revision::Milestone, milestones, namesIn(milestones, FolderLink::NotFollowed),
              m_item.asString() + ".", "M");
    addOthers(Revision::Corrupt, folder, names, Qx::fileNameOf(file) + kCorrupt, "CORRUPT");
    return std::move(m_list);
}

/// Orders by the last change; the counts of changes tell apart what was saved in one second.
bool isNewer(const Revision& a, const Revision& b) {
    return a.time != b.time ? a.time > b.time : a.modifications > b.modifications;
}

} // namespace

const Revision* RevisionList::itself() const {
    const auto place = std::find_if(revisions.begin(), revisions.end(),
                                    [](const Revision& its) { return its.kind == Revision::Itself; });
    return place == revisions.end() ? nullptr : &*place;
}

const Revision* RevisionList::newestSound() const {
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

RevisionList revisionsOf(const cookie& item) {
    return RevisionCollector(item).run();
}

EditModification ownChangeOf(const configb& header) {
    return EditModification::fromString(header.contains(EditKeys::kOwnChange)
                                            ? EditKeys::kOwnChange.get(header)
                                            : EditKeys::kChangeDescription.get(header));
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
