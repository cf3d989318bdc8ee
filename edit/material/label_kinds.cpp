#include "edit/material/label_kinds.h"

#include "edit/model/edit.h"

#include <cstdio>

namespace {

struct KindRow {
    VagueUIFLabel kind;
    int text;
    UserLabelType type;
    int medium;
    const char* settings;
    int size;
};

constexpr UserLabelType kText = kTextLabelType;
constexpr UserLabelType kTimecode = kTimecodeLabelType;

constexpr KindRow kKinds[] = {
    {kUIFAnyLabel, 2021, kAnyLabelType, 1, "Any_Label", 17},
    {kUIFAnyTimecode, 2022, kTimecode, 1, "Any_Timecode", 12},
    {kUIFPrimaryTimecode, 2023, kTimecode, 1, "Primary_Timecode", 12},
    {kUIFAnyAudioTimecode, 2024, kTimecode, 4, "Any_Audio_Timecode", 12},
    {kUIFFirstGenVideoTimecode, 2025, kTimecode, 3, "1st_Gen_Video_Timecode", 12},
    {kUIFFirstGenAudioTimecode, 2026, kTimecode, 4, "1st_Gen_Audio_Timecode", 12},
    {kUIFKeyKode, 2027, kKeyKodeLabelType, 2, "KeyKode", 17},
    {kUIFCameraTimecode, 2028, kTimecode, 2, "Camera_Timecode", 12},
    {kUIFInkCode, 2029, kInkCodeLabelType, 10, "Ink_code", 15},
    {kUIF24PTimecode, 2030, kTimecode, 15, "24P_Timecode", 12},
    {kUIF24FrameGeneration, 2463, kTimecode, 15, "24f_Generation", 12},
    {kUIFReelId, 2083, kText, 1, "reelid", 10},
    {kUIFSoundReelId, 2084, kText, 4, "reelid1", 10},
    {kUIF24FrameReel, 2085, kText, 15, "24f_reel", 10},
    {kUIFLabReel, 2086, kText, 10, "lab_reel", 10},
    {kUIFCompiledReel, 2087, kText, 11, "comp_reel", 10},
    {kUIFCameraReel, 2088, kText, 2, "camreel", 10},
    {kUIFName, 2096, kText, 0, "name", 12},
    {kUIFSlateTake, 2095, kText, 0, "slate/take", 12},
    {kUIFScene, 571, kText, 0, "scene", 12},
    {kUIFShot, 572, kText, 0, "shot", 12},
    {kUIFWho, 573, kText, 0, "who", 12},
    {kUIFDescription, 574, kText, 0, "description", 40},
    {kUIFNotes, 575, kText, 0, "notes", 40},
    {kUIFEditTimecode, 864, kTimecode, 8, "Edit_Timecode", 12},
    {kUIFEdit24PTimecode, 886, kTimecode, 14, "Edit_24PTimecode", 12},
    {kUIFEditTotalDuration, 880, kTimecode, 8, "Edit_TotalDur", 12},
    {kUIFEditMarkedDuration, 879, kTimecode, 8, "Edit_MarkDur", 12},
    {kUIFEditElapsedDuration, 887, kTimecode, 8, "Edit_ElapDur", 12},
    {kUIFEditScene, 2287, kText, 0, "scene", 12},
    {kUIFEditDescription, 2288, kText, 0, "description", 40},
    {kUIFEditNotes, 2289, kText, 0, "notes", 40},
};

constexpr int kNoKindText = 2031;

const KindRow* rowOf(VagueUIFLabel kind) {
    for (const KindRow& row : kKinds) {
        if (row.kind == kind) {
            return &row;
        }
    }
    return nullptr;
}

struct ReelRow {
    MediumRollIdent roll;
    int text;
};

// The 2 of the first row is deliberate: its text belongs to the second roll of the source.
constexpr ReelRow kReels[] = {{{1, 2}, 2083},  {{4, 1}, 2084},  {{15, 1}, 2085},
                              {{10, 1}, 2086}, {{11, 1}, 2087}, {{2, 1}, 2088}};
constexpr int kOtherReelText = 2089;

} // namespace

const char* UserLabelSpec::UserString() const {
    thread_local char text[128];
    std::snprintf(text, sizeof text, "%s on %s", UserLabelType_to_UserString(type),
                  MediumRollId_to_UserString(roll).c_str());
    return text;
}

edit_label FM_get_edit_label(const EditPtr& edit, const UserLabelSpec& spec) {
    return edit.valid() ? edit->get_label_(spec.type, spec.roll) : edit_label();
}

