#include "edit/model/managed_cel.h"
#include "edit/persist/detail/edit_file.h"
#include "platform/notify/val_server.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/files.h"
#include "platform/services/log.h"
#include "platform/store/edit_header_proxy.h"
#include "platform/store/tag_bag.h"

#include <exception>
#include <new>

namespace {

// The item that a file is named after.
cookie cookieOfPath(const String& path) {
    return cookie(std::string_view(Qx::withoutExtension(Qx::fileNameOf(path))));
}

bool isNoItem(const cookie& item) {
    return !item.is_valid() || (item.word(0) == 0 && item.word(1) == 0 && item.word(2) == 0);
}

/// Keeps an edit from going while it is read; it is destroyed by nobody else than its holder afterwards.
class ReadReference {
public:
    explicit ReadReference(Edit& edit) : m_edit(edit) { edit.incRefCount(); }
    ~ReadReference() { m_edit.decRefCount(); }
    ReadReference(const ReadReference&) = delete;
    ReadReference& operator=(const ReadReference&) = delete;

private:
    Edit& m_edit;
};

} // namespace

Edit::Edit(const WString& path, eEditOpenBehaviour behaviour) : Edit() {
    m_bad = true;
    if (getEditFileTypeFromFileName(path) == kLegacyTextFile && behaviour == eOpenExisting) {
        if (!readFromLegacyFile(path)) {
            return;
        }
        m_bad = false;
        removeShotSoundRamps();
        initialiseAudioVarispeeds();
        updateLegacyFileLabels();
        set_dirty(true);
        return;
    }
    if (readFile(path, behaviour) == kReadOk) {
        m_bad = false;
    }
}

Edit::ReadFileRC Edit::read_file(const cookie& item, eEditOpenBehaviour behaviour) {
    return readFile(Qx::widen(getFilenameForCookie(item)), behaviour);
}

Edit::ReadFileRC Edit::readFile(const WString& path, eEditOpenBehaviour behaviour) {
    const String file = Qx::narrow(path);
    const cookie item = cookieOfPath(file);
    if (isNoItem(item)) {
        incRefCount();
        m_loading = true;
        // The reference stays held and the edit stays flagged as loading: whoever asked for such a name must
        // not find the edit usable or see it go.
        EditFile::fail(*this, Qx::Status::failure(
                                  Qx::StatusCode::BadArgument,
                                  "cannot read an edit from \"" + file +
                                      "\": its name is not that of an item; rename the file to its cookie"));
        return kReadFailed;
    }
    const ReadReference reference(*this);
    const EditFile::Raised loading(m_loading);
    m_cookie = item;
    if (getNumChans() > 0 &&
        (behaviour == eOpenExisting || (behaviour == eOpenOrCreate && Qx::askFile(file).isRegular()))) {
        // Before the store is opened, as channels that go leave the groups in it.
        EditFile::reset(*this);
    }
    m_storedCels.reset();
    m_upgrade.reset();

    ReadFileRC result = kReadFailed;
    const String name = Qx::fileNameOf(file);
    switch (m_store.open(item, Qx::folderOf(file), behaviour, Qx::extensionOf(name))) {
    case TagBag::Opened:
        if (retrieve()) {
            try {
                doEditConversions();
                result = kReadOk;
            } catch (const std::bad_alloc&) {
                throw; // says nothing of the file
            } catch (const std::exception& error) {
                m_bad = true;
                EditFile::fail(*this,
                               Qx::Status::failure(
                                   file + " was read, but bringing it up to date failed: " + error.what()));
            }
        }
        break;
    case TagBag::NewStore: {
        const EditFile::Quiet quiet(*this);
        if (getNumChans(VideoChan, Edit_Chan_SubType::NONE) == 0) {
            addChan(VideoChan, nullptr, false, Edit_Chan_SubType::NONE, false, -1.0);
        }
        result = kReadOk;
        break;
    }
    default:
        herc_printf("Edit::readFile( %s ) : Failed to open store\n", cookie_string(item).c_str());
        EditFile::fail(*this, m_store.openStatus());
        EditFile::reset(*this);
        m_bad = true;
        break;
    }
    if (result == kReadOk) {
        m_bad = false;
        m_fileStatus = {};
    }
    return result;
}

