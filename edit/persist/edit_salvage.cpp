#include "edit/persist/edit_salvage.h"

#include "edit/model/channel_group_list.h"
#include "edit/persist/detail/edit_salvager.h"
#include "platform/base/attrib_value_pair.h"
#include "platform/store/edit_header_proxy.h"

#include <exception>

// ---- what is lost

void EditFile::Salvager::setUnsound(const std::vector<StoredObjectInfo>& objects) {
    for (const StoredObjectInfo& object : objects) {
        m_unsound.emplace(object.name, object.reason);
    }
}

void EditFile::Salvager::begin(Edit& edit, bool headerLost) {
    m_edit = &edit;
    m_headerLost = headerLost;
}

bool EditFile::Salvager::loseIfUnsound(const String& object, const String& part) {
    const auto found = m_unsound.find(object);
    if (found == m_unsound.end()) {
        return false;
    }
    lose(part + ": " + found->second);
    m_unsound.erase(found);
    return true;
}

int EditFile::Salvager::lastCel() const {
    int last = -1;
    const String prefix = EditKeys::kCelid;
    const auto look = [&](const String& name) {
        int number = 0;
        if (name.starts_with(prefix) && Qx::textToInt(std::string_view(name).substr(prefix.size()), number) &&
            EditKeys::numbered(EditKeys::kCelid, number) == name && number < kMostCels) {
            last = std::max(last, number);
        }
    };
    for (const String& name : m_edit->m_store.names()) {
        look(name);
    }
    for (const auto& [name, why] : m_unsound) {
        look(name);
    }
    // A channel whose object is gone altogether is known by its kind.
    for (int n = last + 1;
         n < kMostCels && m_edit->m_header.contains(EditKeys::numbered(EditKeys::kCelKind, n)); ++n) {
        last = n;
    }
    return last;
}

char EditFile::Salvager::kindOf(int number) const {
    const String kind = m_edit->m_header.getString(EditKeys::numbered(EditKeys::kCelKind, number));
    return kind.empty() ? '?' : kind.front();
}

// The number from 1 of an audio channel among its kind.
int EditFile::Salvager::audioIndex(int number) const {
    int index = 1;
    for (int n = 0; n < number; ++n) {
        index += kindOf(n) == 'A' ? 1 : 0;
    }
    return index;
}

// The name that a channel has by its place. One of its own lies in its cel.
String EditFile::Salvager::channelName(int number) const {
    switch (kindOf(number)) {
    case 'V':
        // Both are of this kind, so that the number of neither is known from its place.
        return "a video or effects channel";
    case 'A': {
        const bool named =
            m_edit->m_header.getString(EditKeys::numbered(EditKeys::kCelKind, number)).find(' ') !=
            String::npos;
        return "channel A" + std::to_string(audioIndex(number)) + (named ? " (with a name of its own)" : "");
    }
    default:
        return "a channel";
    }
}

void EditFile::Salvager::celMissing(int number) {
    const String object = EditKeys::numbered(EditKeys::kCelid, number);
    const String part = channelName(number) + " (object " + object + ")";
    m_celsLost = true;
    if (!loseIfUnsound(object, part)) {
        lose(part + ": the file does not hold it");
    }
}

void EditFile::Salvager::celFailed(int number, const String& why) {
    m_celsLost = true;
    lose(channelName(number) + ": " + why);
}

String EditFile::Salvager::levelsName(int number) const {
    const String own = m_edit->m_header.getString(EditKeys::numbered(EditKeys::kLevelsName, number));
    return own.empty() ? "levels " + std::to_string(number + 1) : "levels \"" + own + "\"";
}

void EditFile::Salvager::levelsMissing(int number, bool hasAudio) {
    const Qx::AttribValuePair pair(
        std::string_view(m_edit->m_header.getString(EditKeys::numbered(EditKeys::kLevels, number))));
    const String part = levelsName(number);
    // Levels that outlived their audio channel are no damage.
    if (!loseIfUnsound(pair.attrib(), part) && (hasAudio || m_celsLost)) {
        lose(part + (hasAudio ? ": the file does not hold them" : ": their audio channel is lost"));
    }
}

