#include "edit/model/channel_group_list.h"
#include "edit/model/edit_registry.h"
#include "edit/persist/detail/edit_salvaging.h"
#include "edit/persist/detail/stored_channels.h"
#include "platform/base/attrib_value_pair.h"
#include "platform/services/log.h"

namespace {

// The text of a CelKind key: the letter of the channel's type, and this for a channel with its own name.
constexpr std::string_view kOwnName = " named";

bool isEffects(const String& subType) {
    return subType == Edit::subTypeText(Edit_Chan_SubType::ALIAS) ||
           subType == Edit::subTypeText(Edit_Chan_SubType::FX);
}

Qx::AttribValuePair levelsPair(const configb& header, int number) {
    return Qx::AttribValuePair(
        std::string_view(header.getString(EditKeys::numbered(EditKeys::kLevels, number))));
}

} // namespace

// ---- reading

// What kind of channel a cel makes: what the header says, else what the first letter of its name says, as in
// the legacy text.
static Qx::Status findKind(const configb& header, int number, EditFile::LoadedCel& loaded) {
    const String object = EditKeys::numbered(EditKeys::kCelid, number);
    const String& subType = loaded.content->editChannelSubType();
    const String& name = loaded.content->editChannelName();
    String kind = header.getString(EditKeys::numbered(EditKeys::kCelKind, number));
    loaded.kindIsStated = !kind.empty();
    if (kind.ends_with(kOwnName)) {
        loaded.ownName = true;
        kind.resize(kind.size() - kOwnName.size());
    }
    const String& text = loaded.kindIsStated ? kind : name;
    const Edit_Chan_Type type = text.empty() ? NoChan : Edit::edit_chan_type_from_name(text.front());
    if (isEffects(subType) && (type == VideoChan || !loaded.kindIsStated)) {
        loaded.type = {VideoChan, Edit_Chan_SubType::ALIAS};
        return {};
    }
    if (subType != Edit::subTypeText(Edit_Chan_SubType::NONE) || (type != VideoChan && type != AudioChan)) {
        return Qx::Status::failure("object " + object +
                                   " is the content of no channel that an edit holds (\"" + text + "\", \"" +
                                   subType + "\")");
    }
    loaded.type = {type, Edit_Chan_SubType::NONE};
    return {};
}

static Qx::Status loadCel(TagBag& store, const configb& header, int number, EditFile::LoadedCel& loaded) {
    const String object = EditKeys::numbered(EditKeys::kCelid, number);
    loaded.content = std::make_shared<cel>();
    if (!store.readObject(object, *loaded.content)) {
        return Qx::Status::failure("object " + object + " is not a cel that reads (" + store.objectError() +
                                   ")");
    }
    return findKind(header, number, loaded);
}

Qx::Status EditFile::loadCels(Edit& edit, std::vector<LoadedCel>& cels, Salvaging* salvaging) {
    const int last = salvaging == nullptr ? -1 : salvaging->lastCel();
    for (int n = 0; n <= last || edit.m_store.contains(EditKeys::numbered(EditKeys::kCelid, n)); ++n) {
        if (salvaging != nullptr && !edit.m_store.contains(EditKeys::numbered(EditKeys::kCelid, n))) {
            salvaging->celMissing(n);
            continue;
        }
        LoadedCel loaded;
        Qx::Status status = loadCel(edit.m_store, edit.m_header, n, loaded);
        if (salvaging != nullptr && salvaging->guessKind(loaded)) {
            status = {};
        }
        if (!status && salvaging == nullptr) {
            return status;
        }
        if (!status) {
            salvaging->celFailed(n, status.reason());
            continue;
        }
        if (salvaging != nullptr) {
            salvaging->celRead(n, loaded);
        }
        cels.push_back(std::move(loaded));
    }
    return {};
}

Qx::Status EditFile::loadLevels(Edit& edit, const std::vector<LoadedCel>& cels,
                                std::vector<LoadedLevels>& levels, Salvaging* salvaging) {
    for (int m = 0;; ++m) {
        const Qx::AttribValuePair pair = levelsPair(edit.m_header, m);
        if (!pair.valid()) {
            return {};
        }
        LoadedLevels loaded;
        loaded.audio = IdStamp(std::string_view(pair.value()));
        bool hasAudio = false;
        for (const LoadedCel& candidate : cels) {
            hasAudio = hasAudio || (candidate.type.type == AudioChan && loaded.audio.valid() &&
                                    candidate.content->editChannelId() == loaded.audio);
        }
        if (!hasAudio || !edit.m_store.contains(pair.attrib())) {
            if (salvaging != nullptr) {
                salvaging->levelsMissing(m, hasAudio);
                continue;
            }
            herc_printf("EditFile::loadLevels( %s ) - levels %d have no audio channel or no nodes\n",
                        edit.get_cookie_str().c_str(), m);
            continue;
        }
        loaded.levels = AudLevelsCel::createFromStore(IdStamp(std::string_view(pair.attrib())), edit.m_store);
        if (!loaded.levels.valid()) {
            const String why = "object " + pair.attrib() + " is not a level envelope that reads (" +
                               edit.m_store.objectError() + ")";
            if (salvaging == nullptr) {
                return Qx::Status::failure(why);
            }
            salvaging->levelsFailed(m, why);
            continue;
        }
        loaded.name = edit.m_header.getString(EditKeys::numbered(EditKeys::kLevelsName, m));
        levels.push_back(std::move(loaded));
    }
}

