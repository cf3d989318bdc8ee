#include "edit/material/log_attributes.h"

#include <gtest/gtest.h>

#include <set>

using Attribute = LogAttributes::LogAttribute;

namespace {

String orNone(const char* text) {
    return text != nullptr ? text : "-";
}

} // namespace

// Told apart from the table in the code by the words of the properties: which number has which.
TEST(LogAttributes, EveryNumberHasItsProperties) {
    const std::set<uint32_t> editable = {1, 4, 5, 6, 7, 8, 17, 19, 27, 32, 34, 35};
    const std::set<uint32_t> invariant = {2, 9, 11, 13, 14, 21};
    const std::set<uint32_t> notInHeader = {0, 12, 13, 14, 15, 16, 18, 20, 21};
    const std::set<uint32_t> notInRecord = {0, 3, 13, 14, 41, 42, 43};
    for (const uint32_t number :
         {0u,  1u,  2u,  3u,  4u,  5u,  6u,  7u,  8u,  9u,    10u,         11u,
          12u, 13u, 14u, 15u, 16u, 17u, 18u, 19u, 20u, 21u,   22u,         27u,
          32u, 34u, 35u, 36u, 40u, 41u, 42u, 43u, 44u, 1000u, 0x80000000u, 0xFFFFFFFFu}) {
        const Attribute attribute{number};
        EXPECT_EQ(LogAttributes::isUserEditable(attribute), editable.contains(number)) << number;
        EXPECT_EQ(LogAttributes::isInvariant(attribute), invariant.contains(number)) << number;
        EXPECT_EQ(LogAttributes::isStoredInEditConfigb(attribute), !notInHeader.contains(number)) << number;
        EXPECT_EQ(LogAttributes::isStoredInProjectDatabase(attribute), !notInRecord.contains(number))
            << number;
        if (number == 0 || number > 43) {
            EXPECT_EQ(LogAttributes::getProjDBFieldNameForAttrib(attribute), nullptr);
            EXPECT_EQ(LogAttributes::getEditConfigbNameForAttrib(attribute, kLogEdit), nullptr);
            EXPECT_EQ(LogAttributes::getPersistableString(attribute), "");
            EXPECT_EQ(LogAttributes::getUserNameForAttrib(attribute), L"");
        }
    }
}

TEST(LogAttributes, AreKeptUnderTheirNames) {
    const struct {
        uint32_t number;
        edit_log_type_t type;
        const char* field;
        const char* key;
        const char* text;
    } cases[] = {
        {1, kLogEdit, "name", "name", "name"},
        {1, kLogShot, "name", "slate/take", "name"},
        {1, kLogNone, "name", "slate/take", "name"},
        {2, kLogEdit, "date", "CREATION_TIME", "date"},
        {3, kLogEdit, "-", "MODIFICATION_TIME", "ModificationDate"},
        {12, kLogEdit, "chans", "chans", "chans"},
        {13, kLogEdit, "-", "-", "Format"},
        {14, kLogEdit, "-", "-", "Location"},
        {15, kLogEdit, "start time", "-", "start time"},
        {17, kLogShot, "reel", "reelid", "reel"},
        {19, kLogShot, "snd reel", "reelid1", "snd reel"},
        {21, kLogShot, "Compression Format", "-", "Compression Format"},
        {27, kLogShot, "24P reel", "24P_reel", "24P reel"},
        {32, kLogShot, "cam reel", "camreel", "cam reel"},
        {35, kLogShot, "comp reel", "comp_reel", "comp reel"},
        {40, kLogShot, "film duration", "film duration", "film duration"},
        {41, kLogShot, "-", "tc_fake", "SearchTimecode"},
        {43, kLogShot, "-", "DRIVELOCATION", "SearchLocation"},
    };
    for (const auto& c : cases) {
        const Attribute attribute{c.number};
        EXPECT_EQ(orNone(LogAttributes::getProjDBFieldNameForAttrib(attribute)), c.field) << c.number;
        EXPECT_EQ(orNone(LogAttributes::getEditConfigbNameForAttrib(attribute, c.type)), c.key) << c.number;
        EXPECT_EQ(LogAttributes::getPersistableString(attribute), c.text) << c.number;
        EXPECT_EQ(LogAttributes::getFromPersistableString(String(c.text).upper()), attribute) << c.number;
        EXPECT_FALSE(LogAttributes::getUserNameForAttrib(attribute).empty());
    }
    for (const char* text : {"reelid", "", "slate/take", "tc_fake", "name "}) {
        EXPECT_EQ(LogAttributes::getFromPersistableString(text), LogAttributes::kNoAttribute) << text;
    }
}

TEST(LogAttributesMap, HoldsOneTextAnAttributeInOrder) {
    LogAttributes::Map map;
    EXPECT_TRUE(map.empty());
    map.add(LogAttributes::kReel, "R1");
    map.add(LogAttributes::kName, "a");
    map.add(LogAttributes::kReel, "R2");
    EXPECT_EQ(map.find(LogAttributes::kReel), "R2");
    EXPECT_EQ(map.find(LogAttributes::kShot), "");
    EXPECT_EQ(map.begin()->first, LogAttributes::kName);
    EXPECT_EQ(map.size(), 2u);
}
