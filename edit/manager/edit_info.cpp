#include "edit/manager/edit_info.h"

#include "edit/manager/detail/manager_state.h"
#include "edit/manager/edit_record.h"
#include "edit/model/cel.h"
#include "platform/base/scanned_number.h"

namespace {

constexpr int kColumnUnknown = -2;
std::atomic<int> typeColumn{kColumnUnknown};

void findTypeColumn() {
    if (typeColumn.load() == kColumnUnknown) {
        if (const auto records = managerState().records.database()) {
            typeColumn.store(records->columnIndex("Type"));
        }
    }
}

edit_log_type_t ghostType(int flags) {
    const struct {
        int flag;
        edit_log_type_t type;
    } kinds[] = {{kRecordGhost4, kLogGhost4},
                 {kRecordGhost3, kLogGhost3},
                 {kRecordGhost5, kLogGhost5},
                 {kRecordGhost6, kLogGhost6}};
    for (const auto& [flag, type] : kinds) {
        if ((flags & flag) != 0) {
            return type;
        }
    }
    return kLogNone;
}

int flagsFrom(const String& text) {
    int flags = 0;
    return Qx::scanInt(text, flags) ? flags : 0;
}

} // namespace

EditInfo::EditInfo(EditPtr& edit) : m_edit(edit), m_item(edit.valid() ? edit->get_cookie() : invalid_cookie) {
    findTypeColumn();
    openIfPresent();
}

EditInfo::EditInfo(const cookie& item, eEditOpenBehaviour behaviour) : m_item(item), m_behaviour(behaviour) {
    findTypeColumn();
    openIfPresent();
}

void EditInfo::openIfPresent() {
    if (!m_edit.valid() && edit_manager::get_present(m_item)) {
        static_cast<void>(ed().valid());
    }
}

EditPtr& EditInfo::ed() const {
    if (!m_edit.valid()) {
        m_edit.open(m_item, m_behaviour);
    }
    return m_edit;
}

String EditInfo::getAttrib(const char* column) const {
    const auto records = managerState().records.database();
    const int index = records == nullptr ? -1 : records->columnIndex(column);
    projdb::Record record;
    if (index < 0 || index >= projdb::kNumColumns || !currentRecord(m_item, record)) {
        return {};
    }
    return record[static_cast<projdb::Column>(index)];
}

WString EditInfo::getAttribW(const char* column) const {
    return Qx::widen(getAttrib(column));
}

int EditInfo::m_get_num_chans() const {
    return ed().valid() ? m_edit->getNumChans(VideoChan) + m_edit->getNumChans(AudioChan) : 0;
}

int EditInfo::m_get_event_count(int chan) const {
    if (chan < -1) {
        return -1;
    }
    const cel* const content = ed().valid() ? m_edit->get_edit_cel_p(chan) : nullptr;
    return content == nullptr ? 0 : content->numEvents();
}

int EditInfo::m_get_channel_type(int chan) const {
    return static_cast<int>(ed().valid() ? m_edit->getChanType(chan) : NoChan);
}

bool EditInfo::hasLetter(char letter) const {
    return getAttrib(projdb::columnName(projdb::Chans)).nthIndex(1, letter) >= 0;
}

bool EditInfo::hasAudioTracks() const {
    return m_edit.valid() ? m_edit->getNumChans(AudioChan) > 1 : hasLetter('A');
}

bool EditInfo::hasFxTracks() const {
    return m_edit.valid() ? m_edit->getNumChans(VideoChan, Edit_Chan_SubType::ALIAS) > 1 : hasLetter('F');
}

bool EditInfo::isHidden() const {
    return m_edit.valid() ? m_edit->get_hidden() != 0 : (getFlags() & kRecordHidden) != 0;
}

bool EditInfo::isSoundOnlyShot() const {
    if (getLogType() == kLogEdit) {
        return false;
    }
    const String chans = getAttrib(projdb::columnName(projdb::Chans));
    return !chans.empty() && chans.nthIndex(1, 'V') < 0;
}

int EditInfo::getFlags() const {
    return flagsFrom(getAttrib(projdb::columnName(projdb::Flags)));
}

edit_log_type_t EditInfo::getLogType() const {
    if (m_edit.valid()) {
        return m_edit->get_log_type();
    }
    projdb::Record record;
    if (currentRecord(m_item, record)) {
        // Looked up once in the process; the file has the columns in their order.
        const int column = typeColumn.load();
        const String& type = record[column < 0 ? projdb::Type : static_cast<projdb::Column>(column)];
        return type == "ghost" ? ghostType(flagsFrom(record[projdb::Flags]))
                               : Edit::getLogTypeFromString(type);
    }
    // Opening an edit whose file does not read would set that aside, which a question must not.
    if (!record[projdb::Damage].empty()) {
        return kLogNone;
    }
    return ed().valid() ? m_edit->get_log_type() : kLogNone;
}

double EditInfo::getStartTime() const {
    return m_edit.valid() ? m_edit->getStartTime()
                          : recordTime(getAttrib(projdb::columnName(projdb::StartTime)));
}

double EditInfo::getEndTime() const {
    return m_edit.valid() ? m_edit->getEndTime() : recordTime(getAttrib(projdb::columnName(projdb::EndTime)));
}

double EditInfo::getDuration() const {
    const double start = getStartTime();
    return start == Qx::kNoTime ? Qx::kNoTime : getEndTime() - start;
}
