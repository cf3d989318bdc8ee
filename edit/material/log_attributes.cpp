#include "edit/material/log_attributes.h"

#include "edit/model/edit_keys.h"

namespace {

using Attribute = LogAttributes::LogAttribute;

struct AttributeRow {
    const char* field;      ///< of the project's record; null for none
    const char* key;        ///< of the edit's header; null for none
    const char* persistent; ///< in settings, where that is not the field
    const char* shown;
};

/// By number, from 1.
constexpr AttributeRow kRows[] = {
    {"name", "slate/take", nullptr, "Name"},
    {"date", EditKeys::kCreationTime.name().data(), nullptr, "Date"},
    {nullptr, EditKeys::kModificationTime.name().data(), "ModificationDate", "Modified"},
    {"scene", "scene", nullptr, "Scene"},
    {"shot", "shot", nullptr, "Shot"},
    {"who", "who", nullptr, "Who"},
    {"description", "description", nullptr, "Description"},
    {"notes", "notes", nullptr, "Notes"},
    {"cookie", "cookie", nullptr, "Cookie"},
    {"Duration", "Duration", nullptr, "Duration"},
    {"Type", "Type", nullptr, "Type"},
    {"chans", "chans", nullptr, "Channels"},
    {nullptr, nullptr, "Format", "Format"},
    {nullptr, nullptr, "Location", "Location"},
    {"start time", nullptr, nullptr, "Start"},
    {"end time", nullptr, nullptr, "End"},
    {"reel", "reelid", nullptr, "Reel"},
    {"snd start", nullptr, nullptr, "Sound start"},
    {"snd reel", "reelid1", nullptr, "Sound reel"},
    {"aud qual", nullptr, nullptr, "Audio quality"},
    {"Compression Format", nullptr, nullptr, "Compression"},
    {"frame origin", "frame origin", nullptr, "Frame origin"},
    {"pulldown", "pulldown", nullptr, "Pulldown"},
    {"sequence", "sequence", nullptr, "Sequence"},
    {"start 24P code", "start 24P code", nullptr, "24P start"},
    {"end 24P code", "end 24P code", nullptr, "24P end"},
    {"24P reel", "24P_reel", nullptr, "24P reel"},
    {"start keycode", "start keycode", nullptr, "Keycode start"},
    {"end keycode", "end keycode", nullptr, "Keycode end"},
    {"start camcode", "start camcode", nullptr, "Camera start"},
    {"end camcode", "end camcode", nullptr, "Camera end"},
    {"cam reel", "camreel", nullptr, "Camera roll"},
    {"cam_date", "cam_date", nullptr, "Camera date"},
    {"lab reel", "lab_reel", nullptr, "Lab roll"},
    {"comp reel", "comp_reel", nullptr, "Compiled roll"},
    {"start inkcode", "start inkcode", nullptr, "Ink start"},
    {"end inkcode", "end inkcode", nullptr, "Ink end"},
    {"Source Format", "Source Format", nullptr, "Source format"},
    {"Reel Type", "Reel Type", nullptr, "Reel type"},
    {"film duration", "film duration", nullptr, "Film duration"},
    {nullptr, "tc_fake", "SearchTimecode", "Timecode"},
    {nullptr, "SearchDate", "SearchDate", "Date"},
    {nullptr, "DRIVELOCATION", "SearchLocation", "Location"},
};
static_assert(std::size(kRows) == LogAttributes::kLast);

const AttributeRow* rowOf(Attribute attribute) {
    const auto number = static_cast<uint32_t>(attribute);
    return number >= LogAttributes::kFirst && number <= LogAttributes::kLast ? &kRows[number - 1] : nullptr;
}

const char* persistentText(const AttributeRow& row) {
    return row.persistent != nullptr ? row.persistent : row.field;
}

} // namespace

String LogAttributeMap::find(LogAttribute attribute) const {
    const auto found = m_texts.find(attribute);
    return found == m_texts.end() ? String() : found->second;
}

bool LogAttributes::isUserEditable(LogAttribute attribute) {
    switch (attribute) {
    case kName:
    case kScene:
    case kShot:
    case kWho:
    case kDescription:
    case kNotes:
    case kReel:
    case kSoundReel:
    case k24PReel:
    case kCamReel:
    case kLabReel:
    case kCompReel:
        return true;
    default:
        return false;
    }
}

bool LogAttributes::isInvariant(LogAttribute attribute) {
    switch (attribute) {
    case kDate:
    case kCookie:
    case kType:
    case kFormat:
    case kLocation:
    case kCompressionFormat:
        return true;
    default:
        return false;
    }
}

bool LogAttributes::isStoredInEditConfigb(LogAttribute attribute) {
    return (attribute >= kName && attribute <= kType) || attribute == kReel || attribute == kSoundReel ||
           attribute > kCompressionFormat;
}

bool LogAttributes::isStoredInProjectDatabase(LogAttribute attribute) {
    switch (attribute) {
    case kNoAttribute:
    case kModificationDate:
    case kFormat:
    case kLocation:
    case kSearchTimecode:
    case kSearchDate:
    case kSearchLocation:
        return false;
    default:
        return true;
    }
}

const char* LogAttributes::getProjDBFieldNameForAttrib(LogAttribute attribute) {
    const AttributeRow* const row = rowOf(attribute);
    return row != nullptr ? row->field : nullptr;
}

const char* LogAttributes::getEditConfigbNameForAttrib(LogAttribute attribute, edit_log_type_t type) {
    const AttributeRow* const row = rowOf(attribute);
    if (attribute == kName && type == kLogEdit) {
        return row->field;
    }
    return row != nullptr ? row->key : nullptr;
}

String LogAttributes::getPersistableString(LogAttribute attribute) {
    const AttributeRow* const row = rowOf(attribute);
    return row != nullptr ? persistentText(*row) : "";
}

LogAttributes::LogAttribute LogAttributes::getFromPersistableString(const String& text) {
    for (uint32_t number = kFirst; number <= kLast; ++number) {
        if (String::equalNoCase(text, persistentText(kRows[number - 1]))) {
            return LogAttribute(number);
        }
    }
    return kNoAttribute;
}

WString LogAttributes::getUserNameForAttrib(LogAttribute attribute) {
    const AttributeRow* const row = rowOf(attribute);
    return row != nullptr ? Qx::widen(row->shown) : WString();
}
