#include "edit/model/managed_cel.h"
#include "edit/persist/detail/edit_file.h"
#include "edit/project/permissions_manager.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/files.h"
#include "platform/services/log.h"
#include "platform/services/network.h"
#include "platform/store/edit_header_proxy.h"
#include "platform/store/tag_bag.h"

#include <algorithm>

bool EditFile::fail(Edit& edit, Qx::Status why) {
    edit.m_fileStatus = std::move(why);
    return false;
}

bool Edit::write_file() {
    return write_file(Qx::widen(getFilenameForCookie(m_cookie)));
}

bool Edit::write_file(const WString& path) {
    if (m_writing) {
        return EditFile::fail(*this, Qx::Status::failure(Qx::StatusCode::Locked,
                                                         get_cookie_str() + " is being written already"));
    }
    if (!needsToBeWritten()) {
        return EditFile::fail(
            *this, Qx::Status::failure(Qx::StatusCode::ReadOnly,
                                       get_cookie_str() +
                                           " needs no writing: it is unchanged, read-only or temporary"));
    }
    bool stored = false;
    try {
        const EditFile::Raised writing(m_writing);
        stored = store(path);
    } catch (...) {
        EditFile::markUnwritten(*this);
        throw;
    }
    if (!stored) {
        EditFile::markUnwritten(*this);
    }
    if (stored && Qx::Network::networkMode()) {
        const String user = PermissionsManager::getCurrentUser();
        Qx::Network::send({Qx::Network::EditWritten, m_cookie, user});
        if (get_log_type() != kLogEdit) {
            const Qx::Status owned = PermissionsManager::setOwner(m_cookie, user, false);
            if (!owned) {
                herc_printf("Edit::write_file( %s ) : %s\n", cookie_string(m_cookie).c_str(),
                            owned.reason().c_str());
            }
        }
    }
    return stored;
}

bool Edit::writeToFile(const WString& path, QxEditFileType type) {
    switch (type) {
    case kObjectStoreFile:
        // There is nothing to do for the file that the edit is from.
        if (!isDirty(true) && !m_bad && m_store.isOpen() && m_store.path() == Qx::narrow(path)) {
            m_fileStatus = {};
            return true;
        }
        return write_file(path);
    case kLegacyTextFile:
        return writeToLegacyFile(path);
    default:
        return EditFile::fail(
            *this, Qx::Status::failure(Qx::StatusCode::BadArgument,
                                       "cannot write " + Qx::narrow(path) +
                                           ": an edit is written as an object store or as legacy text"));
    }
}

bool Edit::store(const WString& path) {
    if (m_cookie.type() == Cookie_Type::Transient) {
        return EditFile::fail(
            *this, Qx::Status::failure(Qx::StatusCode::BadArgument,
                                       get_cookie_str() + " is a transient edit, which is never stored"));
    }
    if (isDirty(true)) {
        const EditFile::Quiet quiet(*this);
        setModificationDetails();
    }
    if (path.empty()) {
        return EditFile::fail(
            *this,
            Qx::Status::failure(Qx::StatusCode::BadArgument,
                                "cannot write edit " + get_cookie_str() +
                                    ": no file name can be formed for it; give it a cookie of a project"));
    }
    const String file = Qx::narrow(path);
    Qx::Status status = EditFile::checkStorable(*this);
    if (status) {
        status = EditFile::openStore(*this, file);
    }
    if (!status) {
        return EditFile::fail(*this, status.retold("cannot write " + file + ": " + status.reason()));
    }
    {
        const EditFile::Quiet quiet(*this);
        updateHeaderBeforeWrite();
        storeCues();
        if (auto* const cues = dynamic_cast<cue_list*>(m_store.openObject(EditKeys::kCues))) {
            EditFile::renumberFor(*this, EditFile::storedChannels(*this), *cues);
        }
        const EditHeaderProxy header(m_header);
        EditFile::CelLoan loan(*this);
        EditFile::lendCels(*this);
        m_store.lendObject(EditHeaderProxy::EditHeaderId, header, true);
        status = m_store.flush();
        if (status) {
            loan.setWritten();
        }
        if (m_debug) {
            herc_printf(status ? "Stored the configb \n" : "Failed to store the configb \n");
        }
    }
    if (!status) {
        return EditFile::fail(*this, status);
    }
    EditFile::markWritten(*this);
    m_fileStatus = {};
    return true;
}

