#include "platform/base/id_stamp.h"

#include "support/child_process.h"

#include <gtest/gtest.h>
#include <set>
#include <thread>
#include <vector>

namespace {

TEST(IdStamp, MagicTypeSurvivesTextAndComparison) {
    for (const auto type : {IdStampMagic::EffectNode, IdStampMagic::Material, IdStampMagic::Channel,
                            IdStampMagic::ChannelNode}) {
        const IdStamp stamp = IdStamp::fresh(type);
        EXPECT_EQ(stamp.getMagicType(), type);
        const IdStamp read(stamp.asString());
        EXPECT_EQ(read, stamp);
        EXPECT_EQ(read.getMagicType(), type);
        EXPECT_EQ(stamp.asString().find_first_of(" ,="), String::npos);
        IdStamp other = stamp;
        other.setMagicType(static_cast<IdStampMagic::MagicType>((type + 1) % 4));
        EXPECT_NE(other, stamp);
        other.setMagicType(type);
        EXPECT_EQ(other, stamp);
    }
}

TEST(IdStamp, OtherTextsGiveTheNullStamp) {
    const std::string good = "00000001-0000000a-ffffffff";
    ASSERT_EQ(IdStamp(good), IdStamp(1, 10, 0xFFFFFFFF));
    for (const std::string& text :
         {std::string(), good + "0", good.substr(1), "0000000g" + good.substr(8),
          "00000001 0000000a-ffffffff" + std::string(), "+0000001" + good.substr(8)}) {
        EXPECT_FALSE(IdStamp(text).valid()) << text;
    }
}

TEST(IdStamp, FreshOnesDifferOnAllThreads) {
    constexpr int kThreads = 4;
    constexpr size_t kEach = 5000;
    std::vector<std::vector<IdStamp>> made(kThreads);
    std::vector<std::thread> threads;
    for (auto& mine : made) {
        threads.emplace_back([&mine] {
            for (size_t i = 0; i < kEach; ++i) {
                mine.push_back(IdStamp::fresh(IdStampMagic::Material));
            }
        });
    }
    std::set<IdStamp> all;
    for (size_t i = 0; i < threads.size(); ++i) {
        threads[i].join();
        all.insert(made[i].begin(), made[i].end());
    }
    EXPECT_EQ(all.size(), kThreads * kEach);
}

TEST(IdStamp, AForkedProcessDoesNotRepeatItsParent) {
    static_cast<void>(IdStamp::fresh(IdStampMagic::Material));
    int ends[2];
    ASSERT_EQ(::pipe(ends), 0);
    const auto end = test::runInChild([&] {
        const String text = IdStamp::fresh(IdStampMagic::Material).asString();
        return ::write(ends[1], text.data(), text.size()) == 26;
    });
    ASSERT_EQ(end, test::ChildEnd::Succeeded);
    char text[26];
    ASSERT_EQ(::read(ends[0], text, sizeof text), 26);
    ::close(ends[0]);
    ::close(ends[1]);
    EXPECT_NE(IdStamp(std::string_view(text, 26)), IdStamp::fresh(IdStampMagic::Material));
}

} // namespace