Qx::Status EditFile::setupChannels(Edit& edit, std::vector<LoadedCel>& cels) {
    edit.m_storedCels = std::make_shared<Edit::StoredCels>();
    for (LoadedCel& loaded : cels) {
        cel& content = *loaded.content;
        const IdStamp wanted = content.editChannelId();
        const String name = content.editChannelName();
        edit.m_storedCels->entries.push_back(
            {loaded.content, name, wanted, content.editChannelSubType(), content.editChannelMaterialInfo()});
        if (!loaded.ownName) {
            content.editChannelInfo(String(), wanted, content.editChannelSubType(),
                                    content.editChannelMaterialInfo());
        }
        const IdStamp id = edit.setupEditChannel(loaded.type, loaded.content);
        if (!id.valid()) {
            return Qx::Status::failure("channel " + name + " could not be added");
        }
        if (id != wanted) {
            herc_printf(
                "EditFile::setupChannels( %s ) - channel %s has a stamp that is taken; given a new one\n",
                edit.get_cookie_str().c_str(), name.c_str());
        }
        // The standard name of a channel may be the name that it was given, too.
        const bool own = loaded.kindIsStated ? loaded.ownName : edit.getChanDisplayName(id) != name;
        if (own && !name.empty()) {
            edit.setChanName(id, name);
        }
    }
    return {};
}

// Telecine and pulldown are settled by the source media and change no event here, so a read ends with the
// limits.
Qx::Status EditFile::readCels(Edit& edit, Salvaging* salvaging) {
    std::vector<LoadedCel> cels;
    std::vector<LoadedLevels> levels;
    Qx::Status status = loadCels(edit, cels, salvaging);
    if (status) {
        status = loadLevels(edit, cels, levels, salvaging);
    }
    if (!status) {
        return status;
    }
    int audio = 0;
    int video = 0;
    for (const LoadedCel& loaded : cels) {
        audio += loaded.type.type == AudioChan ? 1 : 0;
        video += loaded.type == Edit::ChanType{VideoChan, Edit_Chan_SubType::NONE} ? 1 : 0;
    }
    const char* message = nullptr;
    int count = 0;
    if (audio > static_cast<int>(kMaxAudioChans)) {
        message = "Too many audio channels (%d)\n";
        count = audio;
    } else if (static_cast<int>(levels.size()) > audio) {
        message = "Too many levels tracks (%d)\n";
        count = static_cast<int>(levels.size());
    } else if (video > static_cast<int>(kMaxVideoChans)) {
        message = "Too many video channels (%d)\n";
        count = video;
    }
    if (message != nullptr) {
        const String text =
            String(message).substr(0, String(message).find('%')) + std::to_string(count) + ")";
        LogBoth("%s\n", text.c_str());
        return Qx::Status::failure(text);
    }
    if (cels.empty()) {
        return Qx::Status::failure("it has no channels");
    }
    // The cues' channel numbers are those of the whole edit: they do not move as its channels are added.
    const cue_list cues = edit.m_cues;
    edit.m_cues.delete_all_cues();
    status = setupChannels(edit, cels);
    if (!status) {
        return status;
    }
    for (LoadedLevels& loaded : levels) {
        loaded.levels.checkNodesRevision(edit.getAudCel(loaded.audio));
        const IdStamp id = edit.addLevelsChan(loaded.audio, loaded.levels);
        if (!id.valid()) {
            return Qx::Status::failure("the levels " + loaded.levels.id().asString() +
                                       " could not be joined to their audio channel");
        }
        edit.setChanName(id, loaded.name);
    }
    edit.m_cues = cues;
    edit.convertCues();
    return {};
}

Qx::Status EditFile::readGroups(Edit& edit) {
    for (const char* name : {ChannelGroupList::Id, ChannelGroupList::IdForDefaultGrouping}) {
        if (edit.m_store.contains(name) &&
            dynamic_cast<ChannelGroupList*>(edit.m_store.openObject(name)) == nullptr) {
            return Qx::Status::failure("object " + String(name) + " is not a list of groups that reads (" +
                                       edit.m_store.objectError() + ")");
        }
    }
    return {};
}

