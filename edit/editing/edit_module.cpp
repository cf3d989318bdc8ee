#include "edit/editing/edit_module.h"

#include "edit/model/cel.h"
#include "platform/media/frame_rate.h"

#include <cmath>

using Qx::kNoTime;
using Qx::MarkTypes::InMark;
using Qx::MarkTypes::MarkType;
using Qx::MarkTypes::OutMark;
using Range = EditModule::Range;

namespace {

double inMode(double time, EditModule::Mode mode) {
    return mode == EditModule::ExactTimes || time == kNoTime ? time : Qx::frameRound(time);
}

bool isMarkType(MarkType type) {
    return type == InMark || type == OutMark;
}

bool isSet(const Range& range) {
    return range.start() != kNoTime && range.end() != kNoTime;
}

} // namespace

EditModule::EditModule(const EditPtr& edit)
    : m_edit(edit), m_current(edit.valid() ? edit->get_current_time() : kNoTime) {}

EditModule::EditModule(const cookie& item) : EditModule(EditPtr(item, eOpenExisting)) {}

EditModule::EditModule(const cookie& item, double current, double in, double out) : EditModule(item) {
    setCurTime(current);
    markAllAt(in, InMark);
    markAllAt(out, OutMark);
}

double EditModule::curTime(Mode mode) const {
    return inMode(m_current, mode);
}

void EditModule::setCurTime(double time) {
    if (std::isfinite(time)) {
        m_current = time;
    }
}

const EditModule::Record* EditModule::record(const IdStamp& chan) const {
    const auto found = m_records.find(chan);
    return found != m_records.end() ? &found->second : nullptr;
}

// Selection

void EditModule::selectChan(const IdStamp& chan, bool on) {
    if (!m_edit.valid() || !m_edit->chanValid(chan, AnyChan)) {
        return;
    }
    const auto found = m_records.find(chan);
    if (!on) {
        m_records[chan].selected = false;
    } else if (found != m_records.end()) {
        found->second.selected = true;
        if (!found->second.marked()) {
            m_records.erase(found);
        }
    }
}

void EditModule::selectChans(const Vector<IdStamp>& chans, bool on) {
    for (const IdStamp& chan : chans) {
        selectChan(chan, on);
    }
}

void EditModule::selectChans(bool on, Edit_Chan_Type type, Edit_Chan_SubType subtype) {
    if (!m_edit.valid()) {
        return;
    }
    Vector<IdStamp> chans;
    m_edit->getChans(chans, type, subtype);
    selectChans(chans, on);
}

bool EditModule::isSelected(const IdStamp& chan) const {
    if (!m_edit.valid() || !m_edit->chanValid(chan, AnyChan)) {
        return false;
    }
    const Record* const content = record(chan);
    return content == nullptr || content->selected;
}

void EditModule::getSelectedChans(Vector<IdStamp>& chans, Edit_Chan_Type type,
                                  Edit_Chan_SubType subtype) const {
    if (!m_edit.valid()) {
        return;
    }
    Vector<IdStamp> all;
    m_edit->getChans(all, type, subtype);
    for (const IdStamp& chan : all) {
        if (isSelected(chan)) {
            chans.push_back(chan);
        }
    }
}

void EditModule::getSelectedChans(Vector<IdStamp>& chans, Edit::ChanType type) const {
    Vector<IdStamp> selected;
    getSelectedChans(selected, AnyChan, Edit_Chan_SubType::ANY);
    for (const IdStamp& chan : selected) {
        if (m_edit->getChanTypeAndSubType(chan) == type) {
            chans.push_back(chan);
        }
    }
}

unsigned EditModule::getNumSelectedChans(Edit_Chan_Type type, Edit_Chan_SubType subtype) const {
    Vector<IdStamp> chans;
    getSelectedChans(chans, type, subtype);
    return static_cast<unsigned>(chans.size());
}

// Marks

void EditModule::setMarkTime(const IdStamp& chan, double time, MarkType type) {
    if (!m_edit.valid() || !m_edit->chanValid(chan, AnyChan) || !std::isfinite(time) || !isMarkType(type)) {
        return;
    }
    Record& content = m_records[chan];
    (type == InMark ? content.in : content.out) = time;
    if (content.selected && !content.marked()) {
        m_records.erase(chan);
    }
}

