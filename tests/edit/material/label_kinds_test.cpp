#include "edit/material/label_kinds.h"

#include <gtest/gtest.h>

namespace {

std::vector<int> all(const VagueUIFLabel* set) {
    std::vector<int> kinds;
    for (; *set != -1; ++set) {
        kinds.push_back(*set);
    }
    return kinds;
}

} // namespace

TEST(LabelKinds, AreLookedUpByNumberAndBySettingsText) {
    const struct {
        int kind, text, type, medium;
        const char* settings;
        int size;
    } cases[] = {
        {0, 2021, 1, 1, "Any_Label", 17},
        {6, 2027, 4, 2, "KeyKode", 17},
        {8, 2029, 6, 10, "Ink_code", 15},
        {31, 2463, 3, 15, "24f_Generation", 12},
        {9, 2030, 3, 15, "24P_Timecode", 12},
        {16, 2096, 2, 0, "name", 12},
        {18, 571, 2, 0, "scene", 12},
        {22, 575, 2, 0, "notes", 40},
        {24, 886, 3, 14, "Edit_24PTimecode", 12},
        {27, 887, 3, 8, "Edit_ElapDur", 12},
        {30, 2289, 2, 0, "notes", 40},
        {32, 2031, 0, -1, "", 0},
        {99, 2031, 0, -1, "", 0},
    };
    for (const auto& c : cases) {
        const auto kind = static_cast<VagueUIFLabel>(c.kind);
        EXPECT_EQ(uifLabelText(kind), c.text) << c.kind;
        EXPECT_EQ(uifLabelType(kind), c.type) << c.kind;
        EXPECT_EQ(uifLabelMedroll(kind), (MediumRollIdent{c.medium, c.medium < 0 ? -1 : 0})) << c.kind;
        EXPECT_STREQ(uifLabel_to_config_str(kind), c.settings) << c.kind;
        EXPECT_EQ(get_max_bitc_field_size(kind), c.size) << c.kind;
    }
    // Every kind is found again by its text, but those whose text an earlier row has.
    for (int kind = 0; kind < 28; ++kind) {
        EXPECT_EQ(config_str_to_uifLabel(uifLabel_to_config_str(static_cast<VagueUIFLabel>(kind))), kind);
    }
    EXPECT_EQ(config_str_to_uifLabel("scene"), 18);
    EXPECT_EQ(config_str_to_uifLabel("Scene"), -1);
    EXPECT_EQ(config_str_to_uifLabel(""), -1);
}

TEST(LabelKinds, EachToolOffersItsOwn) {
    using Kinds = std::vector<int>;
    EXPECT_EQ(all(get_synctool_picture_label_set()), (Kinds{2, 9, 5, 8, 7, 6}));
    EXPECT_EQ(all(get_synctool_sound_label_set()), (Kinds{2, 9, 5, 8}));
    EXPECT_EQ(all(get_kemtool_label_set()), (Kinds{2, 9, 3, 5, 8, 7, 6}));
    EXPECT_EQ(all(get_labpick_label_set()), (Kinds{2, 31, 5, 8, 7, 6, 26, 25}));
    EXPECT_EQ(all(get_filluif_label_set()), (Kinds{2, 31, 5, 8, 7, 6}));
    EXPECT_EQ(get_bitc_label_set(), get_filluif_label_set());
    EXPECT_EQ(all(get_bitc_reel_set()), (Kinds{10, 11, 12, 13, 14, 15}));
    EXPECT_EQ(all(get_bitc_textlabel_set()), (Kinds{17, 18, 19, 20, 21, 22}));
    EXPECT_EQ(all(get_bitc_editlabel_set()), (Kinds{23, 24, 27, 25}));
    EXPECT_EQ(all(get_bitc_edittext_set()), (Kinds{16, 28, 29, 30}));
}

TEST(LabelKinds, ReelsHaveTheTextOfTheirRoll) {
    const struct {
        MediumRollIdent roll;
        int text;
    } cases[] = {{{1, 2}, 2083},  {{1, 1}, 2089},
                 {{4, 1}, 2084},  {{15, 1}, 2085},
                 {{10, 1}, 2086}, {{11, 1}, 2087},
                 {{2, 1}, 2088},  {{2, 2}, 2089},
                 {{0, 0}, 2089},  {get_invalid_MediumRollIdent(), 2089}};
    for (const auto& c : cases) {
        EXPECT_EQ(uifReelText(c.roll), c.text) << c.roll.medium;
    }
    EXPECT_STREQ((UserLabelSpec{kTimecodeLabelType, {4, 2}}.UserString()), "Timecode on sound roll 2");
    EXPECT_STREQ((UserLabelSpec{kAnyLabelType, {4, 1}}.UserString()), " on sound roll");
}