Qx::Status EditFile::readCues(Edit& edit) {
    if (!edit.retrieveCues()) {
        return Qx::Status::failure("object " + String(EditKeys::kCues) + " is not a cue list that reads (" +
                                   edit.m_store.objectError() + ")");
    }
    return {};
}

// ---- writing

Qx::Ptr<cel> EditFile::sharedCel(const Edit& edit, const IdStamp& chan) {
    const Edit::ChanType type = edit.getChanTypeAndSubType(chan);
    if (type.type == AudioChan) {
        return edit.getAudCel(chan).sharedCel();
    }
    if (type.type != VideoChan) {
        return nullptr;
    }
    return type.subtype == Edit_Chan_SubType::ALIAS ? edit.getVFXCel(chan).sharedCel()
                                                    : edit.getVidCel(chan).sharedCel();
}

void EditFile::lendCels(Edit& edit) {
    TagBag& store = edit.m_store;
    configb& header = edit.m_header;
    auto lent = std::make_shared<Edit::StoredCels>();
    int n = 0;
    int m = 0;
    // Levels that no key names any more leave the store.
    for (int i = 0; levelsPair(header, i).valid(); ++i) {
        const IdStamp id(std::string_view(levelsPair(header, i).attrib()));
        if (id.valid() && !edit.getLevelsCel(id).valid()) {
            store.removeObject(id.asString());
        }
    }
    for (int i = 0; i < edit.getNumChans(); ++i) {
        const IdStamp id = edit.getId(i);
        const Qx::Ptr<cel> content = sharedCel(edit, id);
        if (content == nullptr) {
            continue;
        }
        const Edit::ChanType type = edit.getChanTypeAndSubType(id);
        Edit::StoredCels::Entry entry{content, edit.getChanDisplayName(id), id,
                                      Edit::subTypeText(type.subtype), edit.getMaterialInfo(id)};
        const bool known =
            edit.m_storedCels != nullptr && edit.m_storedCels->holds(static_cast<size_t>(n), entry);
        const bool changed = content->changed() || !known;
        content->editChannelInfo(entry.name, entry.id, entry.subType, entry.materialInfo);
        store.lendObject(EditKeys::numbered(EditKeys::kCelid, n), *content, changed);
        String kind(1, static_cast<char>(Edit::edit_chan_letter_from_type(type.type, type.subtype)));
        if (!edit.getChanName(id).empty()) {
            kind += kOwnName;
        }
        header.setString(EditKeys::numbered(EditKeys::kCelKind, n), kind);
        lent->entries.push_back(std::move(entry));
        ++n;
        if (type.type != AudioChan) {
            continue;
        }
        const AudLevelsCel levels = edit.getLevelsCel(edit.getAudCel(id).getLevelsChanID());
        if (levels.valid()) {
            levels.writeToStore(store);
            header.setString(EditKeys::numbered(EditKeys::kLevels, m),
                             Qx::AttribValuePair(levels.id().asString(), id.asString()).asString());
            const String levelsName = EditKeys::numbered(EditKeys::kLevelsName, m);
            const String name = edit.getChanName(levels.id());
            if (name.empty()) {
                header.remove(levelsName);
            } else {
                header.setString(levelsName, name);
            }
            ++m;
        }
    }
    EditKeys::removeNumbered(header, EditKeys::kLevelsName, m);
    EditKeys::removeNumbered(header, EditKeys::kCelKind, n);
    EditKeys::removeNumbered(header, EditKeys::kLevels, m);
    for (int gone = n; store.removeObject(EditKeys::numbered(EditKeys::kCelid, gone)); ++gone) {
    }
    edit.m_storedCels = std::move(lent);
}

void EditFile::extractCelsFromStore(Edit& edit, bool written) noexcept {
    edit.m_store.releaseLent();
    if (!written) {
        // What the store holds under each name is not known after a failure: the next save packs every cel.
        edit.m_storedCels.reset();
    }
}

// ---- both

void EditFile::reset(Edit& edit) {
    const Quiet quiet(edit);
    edit.removeChans(false);
    edit.get_cues().delete_all_cues();
    edit.forgetGroups();
    edit.m_storedCels.reset();
    const cookie item = edit.m_cookie;
    edit.init();
    edit.m_cookie = item;
}

void EditFile::markWritten(Edit& edit) {
    for (int i = 0; i < edit.getNumChans(); ++i) {
        const IdStamp id = edit.getId(i);
        if (const Qx::Ptr<cel> content = sharedCel(edit, id)) {
            content->setChanged(false);
        } else if (AudLevelsCel levels = edit.getLevelsCel(id); levels.valid()) {
            levels.setChanged(false);
        }
    }
    edit.set_dirty(false);
}

void EditFile::markUnwritten(Edit& edit) {
    edit.init_dirty();
    if (EditRegistry* const registry = EditRegistry::current()) {
        registry->addToDirtyList(edit.m_cookie);
    }
}
