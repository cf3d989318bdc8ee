#include "edit/inspect/usage.h"

#include "edit/manager/project_items.h"
#include "edit/manager/revisions.h"
#include "edit/model/cel.h"

void addPlayed(const Edit& edit, std::unordered_set<cookie>& played) {
    cookie last;
    for (int i = 0; i < edit.getNumChans(); ++i) {
        const cel* const content = edit.get_edit_cel_p(i);
        for (int k = 0; content != nullptr && k < content->numEvents(); k += 2) {
            const channel_event* const event = content->getChanEventPtr(k);
            // Neighbours often play the same.
            if (event != nullptr && (played.empty() || event->strip != last)) {
                last = event->strip;
                played.insert(last);
            }
        }
    }
}

std::vector<ItemUser> findUsers(const cookie& item, const std::vector<cookie>& edits, const EditReader& read,
                                const std::function<bool()>& cancelled) {
    std::vector<ItemUser> users;
    for (const cookie& candidate : edits) {
        if (cancelled && cancelled()) {
            break;
        }
        if (candidate == item) {
            continue;
        }
        EditPtr edit;
        if (const Qx::Status status = read(candidate, edit); !status) {
            users.push_back({candidate, status.reason()});
            continue;
        }
        std::unordered_set<cookie> played;
        addPlayed(*edit, played);
        if (played.contains(item)) {
            users.push_back({candidate, {}});
        }
    }
    return users;
}

UnusedItems findUnused(const std::vector<cookie>& candidates, const std::vector<cookie>& edits,
                       const std::function<bool()>& cancelled) {
    UnusedItems unused;
    std::unordered_set<cookie> played;
    for (const cookie& candidate : edits) {
        if (cancelled && cancelled()) {
            return unused;
        }
        const RevisionList list = revisionsOf(candidate);
        unused.unread.insert(unused.unread.end(), list.unanswered.begin(), list.unanswered.end());
        for (const Revision& revision : list.revisions) {
            EditPtr edit;
            if (const Qx::Status read = ProjectItems::readFile(revision.path, edit); read) {
                addPlayed(*edit, played);
            } else {
                unused.unread.push_back(read.reason());
            }
        }
    }
    for (const cookie& item : candidates) {
        if (!played.contains(item)) {
            unused.items.push_back(item);
        }
    }
    return unused;
}
