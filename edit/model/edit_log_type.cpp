#include "edit/model/edit.h"
#include "edit/model/edit_keys.h"

namespace {

/// True if the value under a key is there and not an empty text.
bool holdsSomething(const configb& header, std::string_view key) {
    const configb::Value* const value = header.find(key);
    if (value == nullptr) {
        return false;
    }
    const String* const text = std::get_if<String>(value);
    return text == nullptr || !text->empty();
}

/// The type of an item of original material, from how it relates to the shot that it may be a copy of.
edit_log_type_t typeOfOriginal(const configb& header) {
    const int dupe = EditKeys::kDupe.get(header);
    const int slashDupe = EditKeys::kSlashDupe.get(header);
    if (header.contains(EditKeys::kHiddenCookie)) {
        return slashDupe > 0 ? kLogGhost7 : kLogGhost6;
    }
    if (dupe < 1 && slashDupe < 1) {
        return kLogShot;
    }
    if (dupe == 1 || dupe == 2) {
        return static_cast<edit_log_type_t>(dupe + 2);
    }
    return dupe == 3 ? kLogGhost5 : kLogNone;
}

} // namespace

edit_log_type_t Edit::log_type_get_m() const {
    if (m_cookie.isMagic()) {
        return kLogMagic;
    }
    if (!m_header.contains(EditKeys::kOriginalMaterial)) {
        return kLogNone;
    }
    if (EditKeys::kOriginalMaterial.get(m_header) != 0) {
        return typeOfOriginal(m_header);
    }
    if (EditKeys::kEntireMedium.get(m_header) != 0) {
        return kLogReel;
    }
    return holdsSomething(m_header, EditKeys::kFxTemplate) ? kLogTemplate : kLogEdit;
}

edit_log_type_t Edit::get_log_type() const {
    return log_type_get_m();
}

edit_log_type_t Edit::redetermineLogType() {
    dropDerivedValues();
    return log_type_get_m();
}

bool Edit::isShot() const {
    return get_log_type() == kLogShot;
}

bool Edit::isEdit() const {
    return get_log_type() == kLogEdit;
}

bool Edit::is_original() const {
    switch (get_log_type()) {
    case kLogNone:
    case kLogEdit:
    case kLogMagic:
    case kLogReel:
    case kLogTemplate:
        return false;
    default:
        return true;
    }
}

bool Edit::is_kemroll() const {
    return isEdit() && m_header.contains(EditKeys::kKemrollTime);
}

String Edit::log_type_string_get_ms(edit_log_type_t type) {
    switch (type) {
    case kLogShot:
        return "shot";
    case kLogEdit:
        return "edit";
    case kLogGhost3:
    case kLogGhost4:
    case kLogGhost5:
    case kLogGhost6:
    case kLogGhost7:
        return "ghost";
    case kLogMagic:
        return "magic";
    case kLogReel:
        return "reel";
    case kLogTemplate:
        return "FXT";
    default:
        return {};
    }
}

edit_log_type_t Edit::getLogTypeFromString(std::string_view text) {
    for (const edit_log_type_t type : {kLogShot, kLogEdit, kLogReel, kLogGhost3, kLogMagic, kLogTemplate}) {
        if (text == log_type_string_get_ms(type)) {
            return type;
        }
    }
    return kLogNone;
}
