#pragma once

#include "platform/base/export.h"
#include "platform/base/qx_string.h"

#include <compare>
#include <cstdint>

class configb;

/// The media from which labels are read. The numbers live in edit files: do not change them.
enum MediumCode : int32_t {
    kNoMedium = 0,
    kPrimaryMedium = 1,   ///< whatever the material was taken from
    kCameraMedium = 2,    ///< the camera's film
    kVideoTapeMedium = 3, ///< the first tape made from it
    kSoundMedium = 4,
    kEditMedium = 8, ///< the edit itself
    kLabMedium = 10, ///< the lab's roll
    kCompiledMedium = 11,
    kLegacy24Medium = 13, ///< an older number of `k24FrameMedium`
    kEdit24Medium = 14,   ///< the edit counted in 24 frames
    k24FrameMedium = 15   ///< a tape or file of 24 frames
};

/// Names one roll of an edit: a medium and which of its rolls, from 1; number 0 is any. Compared word by
/// word. A plain value.
struct QM_API MediumRollIdent {
    int32_t medium = kNoMedium;
    int32_t number = 0;

    /// True if `other` is of the same medium and has the same number, or either number is 0.
    [[nodiscard]] bool MediumRollId_fits_this(const MediumRollIdent& other) const;
    auto operator<=>(const MediumRollIdent&) const = default;
};

/// What stands for no roll at all: both words -1.
QM_API MediumRollIdent get_invalid_MediumRollIdent();
/// The roll's name for a person: "camera roll", "camera roll 2"; "roll 99" for a medium that is not known.
QM_API String MediumRollId_to_UserString(const MediumRollIdent& roll);

/// One roll of an edit, with the name that stands on its can: the reel id. A plain value.
class QM_API MediumRoll {
public:
    /// Bytes of the longest reel id that is kept.
    static constexpr size_t kLongestReelId = 255;

    MediumRoll() = default;
    explicit MediumRoll(const MediumRollIdent& ident, String reelId = {});
    /// Reads the text form, "medium number reel id". Not valid when that is not what it is.
    explicit MediumRoll(const char* text);

    /// True for a medium and a number above 0.
    [[nodiscard]] bool is_valid() const;
    [[nodiscard]] const MediumRollIdent& ident() const { return m_ident; }
    [[nodiscard]] const String& get_reelid() const { return m_reelId; }
    /// False, changing nothing, for a text with control characters or of more than `kLongestReelId` bytes.
    bool set_reelid(const String& reelId);
    [[nodiscard]] String asString() const;
    /// Writes the roll into a header as "MEDIUMROLL" and its index. Nothing for one that is not valid.
    void write_to_config(configb& header, int index) const;
    bool operator==(const MediumRoll&) const = default;

private:
    MediumRollIdent m_ident = get_invalid_MediumRollIdent();
    String m_reelId;
};
