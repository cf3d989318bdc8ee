// Every packed form of the model against streams that lie: cut off, damaged, of random bytes, and with counts
// that no memory holds.

#include "cues_groups/cue_fixture.h"
#include "edit/model/channel_group_list.h"
#include "platform/media/level_store.h"
#include "platform/store/configb.h"
#include "support/cel_layout.h"
#include "support/memory_meter.h"

#include <cstring>
#include <gtest/gtest.h>
#include <random>

namespace {

using Bytes = std::vector<std::byte>;
using Levels = Aud::DynamicLevelControl::Store;

template <typename T>
Bytes packed(const T& object) {
    PStream stream;
    object.pack(stream);
    return stream.bytes();
}

template <typename T>
bool reads(std::span<const std::byte> bytes, T& into) {
    PStream stream(bytes);
    into.unpack(stream);
    return stream.good();
}

/// What is tested of a form. `make(n)` gives one with n items of the smallest size, or with something of
/// everything for n = 0.
template <typename T>
struct Form {};

template <>
struct Form<cel> {
    static cel make(int items) {
        cel made = layout::make(items == 0 ? "AAB..C D" : "");
        if (items == 0) {
            made.editChannelInfo("V1", IdStamp(1, 2, 3), "SUBTYPE:NONE", "stills");
            made.set_resolution(0.04);
        }
        for (int i = 0; i < items; ++i) {
            made.appendEventPair(cookie("E0001000"), 0, i, 1);
        }
        return made;
    }
    static bool isSound(const cel& its) { return its.is_good_cel() != 0; }
    static constexpr size_t kCountAt = 4 + 2 + 12 + 4 + 12 + 4 + 6 + 8; ///< behind the texts and the stamp
    static constexpr size_t kGrowth = 4; ///< memory for each byte of the stream at most
};

template <>
struct Form<Levels> {
    static Levels make(int items) {
        Levels made;
        for (int i = 0; i < std::max(items, 3); ++i) {
            made.insertNode(2.0 * i, 0.5F * static_cast<float>(i % 3));
        }
        return made;
    }
    static bool isSound(const Levels& its) {
        for (size_t i = 1; i < its.size(); ++i) {
            if (!(its[i].time > its[i - 1].time)) {
                return false;
            }
        }
        return true;
    }
    static constexpr size_t kCountAt = 0;
    static constexpr size_t kGrowth = 4;
};

template <>
struct Form<cue_list> {
    static cue_list make(int items) {
        cue_list made;
        for (int i = 0; i < (items == 0 ? 20 : items); ++i) {
            cue_point cue = test::marker(items == 0 ? "cue of some length" : "", i, i, i);
            cue.setCode(-i);
            cue.setSecondTime(i + 0.5);
            made.add_cue_point(cue);
        }
        return made;
    }
    static bool isSound(const cue_list&) { return true; }
    static constexpr size_t kCountAt = 0;
    static constexpr size_t kGrowth = 4;
};

template <>
struct Form<ChannelGroupList> {
    static ChannelGroupList make(int items) {
        ChannelGroupList made;
        for (int i = 0; i < (items == 0 ? 8 : std::min(items, 2000)); ++i) {
            Vector<IdStamp> chans;
            for (int n = 0; n < 2 + (items == 0 ? i : 0); ++n) {
                chans.push_back(IdStamp::fresh(IdStampMagic::Channel));
            }
            made.addGroup(chans, static_cast<ChannelGroup::eType>(i % 8));
        }
        return made;
    }
    static bool isSound(const ChannelGroupList& its) {
        for (unsigned i = 0; i < its.size(); ++i) {
            if (its.getGroup(i)->size() < 2) {
                return false;
            }
        }
        return true;
    }
    static constexpr size_t kCountAt = 0;
    static constexpr size_t kGrowth = 4;
};

template <>
struct Form<configb> {
    static configb make(int items) {
        configb made("EDIT", "END_EDIT_HEADER");
        made.setInt("Least", -7);
        made.setInt64("small int64", 5);
        made.setDouble("third", 1.0 / 3);
        made.setString("escapes", "a\\n\nb");
        made.setCookie("black", black_cookie);
        made.setBool("yes", true);
        for (int i = 0; i < items; ++i) {
            made.setBool(std::to_string(i), true);
        }
        return made;
    }
    static bool isSound(const configb& its) { return its.keys().size() == its.size(); }
    static constexpr size_t kCountAt = 0;
    static constexpr size_t kGrowth = 64; ///< keys are found through a table
};

template <typename T>
class PackedForm : public testing::Test {
protected:
    /// Unpacks, and sees that it takes no more memory than may be for so many bytes.
    static bool readsWithin(const Bytes& bytes, T& into) {
        const test::MemoryMeter meter;
        const bool good = reads(bytes, into);
        EXPECT_LE(meter.peak(), Form<T>::kGrowth * bytes.size() + (64U << 10)) << bytes.size() << " bytes";
        return good;
    }
};

using Forms = testing::Types<cel, Levels, cue_list, ChannelGroupList, configb>;
TYPED_TEST_SUITE(PackedForm, Forms);

TYPED_TEST(PackedForm, CutOffOrWithACountThatLiesIsRefusedAndLeavesTheObject) {
    const Bytes whole = packed(Form<TypeParam>::make(0));
    TypeParam object = Form<TypeParam>::make(2);
    const Bytes before = packed(object);
    for (size_t size = 0; size < whole.size(); ++size) {
        ASSERT_FALSE(reads(std::span(whole).first(size), object)) << size;
        ASSERT_EQ(packed(object), before) << size;
    }
    for (const uint32_t count : {4000000000U, 0x7FFFFFFFU, UINT32_MAX}) {
        Bytes bytes = whole;
        std::memcpy(bytes.data() + Form<TypeParam>::kCountAt, &count, 4);
        EXPECT_FALSE(this->readsWithin(bytes, object)) << count;
        EXPECT_EQ(packed(object), before) << count;
    }
    ASSERT_TRUE(reads(whole, object));
    EXPECT_EQ(packed(object), whole);
}

TYPED_TEST(PackedForm, ManySmallItemsTakeBoundedMemory) {
    const Bytes whole = packed(Form<TypeParam>::make(20'000));
    TypeParam object;
    EXPECT_TRUE(this->readsWithin(whole, object));
    EXPECT_EQ(packed(object), whole);
}

/// Four million bytes, half of them random and half good forms with random damage, in pieces.
TYPED_TEST(PackedForm, DamageIsRefusedOrGivesASoundObject) {
    constexpr unsigned kSeed = 11;
    std::mt19937_64 random(kSeed);
    const Bytes form = packed(Form<TypeParam>::make(0));
    size_t read = 0;
    for (size_t thrown = 0; thrown < 4'000'000;) {
        Bytes bytes = form;
        if (random() % 2 == 0) {
            bytes.resize(1 + random() % 4096);
            for (auto& byte : bytes) {
                byte = static_cast<std::byte>(random());
            }
            bytes[std::min<size_t>(2, bytes.size() - 1)] = bytes[bytes.size() - 1] = std::byte{0};
        } else {
            for (uint64_t n = random() % 4; n > 0; --n) {
                bytes[random() % bytes.size()] = static_cast<std::byte>(random());
            }
        }
        thrown += bytes.size();
        SCOPED_TRACE(testing::Message() << "seed " << kSeed << " at " << thrown);
        TypeParam object;
        const Bytes empty = packed(object);
        if (!this->readsWithin(bytes, object)) {
            ASSERT_EQ(packed(object), empty);
            continue;
        }
        ASSERT_TRUE(Form<TypeParam>::isSound(object));
        TypeParam again;
        ASSERT_TRUE(reads(packed(object), again));
        ASSERT_EQ(packed(again), packed(object));
        ++read;
    }
    EXPECT_GT(read, 100U) << "some of the damage leaves a good form";
}

} // namespace
