#include "edit/model/detail/edit_labels.h"
#include "edit/model/edit.h"
#include "edit/model/edit_keys.h"
#include "platform/media/timecode.h"
#include "platform/services/current_project.h"
#include "platform/services/log.h"

#include <algorithm>

namespace {

/// How many labels and rolls a header has that does not say.
constexpr int kAssumedCount = 6;
/// The first revision whose header has rolls.
constexpr int kRevisionWithRolls = 160;
/// The rolls that have the edit's reel id.
constexpr size_t kRollsWithReelId = 2;
constexpr MediumRollIdent kEditRoll{kEditMedium, 1};
constexpr MediumRollIdent kEdit24Roll{kEdit24Medium, 1};

/// The count under a key, or the assumed one; `isStated` tells which.
int countOf(const configb& header, const EditKeys::Key<int>& key, size_t most, bool& isStated) {
    const int count = key.get(header);
    isStated = count >= 1;
    return isStated ? std::min(count, static_cast<int>(most)) : kAssumedCount;
}

/// Puts texts that did not read behind those that were kept before under a name with a number.
void keepUnread(configb& header, std::string_view name, std::vector<String>& texts) {
    int number = 0;
    for (const String& text : texts) {
        while (header.contains(EditKeys::numbered(name, number))) {
            ++number;
        }
        header.setString(EditKeys::numbered(name, number), text);
    }
    texts.clear();
}

bool isOf(const edit_label& label, UserLabelType type, const MediumRollIdent& roll) {
    return label.get_MediumRoll() == roll && label.user_type().matches(type);
}

} // namespace

void Edit::dropLabels(bool all) {
    if (m_labels == nullptr) {
        return;
    }
    const bool isAhead = std::any_of(m_labels->labels.begin(), m_labels->labels.end(),
                                     [](const edit_label& label) { return label.toBeSaved(); });
    if (all || !isAhead) {
        m_labels.reset();
    } else {
        m_labels->rollsBuilt = false;
    }
}

void Edit::build_labels() const {
    if (m_labels == nullptr) {
        m_labels = std::make_unique<Labels>();
    }
    m_labels->labels.clear();
    m_labels->unreadLabels.clear();
    read_labels_from_config();
    m_labels->labelsBuilt = true;
}

void Edit::read_labels_from_config() const {
    std::vector<edit_label>& labels = m_labels->labels;
    bool isStated = false;
    const int count = countOf(m_header, EditKeys::kNumLabels, kMostLabels, isStated);
    for (int i = 0; i < count; ++i) {
        const String text = m_header.getString(EditKeys::numbered(EditKeys::kLabel, i));
        if (text.empty()) {
            if (isStated) {
                herc_printf("Edit::build_labels:  expected label %d on %s\n", i, get_cookie_str().c_str());
            }
            continue;
        }
        edit_label read(text.c_str());
        if (!read.is_valid()) {
            herc_printf("Edit::build_labels:  badly formed label %d\n", i);
            m_labels->unreadLabels.push_back(text);
            continue;
        }
        MediumRollIdent roll = read.get_MediumRoll();
        if (roll.medium == kLegacy24Medium) {
            roll.medium = k24FrameMedium;
        }
        const bool isKnown = std::any_of(labels.begin(), labels.end(), [&](const edit_label& known) {
            return isOf(known, read.user_type().type(), roll);
        });
        if (isKnown) {
            continue;
        }
        if (!is_original() && roll.medium == kVideoTapeMedium) {
            roll = kEditRoll;
        }
        read.set_MediumRoll(roll);
        labels.push_back(read);
    }
}

const std::vector<edit_label>& Edit::labels() const {
    if (m_labels == nullptr || !m_labels->labelsBuilt) {
        build_labels();
    }
    return m_labels->labels;
}

void Edit::write_labels_to_config(int revision) {
    const bool isKeptMagic =
        m_cookie.word(0) == cookie::blackWord || m_cookie.word(0) == cookie::clipboardWord;
    if (revision <= 1 || !m_cookie.is_valid() || (m_cookie.word(1) == cookie::magicWord && !isKeptMagic) ||
        m_labels == nullptr || !m_labels->labelsBuilt || m_labels->labels.empty()) {
        return;
    }
    int written = 0;
    for (edit_label& label : m_labels->labels) {
        if (label.toBeSaved()) {
            m_header.setString(EditKeys::numbered(EditKeys::kLabel, written++), label.make_keep_string());
            label.setToBeSaved(false);
        }
    }
    if (written > 0) {
        EditKeys::kNumLabels.set(m_header, written);
        set_dirty(true);
    }
}

