#include "edit/inspect/event_labels.h"
#include "edit/model/cel.h"

#include "edit/material/log_attributes.h"
#include "platform/media/timecode.h"

#include <cmath>

namespace {

/// The attribute that a reel or text of a tool is: the one whose header key is its settings text.
LogAttribute attributeOf(VagueUIFLabel kind, edit_log_type_t type) {
    const std::string_view key = uifLabel_to_config_str(kind);
    if (kind == kUIFName || kind == kUIFSlateTake) {
        return LogAttribute::kName;
    }
    if (kind == kUIF24FrameReel) {
        return LogAttribute::k24PReel;
    }
    for (uint32_t number = LogAttributes::kFirst; number <= LogAttributes::kLast; ++number) {
        const char* const kept = LogAttributes::getEditConfigbNameForAttrib(LogAttribute{number}, type);
        if (kept != nullptr && key == kept) {
            return LogAttribute{number};
        }
    }
    return LogAttribute::kNoAttribute;
}

/// True for what is said of the edit that is shown, not of what plays in it.
bool isOwn(VagueUIFLabel kind) {
    switch (kind) {
    case kUIFName:
    case kUIFEditTimecode:
    case kUIFEdit24PTimecode:
    case kUIFEditTotalDuration:
    case kUIFEditMarkedDuration:
    case kUIFEditElapsedDuration:
    case kUIFEditScene:
    case kUIFEditDescription:
    case kUIFEditNotes:
        return true;
    default:
        return false;
    }
}

/// At most so many characters of UTF-8.
String cutTo(const String& text, int characters) {
    size_t end = 0;
    for (int i = 0; end < text.size(); ++end) {
        const bool begins = (static_cast<unsigned char>(text[end]) & 0xC0) != 0x80;
        if (begins && i++ == characters) {
            break;
        }
    }
    return String(text.substr(0, end));
}

} // namespace

bool ShownLabel::fromText(const String& text, ShownLabel& label) {
    if (const VagueUIFLabel kind = config_str_to_uifLabel(text); kind != kUIFNone) {
        label = {kind, {uifLabelType(kind), uifLabelMedroll(kind)}, text};
        return true;
    }
    for (const UserLabelType type :
         {kTimecodeLabelType, kKeyKodeLabelType, kFootFrameLabelType, kInkCodeLabelType}) {
        if (text == UserLabelType_to_UserString(type)) {
            label = {kUIFNone, {type, {kPrimaryMedium, 0}}, text};
            return true;
        }
    }
    return false;
}

const EditPtr& EventLabels::source(const cookie& strip) {
    const auto [place, isNew] = m_sources.try_emplace(strip);
    if (isNew && m_reader && !strip.isMagic() && !strip.isAlias()) {
        place->second = m_reader(strip);
    }
    return place->second;
}

String EventLabels::ownText(VagueUIFLabel kind, double editTime) const {
    const auto length = [this](double seconds) {
        const Qx::FrameRate rate = m_edit.getFrameRate();
        return Qx::durationText(rate.toFrames(seconds), rate, m_edit.isDropFrame(false));
    };
    switch (kind) {
    case kUIFEditTotalDuration:
        return length(m_edit.getEndTime() - m_edit.getStartTime());
    case kUIFEditMarkedDuration:
        return m_edit.mark_is_valid() ? length(std::abs(m_edit.get_mark_time() - editTime)) : String();
    case kUIFEditElapsedDuration:
        return length(editTime - m_edit.getStartTime());
    case kUIFEditTimecode:
    case kUIFEdit24PTimecode:
        return m_edit.get_label_(uifLabelType(kind), uifLabelMedroll(kind)).labelAt(editTime).asString();
    default:
        return m_edit.getAttribute(attributeOf(kind, m_edit.get_log_type()));
    }
}

String EventLabels::textOf(const ShownLabel& shown, const cookie& strip, double stripTime, double editTime,
                           label::Style style) {
    if (isOwn(shown.kind)) {
        return ownText(shown.kind, editTime);
    }
    const EditPtr& played = source(strip);
    if (!played.valid()) {
        return {};
    }
    if (shown.spec.type == kTextLabelType) {
        return played->getAttribute(attributeOf(shown.kind, played->get_log_type()));
    }
    return FM_get_edit_label(played, shown.spec).labelAt(stripTime).asString(style);
}

String EventLabels::textAt(const ShownLabel& shown, int chan, double editTime, label::Style style) {
    const cel* const content = m_edit.get_edit_cel_p(chan);
    for (int i = 0; content != nullptr && i + 1 < content->numEvents(); i += 2) {
        const channel_event in = content->get_event(i);
        if (editTime >= in.editTime - Qx::kTimeTolerance &&
            editTime < content->get_event(i + 1).editTime - Qx::kTimeTolerance) {
            return textOf(shown, in.strip, in.stripTime + (editTime - in.editTime) * in.velocity, editTime,
                          style);
        }
    }
    return isOwn(shown.kind) ? ownText(shown.kind, editTime) : String();
}

std::vector<std::pair<String, String>> EventLabels::burnIn(double editTime) {
    std::vector<std::pair<String, String>> shown;
    const int chan = m_edit.getFirstChan(VideoChan, Edit_Chan_SubType::NONE);
    for (const VagueUIFLabel* set : {get_bitc_label_set(), get_bitc_reel_set(), get_bitc_textlabel_set(),
                                     get_bitc_editlabel_set(), get_bitc_edittext_set()}) {
        for (; *set != kUIFNone; ++set) {
            const ShownLabel choice{*set, {uifLabelType(*set), uifLabelMedroll(*set)}, {}};
            if (const String text = textAt(choice, chan, editTime, label::Compact); !text.empty()) {
                shown.emplace_back(uifLabel_to_config_str(*set), cutTo(text, get_max_bitc_field_size(*set)));
            }
        }
    }
    return shown;
}
