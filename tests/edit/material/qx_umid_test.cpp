#include "edit/material/qx_umid.h"

#include <gtest/gtest.h>

#include <set>

namespace {

String digits(const String& start, size_t count) {
    return start + String(count - start.size(), '0');
}

const String kValid = "060000000a0000002b00";

} // namespace

TEST(QxUMID, ReadsDigitsAndHoldsToItsOwnTestOfValidity) {
    const struct {
        String text;
        bool reads;
        QxUMIDDefs::Type::eType type;
    } cases[] = {
        {"", false, QxUMIDDefs::Type::eInvalid},
        {digits(kValid + "000013", 62), false, QxUMIDDefs::Type::eInvalid},
        {digits(kValid + "000013", 64), true, QxUMIDDefs::Type::eBasic},
        {digits(kValid + "000013", 65), true, QxUMIDDefs::Type::eBasic},
        {digits("060000000A0000002B00000033", 128), true, QxUMIDDefs::Type::eExtended},
        {digits(kValid + "000013", 130), true, QxUMIDDefs::Type::eBasic},
        {digits(kValid + "000014", 64), true, QxUMIDDefs::Type::eInvalid},
        {digits("060a2b34010101010101000013", 64), true, QxUMIDDefs::Type::eInvalid},
        {digits(kValid + "0g0013", 64), false, QxUMIDDefs::Type::eInvalid},
        {digits(kValid + "000013", 128) + "0g", true, QxUMIDDefs::Type::eBasic},
    };
    for (const auto& c : cases) {
        QxUMID value(kValid);
        EXPECT_EQ(value.setFromString(c.text), c.reads) << c.text;
        EXPECT_EQ(value.getType(), c.type) << c.text;
        if (!c.reads) {
            EXPECT_EQ(value, QxUMID()) << c.text;
        }
        const size_t length = c.type == QxUMIDDefs::Type::eBasic ? 64 : 128;
        EXPECT_EQ(value.getAsString(), value.valid() ? c.text.lower().substr(0, length) : "");
        EXPECT_EQ(QxUMID(c.text), value);
    }
}

TEST(QxUMID, TellsItsFields) {
    const QxUMID value(kValid + "0241" + "13" + "010203" + "000102030405060708090a0b0c0d0e0f");
    EXPECT_EQ(value.getMaterialType(), 2);
    EXPECT_EQ(value.getMaterialNumberGenerationMethod(), 4);
    EXPECT_EQ(value.getInstanceNumberGenerationMethod(), 1);
    EXPECT_EQ(value.getInstanceNumber(), 0x030201u);
    EXPECT_EQ(value.getMaterialNumber()[15], 15);
    EXPECT_EQ(QxUMID(digits(kValid + "05", 64)).getMaterialType(), 255);
    EXPECT_LT(QxUMID(), value);
}

TEST(QxUMID, MakesOneForEachMaterial) {
    std::set<QxUMID> made;
    for (int i = 0; i < 1000; ++i) {
        const QxUMID value = QxUMID::create(QxUMIDDefs::MaterialType::ePicture);
        ASSERT_TRUE(value.valid());
        EXPECT_EQ(value.getMaterialType(), QxUMIDDefs::MaterialType::ePicture);
        EXPECT_EQ(value.getMaterialNumber()[6] >> 4, 4);
        made.insert(value);
    }
    EXPECT_EQ(made.size(), 1000u);
}