bool Edit::retrieve() {
    EditFile::reset(*this);
    // What this program would not read of the edit is nothing that it may drop.
    Qx::Status status = m_store.checkRevisions();
    const bool isNewer = !status;
    if (!isNewer) {
        const EditFile::Quiet quiet(*this);
        status = EditFile::readHeader(*this);
        if (status) {
            EditFile::readCues(*this);
            status = EditFile::readCels(*this);
        }
        if (status) {
            EditFile::readGroups(*this);
            getInfoFromHeader();
        }
    }
    if (!status) {
        const String path = m_store.path();
        EditFile::reset(*this);
        m_store.close();
        m_bad = true;
        return EditFile::fail(*this, status.retold("cannot read " + path + ": " + status.reason() +
                                                   (isNewer ? "; open it with that version"
                                                            : "; restore a backup of the edit")));
    }
    EditFile::markWritten(*this);
    return true;
}

Qx::Status EditFile::readHeader(Edit& edit) {
    EditHeaderProxy header;
    const bool read = edit.m_store.readObject(EditHeaderProxy::EditHeaderId, header);
    if (edit.m_debug) {
        herc_printf(read ? "Loaded the configb \n" : "Failed to load the configb \n");
    }
    if (!read) {
        const String why = edit.m_store.objectError();
        return Qx::Status::failure(Qx::StatusCode::Damaged, "it has no header that reads" +
                                                                (why.empty() ? String() : " (" + why + ")"));
    }
    edit.m_header = header.header();
    edit.clear_cache_flags();
    return {};
}

void Edit::getInfoFromHeader() {
    m_load_edit_bits_from_header();
    m_changes.setValueSilently(getChangeDescription());
}

void Edit::m_load_edit_bits_from_header() {
    m_entireMedium = EditKeys::kEntireMedium.get(m_header);
    if (!m_header.contains(EditKeys::kQualityText) && m_header.contains(EditKeys::kQuality)) {
        EditKeys::kQualityText.set(m_header, String::format("%d mins", EditKeys::kQuality.get(m_header)));
    }
    if (m_header.contains(EditKeys::kCurrentTime)) {
        set_current_time_raw(NO_CHAN, EditKeys::kCurrentTime.get(m_header));
    }
    m_markTime = Qx::kNoTime;
    set_mark_time_raw(NO_CHAN, EditKeys::kMarkTime.get(m_header));

    Vector<IdStamp> chans;
    getChans(chans, AudioChan);
    for (const IdStamp& chan : chans) {
        const int index = EditFile::oldIndex(*this, chan);
        AudCel audio = getAudCel(chan);
        audio.setSoundOutputEnabled(m_header.getInt(EditKeys::numbered(EditKeys::kSoundOutput, index), 1) !=
                                    0);
        audio.setXFadesEnabled(m_header.getInt(EditKeys::numbered(EditKeys::kSoundOutputXFade, index), 0) !=
                               0);
        setAudCel(audio);
        const String syncError = EditKeys::numbered(EditKeys::kSyncError, index);
        if (m_header.contains(syncError)) {
            setSyncLoss(chan, m_header.getDouble(syncError));
        }
    }
    for (int i = 0; i < getNumChans(); ++i) {
        const String syncLoss = EditKeys::numbered(EditKeys::kSyncLoss, i);
        if (m_header.contains(syncLoss)) {
            setSyncLoss(getId(i), m_header.getDouble(syncLoss));
        }
    }
}

size_t Edit::getNumStoredObjects() const {
    return m_store.getNumObjects();
}