int uifLabelText(VagueUIFLabel kind) {
    const KindRow* const row = rowOf(kind);
    return row != nullptr ? row->text : kNoKindText;
}

UserLabelType uifLabelType(VagueUIFLabel kind) {
    const KindRow* const row = rowOf(kind);
    return row != nullptr ? row->type : kNoLabelType;
}

MediumRollIdent uifLabelMedroll(VagueUIFLabel kind) {
    const KindRow* const row = rowOf(kind);
    return row != nullptr ? MediumRollIdent{row->medium, 0} : get_invalid_MediumRollIdent();
}

const char* uifLabel_to_config_str(VagueUIFLabel kind) {
    const KindRow* const row = rowOf(kind);
    return row != nullptr ? row->settings : "";
}

VagueUIFLabel config_str_to_uifLabel(std::string_view text) {
    for (const KindRow& row : kKinds) {
        if (text == row.settings) {
            return row.kind;
        }
    }
    return kUIFNone;
}

int get_max_bitc_field_size(VagueUIFLabel kind) {
    const KindRow* const row = rowOf(kind);
    return row != nullptr ? row->size : 0;
}

int uifReelText(const MediumRollIdent& roll) {
    for (const ReelRow& row : kReels) {
        if (row.roll.MediumRollId_fits_this(roll)) {
            return row.text;
        }
    }
    return kOtherReelText;
}

const VagueUIFLabel* get_synctool_picture_label_set() {
    static constexpr VagueUIFLabel set[] = {
        kUIFPrimaryTimecode, kUIF24PTimecode, kUIFFirstGenAudioTimecode, kUIFInkCode, kUIFCameraTimecode,
        kUIFKeyKode,         kUIFNone};
    return set;
}

const VagueUIFLabel* get_synctool_sound_label_set() {
    static constexpr VagueUIFLabel set[] = {kUIFPrimaryTimecode, kUIF24PTimecode, kUIFFirstGenAudioTimecode,
                                            kUIFInkCode, kUIFNone};
    return set;
}

const VagueUIFLabel* get_kemtool_label_set() {
    static constexpr VagueUIFLabel set[] = {
        kUIFPrimaryTimecode, kUIF24PTimecode,    kUIFAnyAudioTimecode, kUIFFirstGenAudioTimecode,
        kUIFInkCode,         kUIFCameraTimecode, kUIFKeyKode,          kUIFNone};
    return set;
}

const VagueUIFLabel* get_labpick_label_set() {
    static constexpr VagueUIFLabel set[] = {kUIFPrimaryTimecode,
                                            kUIF24FrameGeneration,
                                            kUIFFirstGenAudioTimecode,
                                            kUIFInkCode,
                                            kUIFCameraTimecode,
                                            kUIFKeyKode,
                                            kUIFEditMarkedDuration,
                                            kUIFEditTotalDuration,
                                            kUIFNone};
    return set;
}

const VagueUIFLabel* get_filluif_label_set() {
    static constexpr VagueUIFLabel set[] = {kUIFPrimaryTimecode,
                                            kUIF24FrameGeneration,
                                            kUIFFirstGenAudioTimecode,
                                            kUIFInkCode,
                                            kUIFCameraTimecode,
                                            kUIFKeyKode,
                                            kUIFNone};
    return set;
}

const VagueUIFLabel* get_bitc_label_set() {
    return get_filluif_label_set();
}

const VagueUIFLabel* get_bitc_reel_set() {
    static constexpr VagueUIFLabel set[] = {kUIFReelId,       kUIFSoundReelId, kUIF24FrameReel, kUIFLabReel,
                                            kUIFCompiledReel, kUIFCameraReel,  kUIFNone};
    return set;
}

const VagueUIFLabel* get_bitc_textlabel_set() {
    static constexpr VagueUIFLabel set[] = {kUIFSlateTake,   kUIFScene, kUIFShot, kUIFWho,
                                            kUIFDescription, kUIFNotes, kUIFNone};
    return set;
}

const VagueUIFLabel* get_bitc_editlabel_set() {
    static constexpr VagueUIFLabel set[] = {kUIFEditTimecode, kUIFEdit24PTimecode, kUIFEditElapsedDuration,
                                            kUIFEditTotalDuration, kUIFNone};
    return set;
}

const VagueUIFLabel* get_bitc_edittext_set() {
    static constexpr VagueUIFLabel set[] = {kUIFName, kUIFEditScene, kUIFEditDescription, kUIFEditNotes,
                                            kUIFNone};
    return set;
}