void EditFile::Salvager::levelsFailed(int number, const String& why) {
    lose(levelsName(number) + ": " + why);
}

void EditFile::Salvager::celRead(const LoadedCel& loaded) {
    m_audioSeen = m_audioSeen || loaded.type.type == AudioChan;
}

bool EditFile::Salvager::guessKind(LoadedCel& loaded) {
    const cel& content = *loaded.content;
    const String& name = content.editChannelName();
    const bool byPlace = name.size() > 1 && (name.front() == 'V' || name.front() == 'A') &&
                         name.find_first_not_of("0123456789", 1) == String::npos;
    if (!m_headerLost || byPlace || content.is_good_cel() == 0 || !content.editChannelId().valid() ||
        content.editChannelSubType() != Edit::subTypeText(Edit_Chan_SubType::NONE)) {
        return false;
    }
    loaded.type = {m_audioSeen ? AudioChan : VideoChan, Edit_Chan_SubType::NONE};
    loaded.ownName = true;
    loaded.kindIsStated = true;
    lose("channel \"" + name + "\": its kind is lost with the header; taken for " +
         (m_audioSeen ? "an audio" : "a video") + " channel");
    return true;
}

void EditFile::Salvager::finish() {
    while (!m_unsound.empty()) {
        loseIfUnsound(String(m_unsound.begin()->first), "object " + m_unsound.begin()->first);
    }
}

// ---- reading

namespace {

/// The labels of objects that are found without a table.
TagBag::ScanLabel labelOf(std::string_view form, size_t before) {
    const EditHeaderProxy header;
    const cue_list cues;
    const ChannelGroupList groups;
    const cel content;
    if (form == content.shortLayerName()) {
        return {EditKeys::numbered(EditKeys::kCelid, static_cast<int>(before)), content.layerName()};
    }
    if (form == header.shortLayerName() && before == 0) {
        return {EditHeaderProxy::EditHeaderId, header.layerName()};
    }
    if (form == cues.shortLayerName() && before == 0) {
        return {EditKeys::kCues, cues.layerName()};
    }
    if (form == groups.shortLayerName() && before == 0) {
        return {ChannelGroupList::Id, groups.layerName()};
    }
    return {};
}

} // namespace

// Opens the store with what can be had of it.
static Qx::Status openDamaged(TagBag& store, const String& path, EditFile::Salvager& salvager) {
    std::vector<StoredObjectInfo> objects;
    const TagBag::OpenResult result = store.openSalvaging(path, objects);
    if (result == TagBag::Opened) {
        std::vector<StoredObjectInfo> all;
        String damage;
        const Qx::Status examined = examineStore(path, all, damage);
        if (examined && !damage.empty() && objects.empty()) {
            salvager.lose(damage); // what is wrong is no object's
        }
        salvager.setUnsound(objects);
        const Qx::Status read = store.checkRevisions();
        salvager.setRefused(!read);
        return read;
    }
    salvager.setRefused(result == TagBag::NotOpened || result == TagBag::Newer);
    const Qx::Status damage = store.openStatus();
    if (result != TagBag::Damaged || !salvager.mayScan()) {
        return damage;
    }
    const String& why = damage.reason();
    if (store.openScanning(path, labelOf, objects) != TagBag::Opened) {
        return damage.retold(why + "; no object could be found in it either");
    }
    salvager.lose("the table of the objects: " + why);
    for (const StoredObjectInfo& object : objects) {
        salvager.lose("object " + object.name + " is doubtful: it was found by its form, and " +
                      object.reason);
    }
    return {};
}

