#include "platform/services/page_memory.h"

#include <algorithm>
#include <gtest/gtest.h>
#include <random>
#include <vector>

namespace {

using Qx::PageMemory;

TEST(PageMemory, WhatIsLentKeepsItsBytesWhateverElseGoes) {
    constexpr size_t kSize = (size_t{5} << 20) + 12345;
    constexpr unsigned kSeed = 20261121;
    std::mt19937 random(kSeed);
    std::shared_ptr<PageMemory> memory = PageMemory::make(kSize);
    ASSERT_NE(memory, nullptr);
    const std::span<std::byte> bytes = memory->bytes();
    ASSERT_EQ(bytes.size(), kSize);
    ASSERT_TRUE(std::all_of(bytes.begin(), bytes.end(), [](std::byte b) { return b == std::byte{0}; }));
    for (std::byte& byte : bytes) {
        byte = static_cast<std::byte>(random() & 0xFF);
    }
    const std::vector<std::byte> whole(bytes.begin(), bytes.end());
    struct Loan {
        size_t from;
        size_t size;
        std::shared_ptr<const void> held;
    };
    // Parts of every size, many of which overlap, given back in any order; the block itself goes half-way.
    std::vector<Loan> loans;
    for (int i = 0; i < 60; ++i) {
        const size_t from = random() % kSize;
        const size_t size = 1 + random() % std::min<size_t>(kSize - from, i % 2 == 0 ? 20'000 : kSize);
        loans.push_back({from, size, memory->lend(bytes.subspan(from, size))});
        ASSERT_EQ(loans.back().held.get(), bytes.data() + from);
    }
    while (!loans.empty()) {
        if (loans.size() == 30) {
            memory->giveBackUnlent();
            memory.reset();
        }
        std::swap(loans[random() % loans.size()], loans.back());
        loans.pop_back();
        for (const Loan& loan : loans) {
            ASSERT_TRUE(std::equal(whole.begin() + static_cast<std::ptrdiff_t>(loan.from),
                                   whole.begin() + static_cast<std::ptrdiff_t>(loan.from + loan.size),
                                   static_cast<const std::byte*>(loan.held.get())))
                << "seed " << kSeed << ", " << loans.size() << " loans left";
        }
    }
}

TEST(PageMemory, WhatCannotBeHadIsNull) {
    EXPECT_EQ(PageMemory::make(0), nullptr);
    EXPECT_EQ(PageMemory::make(SIZE_MAX), nullptr);
    EXPECT_EQ(PageMemory::make(SIZE_MAX / 4), nullptr);
}

} // namespace