/// The header has the labels under consecutive numbers, so that when one changes all are written.
void Edit::labelsChanged() {
    for (edit_label& label : m_labels->labels) {
        label.setToBeSaved(true);
    }
    keepUnread(m_header, EditKeys::kLabelUnread, m_labels->unreadLabels);
    EditKeys::removeNumbered(m_header, EditKeys::kLabel, static_cast<int>(m_labels->labels.size()));
    if (m_labels->labels.empty()) {
        m_header.remove(EditKeys::kNumLabels);
    }
    write_labels_to_config(get_ed2_revision());
}

edit_label Edit::get_label_(UserLabelType type, const MediumRollIdent& roll) const {
    for (const edit_label& label : labels()) {
        if (roll.MediumRollId_fits_this(label.get_MediumRoll()) && label.user_type().matches(type)) {
            return label;
        }
    }
    if (roll.medium == kPrimaryMedium) {
        for (const edit_label& label : labels()) {
            if (label.user_type().matches(type)) {
                return label;
            }
        }
    }
    const bool isOwn =
        roll.medium == kPrimaryMedium || roll.medium == kEditMedium || roll.medium == kEdit24Medium;
    return isOwn && label::UserType(kTimecodeLabelType).matches(type) ? ownTimecode(roll) : edit_label();
}

/// The label of edit time 0 by the start timecode, in the edit's own frames or, on the roll for that, in 24.
edit_label Edit::ownTimecode(const MediumRollIdent& roll) const {
    const Qx::FrameRate rate = getFrameRate();
    const bool dropFrame = isDropFrame(isEdit() && Qx::currentProject().dropFrame);
    const label own(label::Scale::timecode(rate, dropFrame), getStartTimecode());
    // A start that lies between two frames is no start of a label.
    const double at = rate.toSeconds(getStartTimecode()) - getTimecodeOrigin();
    if (roll.medium != kEdit24Medium) {
        return {roll, own, at, rate};
    }
    Qx::TimecodeFields fields;
    if (!Qx::parseTimecode(own.asString(), rate, fields)) {
        return {};
    }
    const Qx::FrameRate film(rate.denominator() == 1 ? Qx::FrameRate::Fps24 : Qx::FrameRate::Fps23_976);
    fields.frames = fields.frames * film.nominal() / rate.nominal();
    return {roll, label(label::Scale::timecode(film), Qx::timecodeFrames(fields, film, false)), at, rate};
}

/// In the place of the one of its kind on its roll. False if that says the same, or there is no room.
bool Edit::putLabel(const edit_label& wanted) {
    static_cast<void>(labels());
    std::vector<edit_label>& kept = m_labels->labels;
    const auto same = std::find_if(kept.begin(), kept.end(), [&](const edit_label& label) {
        return isOf(label, wanted.user_type().type(), wanted.get_MediumRoll());
    });
    if (same != kept.end()) {
        if (same->make_keep_string() == wanted.make_keep_string()) {
            return false;
        }
        *same = wanted;
        return true;
    }
    if (kept.size() >= kMostLabels) {
        return false;
    }
    kept.push_back(wanted);
    return true;
}

bool Edit::setLabel(const edit_label& wanted) {
    const bool isThere = std::any_of(labels().begin(), labels().end(), [&](const edit_label& label) {
        return isOf(label, wanted.user_type().type(), wanted.get_MediumRoll());
    });
    if (!wanted.is_valid() || (!isThere && labels().size() >= kMostLabels) || refusesChange()) {
        return false;
    }
    if (putLabel(wanted)) {
        labelsChanged();
        recordChange(kPropertiesChanged, true);
    }
    return true;
}

bool Edit::removeLabel(UserLabelType type, const MediumRollIdent& roll) {
    static_cast<void>(labels());
    std::vector<edit_label>& kept = m_labels->labels;
    const auto same = std::find_if(kept.begin(), kept.end(),
                                   [&](const edit_label& label) { return isOf(label, type, roll); });
    if (same == kept.end() || refusesChange()) {
        return false;
    }
    kept.erase(same);
    labelsChanged();
    recordChange(kPropertiesChanged, true);
    return true;
}

bool Edit::give_new_edit_all_its_labels() {
    bool isChanged = false;
    for (const MediumRollIdent& roll : {kEditRoll, kEdit24Roll}) {
        const bool isThere = std::any_of(labels().begin(), labels().end(), [&](const edit_label& label) {
            return isOf(label, kTimecodeLabelType, roll);
        });
        if (!isThere && (isChanged || !refusesChange())) {
            isChanged = putLabel(ownTimecode(roll)) || isChanged;
        }
    }
    if (isChanged) {
        labelsChanged();
        recordChange(kPropertiesChanged, true);
    }
    return isChanged;
}