Qx::Status EditFile::salvage(Edit& edit, const String& path, Salvager& salvager) {
    const Quiet quiet(edit);
    reset(edit);
    edit.m_initialising = true;
    if (Qx::Status opened = openDamaged(edit.m_store, path, salvager); !opened) {
        return opened;
    }
    const Qx::Status header = readHeader(edit);
    salvager.begin(edit, !header);
    if (!header && !salvager.loseIfUnsound(EditHeaderProxy::EditHeaderId, "the header")) {
        salvager.lose("the header: " + header.reason());
    }
    if (!salvager.loseIfUnsound(EditKeys::kCues, "the cues")) {
        if (!edit.retrieveCues()) {
            const String& why = edit.m_store.objectError();
            salvager.lose("the cues: " + (why.empty() ? String("the object is of another class") : why));
            edit.m_store.removeObject(EditKeys::kCues);
        }
    }
    if (Qx::Status cels = readCels(edit, &salvager); !cels) {
        return cels;
    }
    // The cels have other numbers where some are lost: none is to be taken over as the bytes it was.
    edit.m_storedCels.reset();
    for (const String& name : edit.m_store.names()) {
        if (name.ends_with(EditKeys::kUnread)) {
            salvager.lose("object " + name + " did not read when the edit was opened, and was set aside");
        } else if (name.starts_with(EditKeys::kCelid)) {
            edit.m_store.removeObject(name);
        }
    }
    for (const char* name : {ChannelGroupList::Id, ChannelGroupList::IdForDefaultGrouping}) {
        salvager.loseIfUnsound(name, name == ChannelGroupList::Id ? "the channel groups"
                                                                  : "the default channel groups");
    }
    readGroups(edit, &salvager);
    EditFile::leaveLostChannelsOut(edit);
    salvager.finish();
    edit.getInfoFromHeader();
    return {};
}

static Qx::Status salvageInto(const String& path, EditPtr& edit, std::vector<String>& lost, bool mayScan,
                              bool* isRefused = nullptr) {
    EditPtr read(new Edit);
    EditFile::Salvager salvager(lost, mayScan);
    if (Qx::Status status = EditFile::salvage(*read, path, salvager); !status) {
        if (isRefused != nullptr) {
            *isRefused = salvager.isRefused();
        }
        return status;
    }
    EditFile::convert(*read, lost);
    edit = read;
    return {};
}

void EditFile::leaveLostChannelsOut(Edit& edit) {
    for (ChannelGroupList* const list : {edit.retrieveGroupsList(), edit.retrieveDefaultGroupsList()}) {
        Vector<IdStamp> members;
        for (unsigned i = 0; list != nullptr && i < list->size(); ++i) {
            list->getGroupContents(i, members);
        }
        for (const IdStamp& chan : members) {
            if (!edit.chanValid(chan)) {
                list->removeMember(chan);
            }
        }
    }
}

void EditFile::convert(Edit& edit, std::vector<String>& lost) {
    const Quiet quiet(edit); // a read-only edit too is brought up to date
    try {
        edit.doEditConversions();
    } catch (const std::exception& error) {
        lost.push_back(String("bringing the edit up to date failed: ") + error.what());
    }
}

bool verifyEditFile(const String& path, std::vector<String>& faults, EditPtr* read) {
    EditPtr edit;
    std::vector<String> found;
    bool isRefused = false;
    const Qx::Status status = salvageInto(path, edit, found, false, &isRefused);
    faults.insert(faults.end(), found.begin(), found.end());
    if (!status) {
        faults.push_back(status.reason());
        return !isRefused;
    }
    if (read != nullptr) {
        *read = edit;
    }
    // Objects that nothing above reads are sound unless their class is known and refuses them.
    TagBag& store = edit->objectStore();
    for (const String& name : store.names()) {
        const bool known = name == EditKeys::kCues || name == EditHeaderProxy::EditHeaderId ||
                           name.ends_with(EditKeys::kUnread);
        if (!known && store.openObject(name) == nullptr &&
            store.objectStatus().code() != Qx::StatusCode::Unsupported) {
            faults.push_back(store.objectError());
        }
    }
    return true;
}

Qx::Status salvageEdit(const String& path, EditPtr& edit, std::vector<String>& lost) {
    EditPtr read;
    std::vector<String> found;
    if (Qx::Status status = salvageInto(path, read, found, true); !status) {
        return status;
    }
    read->set_cookie(invalid_cookie);
    configb& header = read->Opts();
    EditKeys::kBackup.set(header, 0);
    EditKeys::kUndoCookie.set(header, invalid_cookie);
    EditKeys::kRedoCookie.set(header, invalid_cookie);
    read->init_dirty();
    lost.insert(lost.end(), found.begin(), found.end());
    edit = read;
    return {};
}
