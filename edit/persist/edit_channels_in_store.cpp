#include "edit/model/channel_group_list.h"
#include "edit/model/edit_registry.h"
#include "edit/persist/detail/edit_salvager.h"
#include "edit/persist/detail/stored_channels.h"
#include "platform/base/attrib_value_pair.h"
#include "platform/services/log.h"

#include <algorithm>
#include <cstring>

namespace {

// The text of a CelKind key: the letter of the channel's type, and this for a channel with its own name.
constexpr std::string_view kOwnName = " named";

bool isEffects(const String& subType) {
    return subType == Edit::subTypeText(Edit_Chan_SubType::ALIAS) ||
           subType == Edit::subTypeText(Edit_Chan_SubType::FX);
}

// Why an object of the store is not what its name stands for.
String whyNot(const TagBag& store) {
    return store.objectError().empty() ? String("it is of another class") : store.objectError();
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
        return Qx::Status::failure(Qx::StatusCode::Damaged,
                                   "object " + object +
                                       " is the content of no channel that an edit holds (\"" + text +
                                       "\", \"" + subType + "\")");
    }
    loaded.type = {type, Edit_Chan_SubType::NONE};
    return {};
}

static Qx::Status loadCel(TagBag& store, const configb& header, int number, EditFile::LoadedCel& loaded) {
    const String object = EditKeys::numbered(EditKeys::kCelid, number);
    auto content = std::make_shared<cel>();
    if (!store.readObject(object, *content)) {
        const String kind = header.getString(EditKeys::numbered(EditKeys::kCelKind, number));
        loaded.type.type = kind.empty() ? NoChan : Edit::edit_chan_type_from_name(kind.front());
        return Qx::Status::failure(Qx::StatusCode::Damaged,
                                   "object " + object + " is not a cel that reads (" + whyNot(store) + ")");
    }
    loaded.content = std::move(content);
    return findKind(header, number, loaded);
}

std::vector<EditFile::LoadedCel> EditFile::loadCels(Edit& edit, Salvager* salvager) {
    std::vector<LoadedCel> cels;
    const int last = salvager == nullptr ? -1 : salvager->lastCel();
    for (int n = 0; n <= last || edit.m_store.contains(EditKeys::numbered(EditKeys::kCelid, n)); ++n) {
        LoadedCel& loaded = cels.emplace_back();
        const String object = EditKeys::numbered(EditKeys::kCelid, n);
        const bool missing = !edit.m_store.contains(object);
        Qx::Status status = loadCel(edit.m_store, edit.m_header, n, loaded);
        if (loaded.content != nullptr && salvager != nullptr && salvager->guessKind(loaded)) {
            status = {};
        }
        if (status) {
            if (salvager != nullptr) {
                salvager->celRead(loaded);
            }
            continue;
        }
        loaded.content.reset();
        if (salvager == nullptr) {
            setAside(edit, object, status.reason());
        } else if (missing) {
            salvager->celMissing(n);
        } else {
            salvager->celFailed(n, status.reason());
        }
    }
    for (const String& name : salvager == nullptr ? edit.m_store.names() : std::vector<String>()) {
        int number = 0;
        if (name.starts_with(EditKeys::kCelid) &&
            Qx::textToInt(std::string_view(name).substr(std::strlen(EditKeys::kCelid)), number) &&
            number >= std::ssize(cels)) {
            setAside(edit, name, "object " + name + " lies behind a gap in their numbers");
        }
    }
    return cels;
}

