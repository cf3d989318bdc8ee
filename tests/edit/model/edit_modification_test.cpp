#include "edit/model/edit_modification.h"

#include <gtest/gtest.h>

#include <random>

namespace {

TEST(Modification, TextReadsBackExactly) {
    std::mt19937 random(20);
    const double times[] = {0, 0.1, -1.0 / 3, 1e99, 5e-324, 1.7976931348623157e308};
    for (int number = -1; number < 60; ++number) {
        const auto type = static_cast<EditModificationType>(number);
        EditModification change(type);
        change.setSpan(times[random() % 6], times[random() % 6]);
        if (random() % 2 == 0) {
            change.setChan(IdStamp::fresh(IdStampMagic::Channel));
        }
        if (random() % 2 == 0) {
            change.setChans(static_cast<int>(random() % 50), static_cast<int>(random() % 5));
        }
        if (random() % 2 == 0) {
            change = change.invert();
        }
        const bool known = std::string_view(change.name()) != "unknown";
        const EditModification read = EditModification::fromString(change.asString());
        EXPECT_EQ(read, known ? change : EditModification(kNotDescribed)) << change.asString();
    }
}

TEST(Modification, HostileTextGivesNoDescription) {
    const String good = EditModification(kOpInsert).setSpan(1.5, 2).setChans(3, 1).asString();
    ASSERT_EQ(good, "3 insert done at=1.5 for=2 index=3 count=1");
    ASSERT_EQ(EditModification::fromString(good).type(), kOpInsert);
    for (size_t cut = 0; cut < good.size(); ++cut) {
        const EditModification read = EditModification::fromString(std::string_view(good).substr(0, cut));
        EXPECT_TRUE(read.type() == kNotDescribed || read.type() == kOpInsert) << cut;
    }
    for (const char* bad : {"",
                            " ",
                            "3",
                            "3 insert",
                            "3 remove done",
                            "99 x done",
                            "3 insert done ",
                            " 3 insert done",
                            "3  insert done",
                            "3 insert done at=",
                            "3 insert done at=nan",
                            "3 insert done at=inf",
                            "3 insert done at=1 at=1",
                            "3 insert done for=1 at=1",
                            "3 insert done at=01",
                            "3 insert done\n",
                            "3 insert done index=99999999999",
                            "3 insert done chan=0",
                            "3 insert done colour=1",
                            "3 insert forwards",
                            "+3 insert done",
                            "2147483648 insert done"}) {
        EXPECT_EQ(EditModification::fromString(bad), EditModification(kNotDescribed)) << bad;
    }
    EXPECT_EQ(EditModification::fromString(std::string(100000, ' ')).type(), kNotDescribed);
}

} // namespace