void EditModule::setMarkTime(const IdStamp& chan, const Range& range) {
    setMarkTime(chan, std::pair(range.start(), range.end()));
}

void EditModule::setMarkTime(const IdStamp& chan, const std::pair<double, double>& times) {
    if (std::isfinite(times.first) && std::isfinite(times.second)) {
        setMarkTime(chan, times.first, InMark);
        setMarkTime(chan, times.second, OutMark);
    }
}

double EditModule::getMarkTime(const IdStamp& chan, MarkType type) const {
    const Record* const content = m_edit.valid() ? record(chan) : nullptr;
    if (content == nullptr || !isMarkType(type)) {
        return kNoTime;
    }
    return type == InMark ? content->in : content->out;
}

double EditModule::getMarkTime(MarkType type) const {
    double found = kNoTime;
    for (const auto& [chan, content] : m_records) {
        const double time = getMarkTime(chan, type);
        if (content.selected && time != kNoTime &&
            (found == kNoTime || (type == InMark ? time < found : time > found))) {
            found = time;
        }
    }
    return found;
}

std::pair<double, double> EditModule::getMarkTimes(const IdStamp& chan) const {
    return {getMarkTime(chan, InMark), getMarkTime(chan, OutMark)};
}

double EditModule::Record::markInOrder(MarkType type) const {
    const bool turned = in != kNoTime && out != kNoTime && out < in;
    return (type == InMark) == turned ? out : in;
}

double EditModule::getMarkedPlace(const IdStamp& chan, MarkType type) const {
    const Record* const own = m_edit.valid() && isMarkType(type) ? record(chan) : nullptr;
    double found = own != nullptr ? own->markInOrder(type) : kNoTime;
    if (found != kNoTime || !m_edit.valid() || !isMarkType(type)) {
        return found != kNoTime ? found : m_current;
    }
    for (const auto& [other, content] : m_records) {
        const double time = content.selected ? content.markInOrder(type) : kNoTime;
        if (time != kNoTime && (found == kNoTime || (type == InMark ? time < found : time > found))) {
            found = time;
        }
    }
    return found != kNoTime ? found : m_current;
}

bool EditModule::isMarked() const {
    return isMarked(InMark) || isMarked(OutMark);
}

bool EditModule::isMarked(MarkType type) const {
    return getMarkTime(type) != kNoTime;
}

bool EditModule::isMarked(const IdStamp& chan) const {
    return isMarked(chan, InMark) || isMarked(chan, OutMark);
}

bool EditModule::isMarked(const IdStamp& chan, MarkType type) const {
    return getMarkTime(chan, type) != kNoTime;
}

void EditModule::clearMarks(const IdStamp& chan) {
    setMarkTime(chan, std::pair(kNoTime, kNoTime));
}

void EditModule::markAllAt(double time, MarkType type) {
    if (!m_edit.valid() || !std::isfinite(time) || !isMarkType(type)) {
        return;
    }
    if (time == kNoTime) {
        for (auto& [chan, content] : m_records) {
            if (content.selected) {
                (type == InMark ? content.in : content.out) = kNoTime;
            }
        }
    } else {
        Vector<IdStamp> chans;
        m_edit->getChans(chans);
        for (const IdStamp& chan : chans) {
            setMarkTime(chan, time, type);
        }
    }
    verify();
}

void EditModule::markAllAt(const Range& range) {
    markAllAt(range.start(), InMark);
    markAllAt(range.end(), OutMark);
}

// Regions

Range EditModule::getMarkedRegion(double in, double out, double current, Mode mode) {
    double from = in;
    double to = out;
    if (in == kNoTime && out == kNoTime) {
        return Editable::invalidRange();
    }
    if (in == kNoTime || out == kNoTime || in == out) {
        from = in != kNoTime ? in : out;
        to = current;
    }
    return {inMode(from, mode), inMode(to, mode)};
}

Range EditModule::getMarkedRegion(const IdStamp& chan, Mode mode) const {
    return getMarkedRegion(getMarkTime(chan, InMark), getMarkTime(chan, OutMark), m_current, mode);
}

