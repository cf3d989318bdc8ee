#include "edit/material/log_attributes.h"
#include "edit/model/edit.h"
#include "edit/model/edit_keys.h"
#include "edit/model/strp_field.h"
#include "platform/media/edit_label.h"
#include "platform/media/picture_format.h"
#include "platform/services/clock.h"

namespace {

/// A code at the start or the end of an edit, and the label that it is read from.
struct CodeRow {
    LogAttribute start;
    LogAttribute end;
    UserLabelType type;
    MediumCode medium;
};
constexpr CodeRow kCodes[] = {
    {LogAttribute::kStart24PCode, LogAttribute::kEnd24PCode, kTimecodeLabelType, k24FrameMedium},
    {LogAttribute::kStartKeycode, LogAttribute::kEndKeycode, kKeyKodeLabelType, kCameraMedium},
    {LogAttribute::kStartCamcode, LogAttribute::kEndCamcode, kTimecodeLabelType, kCameraMedium},
    {LogAttribute::kStartInkcode, LogAttribute::kEndInkcode, kInkCodeLabelType, kLabMedium},
    {LogAttribute::kSoundStart, LogAttribute::kNoAttribute, kTimecodeLabelType, kSoundMedium},
};

/// "2026-11-21T11:30:00Z"; empty for 0, which is no date.
String dateText(int seconds) {
    return seconds == 0 ? String() : Qx::isoTimeText(static_cast<uint32_t>(seconds));
}

/// A header's value as text; empty for one that is no text and no whole number.
String headerText(const configb& header, const char* key) {
    const configb::Value* const value = key == nullptr ? nullptr : header.find(key);
    if (value == nullptr) {
        return {};
    }
    if (const auto* const number = std::get_if<int32_t>(value)) {
        return String(std::to_string(*number));
    }
    const String* const text = std::get_if<String>(value);
    return text == nullptr ? String() : *text;
}

/// What the edit's labels say of an attribute.
String codeOf(const Edit& edit, LogAttribute attribute) {
    for (const CodeRow& row : kCodes) {
        if (attribute != row.start && attribute != row.end) {
            continue;
        }
        const edit_label found = edit.get_label_(row.type, {row.medium, 0});
        return found.labelAt(attribute == row.start ? edit.getStartTime() : edit.getEndTime()).asString();
    }
    return {};
}

/// The text as it is written: one that is too long is cut.
String written(const String& text) {
    strp_field field;
    field.set(text);
    return field.get();
}

} // namespace

String Edit::getAttribute(LogAttribute attribute) const {
    switch (attribute) {
    case LogAttribute::kNoAttribute:
        return {};
    case LogAttribute::kDate:
        return dateText(getCreationTime());
    case LogAttribute::kModificationDate:
        return dateText(getModificationTime());
    case LogAttribute::kCookie:
        return m_cookie.is_valid() ? m_cookie.asString() : String();
    case LogAttribute::kType:
        return log_type_string_get_ms(get_log_type());
    default:
        break;
    }
    String text = headerText(m_header, LogAttributes::getEditConfigbNameForAttrib(attribute, get_log_type()));
    if (!text.empty()) {
        return text;
    }
    switch (attribute) {
    case LogAttribute::kName:
        return getName();
    case LogAttribute::kSourceFormat:
        return getShotVideoMetadata().asString();
    default:
        return codeOf(*this, attribute);
    }
}

bool Edit::setAttribute(LogAttribute attribute, const String& text) {
    LogAttributeMap one;
    one.add(attribute, text);
    return setAttributes(one);
}

bool Edit::setAttributes(const LogAttributeMap& attributes) {
    const edit_log_type_t type = get_log_type();
    bool isChange = false;
    for (const auto& [attribute, text] : attributes) {
        const char* const key = LogAttributes::getEditConfigbNameForAttrib(attribute, type);
        if (!LogAttributes::isUserEditable(attribute) || !LogAttributes::isStoredInEditConfigb(attribute) ||
            key == nullptr) {
            return false;
        }
        if (MediumRoll probe; attribute == LogAttribute::kReel && !probe.set_reelid(text)) {
            return false;
        }
        isChange = isChange || headerText(m_header, key) != written(text) || !m_header.contains(key);
    }
    if (!isChange) {
        return true;
    }
    if (refusesChange()) {
        return false;
    }
    for (const auto& [attribute, text] : attributes) {
        if (attribute == LogAttribute::kReel) {
            putNaturalReelid(text);
        } else {
            m_header.setString(LogAttributes::getEditConfigbNameForAttrib(attribute, type), written(text));
        }
    }
    const bool isName = attributes.size() == 1 && attributes.begin()->first == LogAttribute::kName;
    recordChange(isName ? kNameChanged : kPropertiesChanged, true);
    return true;
}