void Edit::updateHeaderBeforeWrite() {
    write_labels_to_config(get_ed2_revision());
    EditFile::updateHeader(*this, m_header, EditFile::storedChannels(*this));
}

Qx::Status EditFile::checkStorable(const Edit& edit) {
    const struct {
        int count;
        unsigned limit;
        const char* kind;
    } limits[] = {
        {edit.getNumChans(AudioChan), kMaxAudioChans, "audio"},
        {edit.getNumChans(VideoChan, Edit_Chan_SubType::NONE), kMaxVideoChans, "video"},
    };
    for (const auto& [count, limit, kind] : limits) {
        if (count > static_cast<int>(limit)) {
            return Qx::Status::failure(
                Qx::StatusCode::Unsupported,
                String::format("the edit has %d %s channels and a file holds %u; remove some", count, kind,
                               limit));
        }
    }
    if (edit.getNumChans(AnyChan) == 0) {
        return Qx::Status::failure(Qx::StatusCode::Unsupported,
                                   "the edit has no channels and could not be read again; add one");
    }
    return {};
}

Qx::Status EditFile::openStore(Edit& edit, const String& path) {
    TagBag& store = edit.m_store;
    const String name = Qx::fileNameOf(path);
    const String folder = Qx::folderOf(path);
    const String extension = Qx::extensionOf(name);
    if (!edit.m_cookie.isStorable() || Qx::withoutExtension(name) != edit.get_cookie_str()) {
        return Qx::Status::failure(
            Qx::StatusCode::BadArgument,
            "the file of edit " + edit.get_cookie_str() +
                " must be named after it; choose that name or give the edit another cookie");
    }
    if (store.isOpen()) {
        store.setId(edit.m_cookie);
        store.setFolder(folder);
        store.setExtension(extension);
        return {};
    }
    // Opening drops what is bound to the store, so it is set aside meanwhile.
    std::vector<std::pair<String, std::unique_ptr<Streamable>>> bound;
    for (const String& object : store.names()) {
        if (auto held = store.extractObject(object)) {
            bound.emplace_back(object, std::move(held));
        }
    }
    const TagBag::OpenResult result = store.open(edit.m_cookie, folder, eOpenNew, extension);
    for (auto& [object, held] : bound) {
        store.storeObject(object, std::move(held));
    }
    edit.m_storedCels.reset();
    if (result != TagBag::NewStore && result != TagBag::Opened) {
        return store.openStatus();
    }
    return {};
}

void EditFile::updateHeader(const Edit& edit, configb& header, const Vector<IdStamp>& order) {
    EditKeys::kNumChans.set(header, static_cast<int>(order.size()));
    EditKeys::kCurrentTime.set(header, edit.m_currentTime);
    if (edit.mark_is_valid()) {
        EditKeys::kMarkTime.set(header, edit.m_markTime);
    } else {
        header.remove(EditKeys::kMarkTime);
    }
    // The old sync errors were taken into the sync losses when they were read.
    EditKeys::removeNumbered(header, EditKeys::kSyncError, 0);
    EditKeys::removeNumbered(header, EditKeys::kSyncLoss, static_cast<int>(order.size()));
    int audioChans = 0;
    for (size_t i = 0; i < order.size(); ++i) {
        const String syncLoss = EditKeys::numbered(EditKeys::kSyncLoss, static_cast<int>(i));
        const double loss = edit.getSyncLoss(order[i]);
        if (loss != 0) {
            header.setDouble(syncLoss, loss);
        } else {
            header.remove(syncLoss);
        }
        if (edit.getChanType(order[i]) != AudioChan) {
            continue;
        }
        ++audioChans;
        const AudCel audio = edit.getAudCel(order[i]);
        const String output = EditKeys::numbered(EditKeys::kSoundOutput, audioChans);
        const String xfade = EditKeys::numbered(EditKeys::kSoundOutputXFade, audioChans);
        // Only what differs from the default is written.
        if (audio.getSoundOutputEnabled()) {
            header.remove(output);
        } else {
            header.setInt(output, 0);
        }
        if (audio.getXFadesEnabled()) {
            header.setInt(xfade, 1);
        } else {
            header.remove(xfade);
        }
    }
    EditKeys::removeNumbered(header, EditKeys::kSoundOutput, audioChans + 1);
    EditKeys::removeNumbered(header, EditKeys::kSoundOutputXFade, audioChans + 1);
}

int EditFile::oldIndex(const Edit& edit, const IdStamp& audio) {
    return edit.getIndexWithinType(audio) + 1;
}