Range EditModule::getMarkedRegion(Mode mode) const {
    Range region = Editable::invalidRange();
    bool found = false;
    for (const auto& [chan, content] : m_records) {
        if (!content.selected) {
            continue;
        }
        const Range own = getMarkedRegion(chan, mode);
        if (found) {
            region.widen(own);
        } else {
            region = own;
        }
        found = true;
    }
    return region;
}

Range EditModule::sourceRegionFor(const IdStamp& chan, const Range& region) const {
    const cel* const content = m_edit.valid() ? m_edit->get_edit_cel_p(m_edit->getIdx(chan)) : nullptr;
    if (content == nullptr || !isSet(region)) {
        return Editable::invalidRange();
    }
    const CEHPair pair(*content, region.start());
    if (!pair.valid() || pair.inH().get_strip_cookie().isBlack() ||
        region.end() > pair.editRange().end() + Qx::kTimeTolerance) {
        return Editable::invalidRange();
    }
    return {content->get_strip_time(pair.inH(), region.start()),
            content->get_strip_time(pair.inH(), region.end())};
}

Range EditModule::getSourceRegion(const IdStamp& chan, Mode mode) const {
    return sourceRegionFor(chan, getMarkedRegion(chan, mode));
}

Range EditModule::getSourceRegion(Mode mode) const {
    Vector<IdStamp> chans;
    getSelectedChans(chans);
    for (const IdStamp& chan : chans) {
        const Range region =
            sourceRegionFor(chan, isMarked(chan) ? getMarkedRegion(chan, mode) : getMarkedRegion(mode));
        if (isSet(region)) {
            return region;
        }
    }
    return Editable::invalidRange();
}

// Between modules

/// The channel of this module's edit that corresponds to one of another's; the null stamp if none.
IdStamp EditModule::correspondingTo(const EditModule& other, const IdStamp& chan) const {
    const Edit::ChanType type = other.m_edit->getChanTypeAndSubType(chan);
    const int place = other.m_edit->getIndexWithinType(chan);
    Vector<IdStamp> chans;
    m_edit->getChans(chans);
    for (const IdStamp& mine : chans) {
        if (m_edit->getChanTypeAndSubType(mine) == type && m_edit->getIndexWithinType(mine) == place) {
            return mine;
        }
    }
    return {};
}

void EditModule::makeSimilarMarks(const EditModule& source, EditModule& destination, double time) {
    const std::map<IdStamp, Record> marks = source.m_records; // the two may be one module
    const Range region = source.getMarkedRegion(ExactTimes);
    const double at = time == kNoTime ? destination.m_current : time;
    if (!source.m_edit.valid() || !destination.m_edit.valid() || !isSet(region) || at == kNoTime ||
        !std::isfinite(at)) {
        return;
    }
    for (auto& [chan, content] : destination.m_records) {
        content.in = content.out = kNoTime;
    }
    const auto moved = [&](double mark) { return mark == kNoTime ? kNoTime : mark - region.start() + at; };
    for (const auto& [chan, content] : marks) {
        const IdStamp theirs = content.marked() ? destination.correspondingTo(source, chan) : IdStamp();
        if (theirs.valid()) {
            destination.setMarkTime(theirs, std::pair(moved(content.in), moved(content.out)));
        }
    }
    destination.verify();
}

void EditModule::makeSimilarTrackSelections(const EditModule& source, EditModule& destination) {
    if (!source.m_edit.valid() || !destination.m_edit.valid()) {
        return;
    }
    Vector<IdStamp> selected;
    Vector<IdStamp> theirs;
    source.getSelectedChans(selected);
    for (const IdStamp& chan : selected) {
        theirs.push_back(destination.correspondingTo(source, chan));
    }
    destination.selectAll(false);
    destination.selectChans(theirs, true);
}

void EditModule::verify() {
    if (!m_edit.valid()) {
        return;
    }
    std::erase_if(m_records, [&](const auto& entry) {
        return !m_edit->chanValid(entry.first, AnyChan) || (entry.second.selected && !entry.second.marked());
    });
}