std::vector<EditFile::LoadedLevels> EditFile::loadLevels(Edit& edit, const std::vector<LoadedCel>& cels,
                                                         Salvager* salvager) {
    std::vector<LoadedLevels> all;
    for (int m = 0;; ++m) {
        const Qx::AttribValuePair pair = levelsPair(edit.m_header, m);
        if (!pair.valid()) {
            break;
        }
        LoadedLevels& loaded = all.emplace_back();
        loaded.pairing = pair.asString();
        loaded.audio = IdStamp(std::string_view(pair.value()));
        loaded.name = edit.m_header.getString(EditKeys::numbered(EditKeys::kLevelsName, m));
        loaded.place = edit.m_header.getInt(EditKeys::numbered(EditKeys::kLevelsPlace, m), m);
        const bool hasAudio = std::any_of(cels.begin(), cels.end(), [&](const LoadedCel& candidate) {
            return candidate.content != nullptr && candidate.type.type == AudioChan && loaded.audio.valid() &&
                   candidate.content->editChannelId() == loaded.audio;
        });
        if (!hasAudio || !edit.m_store.contains(pair.attrib())) {
            if (salvager != nullptr) {
                salvager->levelsMissing(m, hasAudio);
                continue;
            }
            herc_printf("EditFile::loadLevels( %s ) - levels %d have no audio channel or no nodes\n",
                        edit.get_cookie_str().c_str(), m);
            continue;
        }
        loaded.levels = AudLevelsCel::createFromStore(IdStamp(std::string_view(pair.attrib())), edit.m_store);
        if (loaded.levels.valid()) {
            continue;
        }
        const String why =
            "object " + pair.attrib() + " is not a level envelope that reads (" + whyNot(edit.m_store) + ")";
        if (salvager != nullptr) {
            salvager->levelsFailed(m, why);
            continue;
        }
        herc_printf("EditFile::loadLevels( %s ) - %s; it is passed over and kept\n",
                    edit.get_cookie_str().c_str(), why.c_str());
    }
    std::stable_sort(all.begin(), all.end(),
                     [](const LoadedLevels& a, const LoadedLevels& b) { return a.place < b.place; });
    return all;
}

Qx::Status EditFile::setupChannels(Edit& edit, std::vector<LoadedCel>& cels, std::vector<FileChannel>& file) {
    edit.m_storedCels = std::make_shared<Edit::StoredCels>();
    for (LoadedCel& loaded : cels) {
        FileChannel& channel = file.emplace_back();
        channel.isAudio = loaded.type.type == AudioChan;
        Edit::StoredCels::Entry& stored = edit.m_storedCels->entries.emplace_back();
        if (loaded.content == nullptr) {
            continue;
        }
        cel& content = *loaded.content;
        const IdStamp wanted = content.editChannelId();
        const String name = content.editChannelName();
        stored = {loaded.content, name, wanted, content.editChannelSubType(),
                  content.editChannelMaterialInfo()};
        if (!loaded.ownName) {
            content.editChannelInfo(String(), wanted, content.editChannelSubType(),
                                    content.editChannelMaterialInfo());
        }
        channel.id = edit.setupEditChannel(loaded.type, loaded.content);
        if (!channel.id.valid()) {
            return Qx::Status::failure(Qx::StatusCode::Damaged, "channel " + name + " could not be added");
        }
        if (channel.id != wanted) {
            herc_printf(
                "EditFile::setupChannels( %s ) - channel %s has a stamp that is taken; given a new one\n",
                edit.get_cookie_str().c_str(), name.c_str());
        }
        // The standard name of a channel may be the name that it was given, too.
        const bool own = loaded.kindIsStated ? loaded.ownName : edit.getChanDisplayName(channel.id) != name;
        if (own && !name.empty()) {
            edit.setChanName(channel.id, name);
        }
    }
    return {};
}

void EditFile::setupLevels(Edit& edit, std::vector<LoadedLevels>& levels, std::vector<FileChannel>& file) {
    for (LoadedLevels& loaded : levels) {
        FileChannel& channel = file.emplace_back();
        if (!loaded.levels.valid()) {
            continue;
        }
        loaded.levels.checkNodesRevision(edit.getAudCel(loaded.audio));
        channel.id = edit.addLevelsChan(loaded.audio, loaded.levels);
        if (!channel.id.valid()) {
            herc_printf("EditFile::setupLevels( %s ) - the levels %s are passed over: their audio channel "
                        "has levels already\n",
                        edit.get_cookie_str().c_str(), loaded.levels.id().asString().c_str());
            loaded.levels = AudLevelsCel();
            continue;
        }
        edit.setChanName(channel.id, loaded.name);
    }
}

