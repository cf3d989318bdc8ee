#include "interchange/import.h"

#include "edit/manager/edit_manager_lock.h"
#include "edit/manager/import_note.h"
#include "edit/model/cel.h"
#include "edit/model/channel_event.h"
#include "edit/model/cue_list.h"
#include "edit/model/edit.h"
#include "edit/model/edit_registry.h"
#include "edit/project/cookie_allocator.h"
#include "interchange/detail/strip_map.h"
#include "platform/services/atomic_batch.h"
#include "platform/services/current_project.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/files.h"
#include "platform/store/configb.h"

#include <unordered_map>
#include <unordered_set>

namespace interchange {

namespace {

using detail::CookieMap;
using detail::mapStrips;

cookie ofKind(Cookie_Type kind, const cookie& words) {
    return cookie::fromWords(words.word(0), words.word(1), static_cast<uint32_t>(kind));
}

// The edits of an import in the order of writing, so that no sequence names a shot without a file.
std::vector<Edit*> editsOf(Import& result) {
    std::vector<Edit*> edits;
    edits.reserve(result.shots.size() + 1);
    for (EditPtr& shot : result.shots) {
        edits.push_back(shot);
    }
    edits.push_back(result.sequence);
    return edits;
}

void giveCookies(const std::vector<Edit*>& edits, const std::vector<cookie>& cookies) {
    CookieMap shots;
    for (size_t i = 0; i + 1 < edits.size(); ++i) {
        const cookie before = edits[i]->get_cookie();
        shots.emplace(before, cookies[i]);
        CookieMap media;
        for (const Cookie_Type kind : {Cookie_Type::Video, Cookie_Type::Sound}) {
            media.emplace(ofKind(kind, before), ofKind(kind, cookies[i]));
        }
        mapStrips(*edits[i], media);
        edits[i]->set_cookie(cookies[i]);
    }
    mapStrips(*edits.back(), shots);
    edits.back()->set_cookie(cookies.back());
    // Attached cues know the strip that they follow.
    cue_list& cues = edits.back()->get_cues();
    for (size_t i = 0; i < cues.get_num_cue_points(CueFlag::kAttached); ++i) {
        cues.get_cue_point(i, CueFlag::kAttached)->update_strip_time();
    }
}

/// What the events and headers of the edits name that comes from elsewhere, as cookies of edits: an edit of
/// the import that got such a number would be taken for it, and its media for those of that.
std::vector<cookie> namedElsewhere(const std::vector<Edit*>& edits) {
    std::unordered_set<cookie> own;
    for (size_t i = 0; i + 1 < edits.size(); ++i) {
        const cookie shot = edits[i]->get_cookie();
        own.insert({shot, ofKind(Cookie_Type::Video, shot), ofKind(Cookie_Type::Sound, shot)});
    }
    std::unordered_set<cookie> named;
    const auto name = [&](const cookie& item) {
        const bool tied = item.type() == Cookie_Type::Edit || item.type() == Cookie_Type::Video ||
                          item.type() == Cookie_Type::Sound;
        if (tied && !item.isMagic() && !own.contains(item)) {
            named.insert(ofKind(Cookie_Type::Edit, item));
        }
    };
    for (Edit* const edit : edits) {
        for (int chan = 0; chan < edit->getNumChans(); ++chan) {
            const cel* const content = edit->get_edit_cel_p(chan);
            for (int i = 0; content != nullptr && i < content->numEvents(); ++i) {
                name(content->get_event(i).strip);
            }
        }
        for (const String& key : edit->Opts().keys()) {
            if (const cookie item = edit->Opts().getCookie(key); item.type() == Cookie_Type::Edit) {
                name(item);
            }
        }
    }
    return {named.begin(), named.end()};
}

/// Gives all files of a batch their names. On a failure those that have theirs go again.
Qx::Status putInPlace(Qx::AtomicBatch& batch, const std::vector<cookie>& cookies,
                      const std::vector<cookie>& reused) {
    const String folder = Qx::currentProject().folder();
    EditManagerLock writers(folder);
    if (Qx::Status taken = writers.take(true); !taken) {
        return taken;
    }
    for (const cookie& shot : reused) {
        if (!Qx::askFile(getFilenameForCookie(shot)).isRegular()) {
            return Qx::Status::failure(Qx::StatusCode::NotFound, "the shot " + shot.asString() +
                                                                     " of the project was to be played and "
                                                                     "is gone; import again");
        }
    }
    UnfinishedImport unfinished;
    // A single edit has its name or has not.
    if (cookies.size() > 1) {
        if (Qx::Status noted = writeImportNote(folder, cookies, unfinished.note); !noted) {
            return noted;
        }
    }
    const Qx::FileError error = batch.commit();
    if (error) {
        for (size_t i = 0; i < batch.numReplaced(); ++i) {
            unfinished.files.push_back(getFilenameForCookie(cookies[i]));
        }
    }
    if (!unfinished.note.empty() || !unfinished.files.empty()) {
        takeBackImport(unfinished);
    }
    return error.status();
}

Qx::Status writeAll(const std::vector<Edit*>& edits, const std::vector<cookie>& cookies,
                    const std::vector<cookie>& reused, const std::function<bool()>& cancelled) {
    Qx::AtomicBatch batch;
    const auto isCancelled = [&] { return cancelled && cancelled(); };
    for (Edit* const edit : edits) {
        if (isCancelled()) {
            break;
        }
        if (!edit->write_file()) {
            return edit->lastFileStatus();
        }
    }
    return isCancelled()
               ? Qx::Status::failure(Qx::StatusCode::Cancelled, "nothing was imported, as it was interrupted")
               : putInPlace(batch, cookies, reused);
}

} // namespace

void detail::mapStrips(Edit& edit, const CookieMap& map) {
    for (int chan = 0; chan < edit.getNumChans(); ++chan) {
        cel* const content = edit.get_edit_cel_p(chan);
        if (content == nullptr) {
            continue;
        }
        for (int i = 0; i < content->numEvents(); ++i) {
            channel_event event = content->get_event(i);
            const auto found = map.find(event.strip);
            if (found != map.end()) {
                event.strip = found->second;
                content->setEvent(i, event);
            }
        }
    }
}

cookie provisionalCookie(size_t index) {
    return {Cookie_Type::Transient, static_cast<int>(index), 0};
}

Qx::Status saveImport(Import& result, const std::function<bool()>& cancelled) {
    if (!result.sequence.valid()) {
        return Qx::Status::failure(Qx::StatusCode::BadArgument, "there is no imported sequence to save");
    }
    const std::vector<Edit*> edits = editsOf(result);
    std::vector<cookie> before;
    before.reserve(edits.size());
    for (const Edit* const edit : edits) {
        before.push_back(edit->get_cookie());
    }
    std::vector<cookie> cookies;
    cookies.reserve(edits.size());
    CookieAllocator allocator(Qx::currentProject().folder());
    if (Qx::Status status =
            allocator.allocate(static_cast<unsigned>(edits.size()), cookies, namedElsewhere(edits));
        !status) {
        return status;
    }
    giveCookies(edits, cookies);
    if (Qx::Status status = writeAll(edits, cookies, result.reused, cancelled); !status) {
        giveCookies(edits, before);
        for (Edit* const edit : edits) {
            edit->init_dirty();
        }
        return status;
    }
    if (EditRegistry* const registry = EditRegistry::current()) {
        for (const cookie& item : cookies) {
            registry->updateProjdbRec(item, true);
        }
    }
    return {};
}

} // namespace interchange
