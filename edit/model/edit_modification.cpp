#include "edit/model/edit_modification.h"

#include <array>
#include <cmath>

namespace {

struct TypeName {
    EditModificationType type;
    const char* name; ///< one word: it is a field of the text form, so do not change it
};

constexpr std::array kTypes{
    TypeName{kNoModification, "none"},
    TypeName{kOpReplace, "replace"},
    TypeName{kOpReplaceMarked, "replace-marked"},
    TypeName{kOpInsert, "insert"},
    TypeName{kOpRemove, "remove"},
    TypeName{kOpInsertMarked, "insert-marked"},
    TypeName{kOpReplaceToEnd, "replace-to-end"},
    TypeName{kOpLift, "lift"},
    TypeName{kOpSwapTracks, "swap-tracks"},
    TypeName{kOpBackReplace, "back-replace"},
    TypeName{kOpBackReplaceMarked, "back-replace-marked"},
    TypeName{kOpCopyTrack, "copy-track"},
    TypeName{kOpMoveTrack, "move-track"},
    TypeName{kOpFillBlack, "fill-black"},
    TypeName{kOpBackInsert, "back-insert"},
    TypeName{kOpBackInsertMarked, "back-insert-marked"},
    TypeName{kOpReplaceMaterial, "replace-material"},
    TypeName{kPropertiesChanged, "properties"},
    TypeName{kNameChanged, "name"},
    TypeName{kCuesChanged, "cues"},
    TypeName{kGroupsChanged, "groups"},
    TypeName{kLevelsChanged, "levels"},
    TypeName{kFadesChanged, "fades"},
    TypeName{kEffectsChanged, "effects"},
    TypeName{kEventsChanged, "events"},
    TypeName{kLabelsChanged, "labels"},
    TypeName{kSyncChanged, "sync"},
    TypeName{kChansInserted, "channels-inserted"},
    TypeName{kChansRemoved, "channels-removed"},
    TypeName{kEditDeleted, "deleted"},
    TypeName{kCurrentTimeChanged, "current-time"},
    TypeName{kMarkChanged, "mark"},
    TypeName{kChanNameChanged, "channel-name"},
    TypeName{kShotSoundChanged, "shot-sound"},
    TypeName{kInitial, "initial"},
    TypeName{kSeveral, "several"},
    TypeName{kNotDescribed, "not-described"},
    TypeName{kTransient, "transient"},
};

constexpr std::string_view kDone = "done";
constexpr std::string_view kUndone = "undone";

const TypeName* findType(int number) {
    for (const TypeName& known : kTypes) {
        if (known.type == number) {
            return &known;
        }
    }
    return nullptr;
}

/// Takes the next field off a text of fields joined by single blanks.
std::string_view takeField(std::string_view& rest) {
    const size_t blank = rest.find(' ');
    const std::string_view field = rest.substr(0, blank);
    rest = blank == std::string_view::npos ? std::string_view() : rest.substr(blank + 1);
    return field;
}

/// If `field` begins with `key`, the rest of it.
bool takeKey(std::string_view field, std::string_view key, std::string_view& value) {
    if (!field.starts_with(key)) {
        return false;
    }
    value = field.substr(key.size());
    return true;
}

bool readTime(std::string_view text, double& seconds) {
    return Qx::textToDouble(text, seconds) && std::isfinite(seconds);
}

} // namespace

EditModification EditModification::fromString(std::string_view text) {
    const EditModification none(kNotDescribed);
    std::string_view rest = text;
    int number = 0;
    if (!Qx::textToInt(takeField(rest), number)) {
        return none;
    }
    const TypeName* const known = findType(number);
    if (known == nullptr || takeField(rest) != known->name) {
        return none;
    }
    EditModification read(known->type);
    const std::string_view direction = takeField(rest);
    if (direction != kDone && direction != kUndone) {
        return none;
    }
    read.m_inverted = direction == kUndone;
    while (!rest.empty()) {
        const std::string_view field = takeField(rest);
        std::string_view value;
        bool good = false;
        if (takeKey(field, "chan=", value)) {
            read.m_chan = IdStamp(value);
            good = read.m_chan.valid();
        } else if (takeKey(field, "at=", value)) {
            good = readTime(value, read.m_at);
        } else if (takeKey(field, "for=", value)) {
            good = readTime(value, read.m_length);
        } else if (takeKey(field, "index=", value)) {
            good = Qx::textToInt(value, read.m_index);
        } else if (takeKey(field, "count=", value)) {
            good = Qx::textToInt(value, read.m_count);
        }
        if (!good) {
            return none;
        }
    }
    // Only the one way in which this class writes a value is accepted: no field twice, none left blank, no
    // other order.
    return read.asString() == text ? read : none;
}

const char* EditModification::name() const {
    const TypeName* const known = findType(m_type);
    return known != nullptr ? known->name : "unknown";
}

String EditModification::asString() const {
    String text = String::format("%d %s %s", static_cast<int>(m_type), name(),
                                 m_inverted ? kUndone.data() : kDone.data());
    if (m_chan.valid()) {
        text += " chan=" + m_chan.asString();
    }
    if (m_at != 0) {
        text += " at=" + Qx::doubleToText(m_at);
    }
    if (m_length != 0) {
        text += " for=" + Qx::doubleToText(m_length);
    }
    if (m_index != NO_CHAN) {
        text += String::format(" index=%d", m_index);
    }
    if (m_count != 0) {
        text += String::format(" count=%d", m_count);
    }
    return text;
}

EditModification EditModification::invert() const {
    EditModification inverse = *this;
    inverse.m_inverted = !m_inverted;
    switch (m_type) {
    case kOpInsert:
        inverse.m_type = kOpRemove;
        break;
    case kOpRemove:
        inverse.m_type = kOpInsert;
        break;
    case kChansInserted:
        inverse.m_type = kChansRemoved;
        break;
    case kChansRemoved:
        inverse.m_type = kChansInserted;
        break;
    default:
        break;
    }
    return inverse;
}

EditModification& EditModification::setChan(const IdStamp& chan) {
    m_chan = chan;
    return *this;
}

EditModification& EditModification::setSpan(double at, double length) {
    if (std::isfinite(at) && std::isfinite(length)) {
        m_at = at;
        m_length = length;
    }
    return *this;
}

EditModification& EditModification::setChans(int index, int count) {
    m_index = index;
    m_count = count;
    return *this;
}

bool isConsoleEditOp(EditModificationType type) {
    return type >= kOpReplace && type <= kOpReplaceMaterial;
}