/// The pairings of levels that did not become a channel get keys of their own, so that a save keeps both the
/// keys and the objects. A stamp names one object for ever, so those keep their names.
void EditFile::setLevelsAside(Edit& edit, const std::vector<LoadedLevels>& levels) {
    configb& header = edit.m_header;
    int read = 0;
    int unread = 0;
    for (const LoadedLevels& loaded : levels) {
        if (loaded.levels.valid()) {
            header.setString(EditKeys::numbered(EditKeys::kLevels, read++), loaded.pairing);
            continue;
        }
        while (header.contains(EditKeys::numbered(EditKeys::kLevelsUnread, unread))) {
            ++unread;
        }
        header.setString(EditKeys::numbered(EditKeys::kLevelsUnread, unread), loaded.pairing);
    }
    EditKeys::removeNumbered(header, EditKeys::kLevels, read);
}

// What is wrong with the numbers of channels, if anything.
static String limitMessage(int audio, int levels, int video) {
    const struct {
        const char* text;
        int count;
        int most;
    } limits[] = {{"Too many audio channels (%d)", audio, static_cast<int>(kMaxAudioChans)},
                  {"Too many levels tracks (%d)", levels, audio},
                  {"Too many video channels (%d)", video, static_cast<int>(kMaxVideoChans)}};
    for (const auto& [text, count, most] : limits) {
        if (count > most) {
            const std::string_view form(text);
            return String(form.substr(0, form.find('%'))) + std::to_string(count) + ")";
        }
    }
    return {};
}

// Telecine and pulldown are settled by the source media and change no event here, so a read ends with the
// limits.
Qx::Status EditFile::readCels(Edit& edit, Salvager* salvager) {
    std::vector<LoadedCel> cels = loadCels(edit, salvager);
    std::vector<LoadedLevels> levels = loadLevels(edit, cels, salvager);
    int audio = 0;
    int video = 0;
    for (const LoadedCel& loaded : cels) {
        const bool read = loaded.content != nullptr;
        audio += read && loaded.type.type == AudioChan ? 1 : 0;
        video += read && loaded.type == Edit::ChanType{VideoChan, Edit_Chan_SubType::NONE} ? 1 : 0;
    }
    const auto numLevels = std::count_if(levels.begin(), levels.end(),
                                         [](const LoadedLevels& loaded) { return loaded.levels.valid(); });
    if (const String message = limitMessage(audio, static_cast<int>(numLevels), video); !message.empty()) {
        LogBoth("%s\n", message.c_str());
        return Qx::Status::failure(Qx::StatusCode::Damaged, message);
    }
    if (std::none_of(cels.begin(), cels.end(), [](const LoadedCel& cel) { return cel.content != nullptr; })) {
        return Qx::Status::failure(Qx::StatusCode::Damaged, "it has no channels");
    }
    // The cues' channel numbers are those of the whole file: they do not move as its channels are added.
    const cue_list cues = edit.m_cues;
    edit.m_cues.delete_all_cues();
    std::vector<FileChannel> file;
    if (Qx::Status status = setupChannels(edit, cels, file); !status) {
        return status;
    }
    setupLevels(edit, levels, file);
    const auto unread = [](const LoadedLevels& loaded) { return !loaded.levels.valid(); };
    if (salvager == nullptr && std::any_of(levels.begin(), levels.end(), unread)) {
        setLevelsAside(edit, levels);
    }
    edit.m_cues = cues;
    renumber(edit, file);
    edit.convertCues();
    return {};
}

void EditFile::readGroups(Edit& edit, Salvager* salvager) {
    for (const char* name : {ChannelGroupList::Id, ChannelGroupList::IdForDefaultGrouping}) {
        if (!edit.m_store.contains(name) ||
            dynamic_cast<ChannelGroupList*>(edit.m_store.openObject(name)) != nullptr) {
            continue;
        }
        const String why =
            "object " + String(name) + " is not a list of groups that reads (" + whyNot(edit.m_store) + ")";
        if (salvager == nullptr) {
            setAside(edit, name, why);
        } else {
            salvager->lose("the channel groups: " + why);
            edit.m_store.removeObject(name);
        }
    }
}

void EditFile::readCues(Edit& edit) {
    if (!edit.retrieveCues()) {
        setAside(edit, EditKeys::kCues,
                 "object " + String(EditKeys::kCues) + " is not a cue list that reads (" +
                     whyNot(edit.m_store) + ")");
    }
}