void Edit::ownTimecodeChanged() {
    // Whoever has no labels in the header has none of its own timecode.
    if (m_initialising || (m_labels == nullptr && !m_header.contains(EditKeys::kNumLabels))) {
        return;
    }
    bool isChanged = false;
    static_cast<void>(labels());
    for (const MediumRollIdent& roll : {kEditRoll, kEdit24Roll}) {
        const edit_label own = ownTimecode(roll);
        for (edit_label& label : m_labels->labels) {
            // Without a start timecode of the header only a label of the usual start is meant.
            const bool tellsStart = m_header.contains(EditKeys::kStartTimecode) ||
                                    (label.first().frames() == 0 && label.at() == 0);
            if (tellsStart && isOf(label, kTimecodeLabelType, roll) &&
                label.make_keep_string() != own.make_keep_string()) {
                label = own;
                isChanged = true;
            }
        }
    }
    if (isChanged) {
        labelsChanged();
    }
}

void Edit::build_rolls() const {
    if (m_labels == nullptr) {
        m_labels = std::make_unique<Labels>();
    }
    std::vector<MediumRoll>& rolls = m_labels->rolls;
    rolls.clear();
    m_labels->unreadRolls.clear();
    m_labels->rollsBuilt = true;
    if (get_ed2_revision() < kRevisionWithRolls) {
        return;
    }
    bool isStated = false;
    const int count = countOf(m_header, EditKeys::kNumMediumRolls, kMostRolls, isStated);
    if (!isStated) {
        herc_printf("Edit::build_rolls:  %s: V3 ED2 with bad roll-count\n", get_cookie_str().c_str());
    }
    for (int i = 0; i < count; ++i) {
        const String text = m_header.getString(EditKeys::numbered(EditKeys::kMediumRoll, i));
        const MediumRoll roll(text.c_str());
        if (text.empty()) {
            herc_printf("Edit::build_rolls:  expected roll %d on \n", i);
        } else if (!roll.is_valid()) {
            herc_printf("Edit::build_rolls:  badly formed MediumRoll %d\n", i);
            m_labels->unreadRolls.push_back(text);
        } else {
            rolls.push_back(roll);
        }
    }
    // A header without one leaves the rolls what is written on them.
    if (const String reelId = get_Natural_reelid(); !reelId.empty()) {
        for (size_t i = 0; i < std::min(rolls.size(), kRollsWithReelId); ++i) {
            rolls[i].set_reelid(reelId);
        }
    }
}

void Edit::write_rolls_to_config() {
    keepUnread(m_header, EditKeys::kRollUnread, m_labels->unreadRolls);
    int written = 0;
    for (const MediumRoll& roll : m_labels->rolls) {
        if (roll.is_valid()) {
            roll.write_to_config(m_header, written++);
        }
    }
    EditKeys::kNumMediumRolls.set(m_header, written);
    EditKeys::removeNumbered(m_header, EditKeys::kMediumRoll, written);
}

const std::vector<MediumRoll>& Edit::rolls() const {
    if (m_labels == nullptr || !m_labels->rollsBuilt) {
        build_rolls();
    }
    return m_labels->rolls;
}

String Edit::get_reelid(const MediumRollIdent& roll) const {
    // Without rolls in the header there is nothing to warn of.
    if (m_labels == nullptr && !m_header.contains(EditKeys::kNumMediumRolls)) {
        return {};
    }
    for (const MediumRoll& kept : rolls()) {
        if (kept.ident() == roll) {
            return kept.get_reelid();
        }
    }
    return {};
}

bool Edit::set_reelid(const MediumRollIdent& roll, const String& text) {
    MediumRoll wanted(roll);
    if (!wanted.is_valid() || !wanted.set_reelid(text)) {
        return false;
    }
    static_cast<void>(rolls());
    std::vector<MediumRoll>& kept = m_labels->rolls;
    const auto same = std::find_if(kept.begin(), kept.end(),
                                   [&](const MediumRoll& known) { return known.ident() == roll; });
    if (same != kept.end() ? *same == wanted : text.empty()) {
        return true;
    }
    const bool hasEditsReelId =
        static_cast<size_t>(same - kept.begin()) < kRollsWithReelId && !get_Natural_reelid().empty();
    if ((same == kept.end() && kept.size() >= kMostRolls) || hasEditsReelId || refusesChange()) {
        return false;
    }
    if (same == kept.end()) {
        kept.push_back(wanted);
    } else {
        *same = wanted;
    }
    write_rolls_to_config();
    recordChange(kPropertiesChanged, true);
    return true;
}

String Edit::get_Natural_reelid() const {
    return EditKeys::kReelId.get(m_header);
}

bool Edit::set_Natural_reelid(const String& text) {
    if (MediumRoll probe; !probe.set_reelid(text)) {
        return false;
    }
    if (text == get_Natural_reelid()) {
        return true;
    }
    if (refusesChange()) {
        return false;
    }
    putNaturalReelid(text);
    recordChange(kPropertiesChanged, true);
    return true;
}

void Edit::putNaturalReelid(const String& text) {
    EditKeys::kReelId.set(m_header, text);
    if (m_header.contains(EditKeys::kNumMediumRolls)) {
        build_rolls();
        write_rolls_to_config();
    }
}
