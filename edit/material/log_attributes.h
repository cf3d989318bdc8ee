#pragma once

#include "edit/model/edit_types.h"
#include "platform/base/export.h"
#include "platform/base/qx_string.h"

#include <cstdint>
#include <map>

/// The attributes of a log. The numbers live in settings: do not change them. 0 is no attribute.
enum class LogAttribute : uint32_t {
    kNoAttribute = 0,
    kName = 1,
    kDate = 2,
    kModificationDate = 3,
    kScene = 4,
    kShot = 5,
    kWho = 6,
    kDescription = 7,
    kNotes = 8,
    kCookie = 9,
    kDuration = 10,
    kType = 11,
    kChans = 12,
    kFormat = 13,
    kLocation = 14,
    kStartTime = 15,
    kEndTime = 16,
    kReel = 17,
    kSoundStart = 18,
    kSoundReel = 19,
    kAudioQuality = 20,
    kCompressionFormat = 21,
    kFrameOrigin = 22,
    kPulldown = 23,
    kSequence = 24,
    kStart24PCode = 25,
    kEnd24PCode = 26,
    k24PReel = 27,
    kStartKeycode = 28,
    kEndKeycode = 29,
    kStartCamcode = 30,
    kEndCamcode = 31,
    kCamReel = 32,
    kCamDate = 33,
    kLabReel = 34,
    kCompReel = 35,
    kStartInkcode = 36,
    kEndInkcode = 37,
    kSourceFormat = 38,
    kReelType = 39,
    kFilmDuration = 40,
    kSearchTimecode = 41,
    kSearchDate = 42,
    kSearchLocation = 43
};

/// Attributes with their texts, in the order of the attributes' numbers. A plain value.
class QM_API LogAttributeMap {
public:
    using const_iterator = std::map<LogAttribute, String>::const_iterator;
    /// An attribute that is there already gets the text.
    void add(LogAttribute attribute, const String& text) { m_texts.insert_or_assign(attribute, text); }
    /// The text; empty when the attribute is not there.
    [[nodiscard]] String find(LogAttribute attribute) const;
    [[nodiscard]] bool empty() const { return m_texts.empty(); }
    [[nodiscard]] size_t size() const { return m_texts.size(); }
    [[nodiscard]] const_iterator begin() const { return m_texts.begin(); }
    [[nodiscard]] const_iterator end() const { return m_texts.end(); }
    bool operator==(const LogAttributeMap&) const = default;

private:
    std::map<LogAttribute, String> m_texts;
};

/// What is logged about a shot or an edit, and where each piece of it is kept: in the edit's header under a
/// key, in the project's record under a field name, or both; whether a user may change it, and whether it can
/// ever change. All functions are lookups in one table; thread-safe, and they allocate nothing unless they
/// return a `String`.
class QM_API LogAttributes {
public:
    using LogAttribute = ::LogAttribute;
    using enum ::LogAttribute;
    using Map = LogAttributeMap;
    static constexpr uint32_t kFirst = 1;
    static constexpr uint32_t kLast = 43;

    /// \name Properties, defined for every 32-bit number
    /// @{
    [[nodiscard]] static bool isUserEditable(LogAttribute attribute);
    /// True for what stays as it is for the item's life.
    [[nodiscard]] static bool isInvariant(LogAttribute attribute);
    [[nodiscard]] static bool isStoredInEditConfigb(LogAttribute attribute);
    [[nodiscard]] static bool isStoredInProjectDatabase(LogAttribute attribute);
    /// @}

    /// The field of the project's record; null for none.
    [[nodiscard]] static const char* getProjDBFieldNameForAttrib(LogAttribute attribute);
    /// The key of the edit's header; null for none. The name's is "name" for an edit and "slate/take" for
    /// everything else.
    [[nodiscard]] static const char* getEditConfigbNameForAttrib(LogAttribute attribute,
                                                                 edit_log_type_t type);
    /// The text that stands for the attribute in settings; empty for none.
    [[nodiscard]] static String getPersistableString(LogAttribute attribute);
    /// The first attribute with that text, in whatever case; 0 if there is none.
    [[nodiscard]] static LogAttribute getFromPersistableString(const String& text);
    /// The attribute's name for a person, in English; empty for none.
    [[nodiscard]] static WString getUserNameForAttrib(LogAttribute attribute);
};