void EditFile::setAside(Edit& edit, const String& object, const String& why) {
    String name = object + EditKeys::kUnread;
    for (int i = 1; edit.m_store.contains(name); ++i) {
        name = EditKeys::numbered((object + ".").c_str(), i) + EditKeys::kUnread;
    }
    herc_printf("Edit::retrieve( %s ) - %s; it is passed over and kept as \"%s\"\n",
                edit.get_cookie_str().c_str(), why.c_str(), name.c_str());
    edit.m_store.renameObject(object, name);
}

// ---- writing

namespace {

/// Levels channels with their audio channels, in the order of these.
using LevelsPairs = std::vector<std::pair<IdStamp, IdStamp>>;

/// Writes the keys of the pairings. The places of levels among the levels channels are written where they are
/// in another order than their audio channels.
void putLevelsKeys(const Edit& edit, configb& header, const LevelsPairs& pairs) {
    std::vector<int> places;
    for (const auto& [levels, audio] : pairs) {
        places.push_back(edit.getIdx(levels));
    }
    const bool inOrder = std::is_sorted(places.begin(), places.end());
    const int first = edit.getNumChans(VideoChan) + edit.getNumChans(AudioChan);
    const int count = static_cast<int>(pairs.size());
    for (int m = 0; m < count; ++m) {
        const auto& [levels, audio] = pairs[static_cast<size_t>(m)];
        header.setString(EditKeys::numbered(EditKeys::kLevels, m),
                         Qx::AttribValuePair(levels.asString(), audio.asString()).asString());
        const String nameKey = EditKeys::numbered(EditKeys::kLevelsName, m);
        const String name = edit.getChanName(levels);
        if (name.empty()) {
            header.remove(nameKey);
        } else {
            header.setString(nameKey, name);
        }
        if (!inOrder) {
            header.setInt(EditKeys::numbered(EditKeys::kLevelsPlace, m),
                          places[static_cast<size_t>(m)] - first);
        }
    }
    EditKeys::removeNumbered(header, EditKeys::kLevels, count);
    EditKeys::removeNumbered(header, EditKeys::kLevelsName, count);
    EditKeys::removeNumbered(header, EditKeys::kLevelsPlace, inOrder ? 0 : count);
}

} // namespace

void EditFile::lendCels(Edit& edit) {
    TagBag& store = edit.m_store;
    configb& header = edit.m_header;
    auto lent = std::make_shared<Edit::StoredCels>();
    LevelsPairs levelsOf;
    int n = 0;
    // Levels that the edit has no more leave the store.
    for (int i = 0; levelsPair(header, i).valid(); ++i) {
        const IdStamp id(std::string_view(levelsPair(header, i).attrib()));
        if (id.valid() && !edit.getLevelsCel(id).valid()) {
            store.removeObject(id.asString());
        }
    }
    for (int i = 0; i < edit.getNumChans(); ++i) {
        const IdStamp id = edit.getId(i);
        const Qx::Ptr<cel> content = edit.contentOf(id);
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
            levelsOf.push_back({levels.id(), id});
        }
    }
    putLevelsKeys(edit, header, levelsOf);
    EditKeys::removeNumbered(header, EditKeys::kCelKind, n);
    for (int gone = n; store.removeObject(EditKeys::numbered(EditKeys::kCelid, gone)); ++gone) {
    }
    edit.m_storedCels = std::move(lent);
}

void Edit::extractCelsFromStore(bool written) noexcept {
    m_store.releaseLent();
    if (!written) {
        // What the store holds under each name is not known after a failure: the next save packs every cel.
        m_storedCels.reset();
    }
}

// ---- both

void EditFile::reset(Edit& edit) {
    const Quiet quiet(edit);
    edit.removeChans(false);
    edit.get_cues().delete_all_cues();
    edit.m_storedCels.reset();
    const cookie item = edit.m_cookie;
    edit.init();
    edit.m_cookie = item;
}

void EditFile::markWritten(Edit& edit) {
    for (int i = 0; i < edit.getNumChans(); ++i) {
        const IdStamp id = edit.getId(i);
        if (const Qx::Ptr<cel> content = edit.contentOf(id)) {
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
