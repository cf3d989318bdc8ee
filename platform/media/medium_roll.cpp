#include "platform/media/medium_roll.h"

#include "platform/store/configb.h"

namespace {

struct MediumName {
    MediumCode medium;
    const char* name;
};

constexpr MediumName kNames[] = {
    {kPrimaryMedium, "source"},
    {kCameraMedium, "camera roll"},
    {kVideoTapeMedium, "video tape"},
    {kSoundMedium, "sound roll"},
    {kEditMedium, "edit"},
    {kLabMedium, "lab roll"},
    {kCompiledMedium, "compiled roll"},
    {kLegacy24Medium, "24-frame roll"},
    {kEdit24Medium, "24-frame edit"},
    {k24FrameMedium, "24-frame roll"},
};

bool isUsableReelId(std::string_view text) {
    if (text.size() > MediumRoll::kLongestReelId) {
        return false;
    }
    for (const char c : text) {
        if (static_cast<unsigned char>(c) < ' ' || c == '\x7f') {
            return false;
        }
    }
    return true;
}

/// The number before the next blank; moves past that.
bool takeNumber(std::string_view& text, int& number) {
    const size_t blank = text.find(' ');
    const std::string_view word = text.substr(0, blank);
    text = blank == std::string_view::npos ? std::string_view() : text.substr(blank + 1);
    return Qx::textToInt(word, number);
}

} // namespace

bool MediumRollIdent::MediumRollId_fits_this(const MediumRollIdent& other) const {
    return medium == other.medium && (number == other.number || number == 0 || other.number == 0);
}

MediumRollIdent get_invalid_MediumRollIdent() {
    return {-1, -1};
}

String MediumRollId_to_UserString(const MediumRollIdent& roll) {
    String text = String::format("roll %d", roll.medium);
    for (const MediumName& row : kNames) {
        if (row.medium == roll.medium) {
            text = row.name;
        }
    }
    return roll.number > 1 ? text + String::format(" %d", roll.number) : text;
}

MediumRoll::MediumRoll(const MediumRollIdent& ident, String reelId) : m_ident(ident) {
    set_reelid(reelId);
}

MediumRoll::MediumRoll(const char* text) {
    std::string_view rest = text == nullptr ? "" : text;
    MediumRollIdent ident;
    const bool reads = takeNumber(rest, ident.medium) && takeNumber(rest, ident.number);
    if (reads && isUsableReelId(rest)) {
        m_ident = ident;
        m_reelId = String(rest);
    }
}

bool MediumRoll::is_valid() const {
    return m_ident.medium > kNoMedium && m_ident.number > 0;
}

bool MediumRoll::set_reelid(const String& reelId) {
    if (!isUsableReelId(reelId)) {
        return false;
    }
    m_reelId = reelId;
    return true;
}

String MediumRoll::asString() const {
    return String::format("%d %d ", m_ident.medium, m_ident.number) + m_reelId;
}

void MediumRoll::write_to_config(configb& header, int index) const {
    if (is_valid()) {
        header.setString(String::format("MEDIUMROLL%d", index), asString());
    }
}
