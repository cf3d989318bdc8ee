#include "edit/model/edit.h"

#include "edit/model/cue_list.h"
#include "edit/model/detail/channel_set.h"
#include "edit/model/detail/edit_labels.h"
#include "edit/model/edit_keys.h"
#include "platform/base/critical_section.h"
#include "platform/notify/val_server.h"
#include "platform/services/log.h"
#include "platform/store/edit_header_proxy.h"
#include "platform/store/tag.h"

namespace {

std::atomic<uint64_t> constructed{0};
std::atomic<bool> defaultDebugMode{false};

} // namespace

struct Edit::Parts {
    explicit Parts(Dirtiable& edit) : header(EditKeys::kHeaderName, EditKeys::kHeaderEnd, &edit) {}

    configb header;
    cue_list cues;
    TagBag store;
    ValServer<EditModification> changes;
    criticalSection section;
};

Edit::Edit()
    : m_parts(std::make_unique<Parts>(*this)), m_header(m_parts->header),
      m_channels(std::make_unique<ChannelSet>()), m_cues(m_parts->cues), m_store(m_parts->store),
      m_changes(m_parts->changes), m_section(m_parts->section) {
    constructed.fetch_add(1);
    m_debug = defaultDebugMode.load();
    init();
}

Edit::~Edit() {
    m_header.setObserver(nullptr);
}

uint64_t Edit::numConstructed() {
    return constructed.load();
}

void Edit::setDefaultDebugMode(bool on) {
    defaultDebugMode.store(on);
}

void Edit::init() {
    m_initialising = true;
    m_temporary = false;
    m_cookie = invalid_cookie;
    m_currentTime = 0;
    m_markTime = Qx::kNoTime;
    m_cues.delete_all_cues();
    m_celCuesLoaded = false;
    m_channels->clear();
    m_upgrade.reset();
    initHeader();
    m_changes.setValue(kInitial);
    m_dirty = false;
    m_header.setDirty(false);
    m_initialising = false;
}

EditPtr Edit::copy() const {
    EditPtr twin(new Edit);
    twin->m_initialising = true;
    twin->m_header = m_header;
    twin->m_channels = m_channels->clone();
    twin->m_entireMedium = m_entireMedium;
    twin->m_currentTime = m_currentTime;
    twin->m_markTime = m_markTime;
    twin->clear_cache_flags();
    twin->m_labels = m_labels ? std::make_unique<Labels>(*m_labels) : nullptr;
    for (const String& name : m_store.names()) {
        const ChannelSet::Channel* const channel = m_channels->find(IdStamp(name));
        if (name == EditHeaderProxy::EditHeaderId || name == EditKeys::kCues ||
            name.starts_with(EditKeys::kCelid) ||
            (channel != nullptr && channel->list == ChannelSet::Levels)) {
            continue; // what a save puts there of the edit itself
        }
        if (const Qx::Status status = twin->m_store.copyObject(m_store, name, name); !status) {
            herc_printf("Edit::copy( %s ) - object \"%s\" cannot be read and is left out: %s\n",
                        cookie_string(m_cookie).c_str(), name.c_str(), status.reason().c_str());
        }
    }
    twin->m_cues = m_cues;
    twin->m_celCuesLoaded = m_celCuesLoaded;
    for (int i = 0; i < getNumChans(); ++i) {
        if (const cel* const content = get_edit_cel_p(i)) {
            twin->m_cues.rebindCel(content, twin->get_edit_cel_p(i));
        }
    }
    twin->m_changes.setValueSilently(m_changes.getValue());
    twin->m_dirty = false;
    twin->m_header.setDirty(false);
    twin->m_initialising = false;
    return twin;
}

Edit_Chan_Type Edit::edit_chan_type_from_cookie_type(Cookie_Type kind) {
    switch (kind) {
    case Cookie_Type::Control:
        return ControlChan;
    case Cookie_Type::Sound:
        return AudioChan;
    case Cookie_Type::TChannel:
        return TChan;
    case Cookie_Type::Video:
        return VideoChan;
    default:
        return NoChan;
    }
}

Edit_Chan_Type Edit::edit_chan_type_from_name(char letter) {
    switch (letter) {
    case 'A':
        return AudioChan;
    case 'C':
    case 'G':
    case 'M':
        return ControlChan;
    case 'T':
        return TChan;
    case 'V':
        return VideoChan;
    default:
        return NoChan;
    }
}

Edit_Chan_Type Edit::edit_chan_type_from_name(wchar_t letter) {
    return letter >= L'A' && letter <= L'Z' ? edit_chan_type_from_name(static_cast<char>(letter)) : NoChan;
}

Edit_Chan_Letter Edit::edit_chan_letter_from_type(Edit_Chan_Type type, Edit_Chan_SubType subtype) {
    switch (type) {
    case VideoChan:
        return Edit_Chan_Letter::V;
    case AudioChan:
        return Edit_Chan_Letter::A;
    case TChan:
        return Edit_Chan_Letter::T;
    case ControlChan:
        break;
    default:
        return Edit_Chan_Letter::X;
    }
    switch (subtype) {
    case Edit_Chan_SubType::MIXER_CTL_TRACK:
        return Edit_Chan_Letter::M;
    case Edit_Chan_SubType::GPI_CTL_TRACK:
        return Edit_Chan_Letter::G;
    default:
        return Edit_Chan_Letter::C;
    }
}

const char* Edit::subTypeText(Edit_Chan_SubType subtype) {
    switch (subtype) {
    case Edit_Chan_SubType::FX:
        return "SUBTYPE:FX";
    case Edit_Chan_SubType::ALIAS:
        return "SUBTYPE:ALIAS";
    case Edit_Chan_SubType::INVALID:
        return "SUBTYPE:INVALID";
    default:
        return "SUBTYPE:NONE";
    }
}

Tag<FXGraphNodeBase> Edit::getVideoNodeForEvent(const ce_handle& event) const {
    return openObject(event.getEffectGraph());
}
