#pragma once

#include "edit/model/edit_ptr.h"
#include "platform/base/export.h"
#include "platform/media/edit_label.h"
#include "platform/media/medium_roll.h"

/// The labels that tools of the user interface let their users choose among: a timecode, a key number, an ink
/// number, a reel's name, a text such as the scene, a duration of the edit. What each reads stands in one
/// table. The numbers live in settings: do not change them.
enum VagueUIFLabel : int32_t {
    kUIFNone = -1, ///< no choice; ends every set
    kUIFAnyLabel = 0,
    kUIFAnyTimecode = 1,
    kUIFPrimaryTimecode = 2,
    kUIFAnyAudioTimecode = 3,
    kUIFFirstGenVideoTimecode = 4,
    kUIFFirstGenAudioTimecode = 5,
    kUIFKeyKode = 6,
    kUIFCameraTimecode = 7,
    kUIFInkCode = 8,
    kUIF24PTimecode = 9,
    kUIFReelId = 10,
    kUIFSoundReelId = 11,
    kUIF24FrameReel = 12,
    kUIFLabReel = 13,
    kUIFCompiledReel = 14,
    kUIFCameraReel = 15,
    kUIFName = 16,
    kUIFSlateTake = 17,
    kUIFScene = 18,
    kUIFShot = 19,
    kUIFWho = 20,
    kUIFDescription = 21,
    kUIFNotes = 22,
    kUIFEditTimecode = 23,
    kUIFEdit24PTimecode = 24,
    kUIFEditTotalDuration = 25,
    kUIFEditMarkedDuration = 26,
    kUIFEditElapsedDuration = 27,
    kUIFEditScene = 28,
    kUIFEditDescription = 29,
    kUIFEditNotes = 30,
    kUIF24FrameGeneration = 31
};

/// A kind of label and the roll that it is read from. A plain value.
struct QM_API UserLabelSpec {
    UserLabelType type = kNoLabelType;
    MediumRollIdent roll;

    /// "Timecode on sound roll". One text a thread, which the next call on it overwrites.
    [[nodiscard]] const char* UserString() const;
    bool operator==(const UserLabelSpec&) const = default;
};

/// The edit's label of that kind on that roll (`Edit::get_label_`); not valid if it has none, and for a null
/// handle.
[[nodiscard]] QM_API edit_label FM_get_edit_label(const EditPtr& edit, const UserLabelSpec& spec);

/// \name Lookups in the table of kinds
/// Thread-safe; texts live as long as the process.
/// @{
/// The number of the display text in the application's resources; 2031 for what is no kind.
QM_API int uifLabelText(VagueUIFLabel kind);
/// The kind of label that is read; 0 for what is no kind.
QM_API UserLabelType uifLabelType(VagueUIFLabel kind);
/// The roll that it is read from; the invalid one for what is no kind.
QM_API MediumRollIdent uifLabelMedroll(VagueUIFLabel kind);
/// The text under which a choice is kept in settings; empty for what is no kind.
QM_API const char* uifLabel_to_config_str(VagueUIFLabel kind);
/// The first kind with that settings text, to the letter; -1 if there is none.
QM_API VagueUIFLabel config_str_to_uifLabel(std::string_view text);
/// The most characters that a burnt-in display keeps free for it; 0 for what is no kind.
QM_API int get_max_bitc_field_size(VagueUIFLabel kind);
/// The number of the display text for the reel of a roll; 2089 for a roll that has none of its own.
QM_API int uifReelText(const MediumRollIdent& roll);
/// @}

/// \name What each tool offers, in order, ended by `kUIFNone`
/// @{
QM_API const VagueUIFLabel* get_synctool_picture_label_set();
QM_API const VagueUIFLabel* get_synctool_sound_label_set();
QM_API const VagueUIFLabel* get_kemtool_label_set();
QM_API const VagueUIFLabel* get_labpick_label_set();
QM_API const VagueUIFLabel* get_filluif_label_set();
QM_API const VagueUIFLabel* get_bitc_label_set();
QM_API const VagueUIFLabel* get_bitc_reel_set();
QM_API const VagueUIFLabel* get_bitc_textlabel_set();
QM_API const VagueUIFLabel* get_bitc_editlabel_set();
QM_API const VagueUIFLabel* get_bitc_edittext_set();
/// @}
