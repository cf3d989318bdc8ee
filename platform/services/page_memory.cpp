#include "platform/services/page_memory.h"

#include <algorithm>
#include <cstdint>
#include <sys/mman.h>
#include <unistd.h>

namespace Qx {

namespace {

/// The size of a big page on the machines of today; elsewhere it only costs address space.
constexpr size_t kBigPage = size_t{2} << 20;

std::byte* alignedUp(std::byte* address, size_t boundary) {
    const auto number = reinterpret_cast<uintptr_t>(address);
    return address + ((boundary - number % boundary) % boundary);
}

} // namespace

std::shared_ptr<PageMemory> PageMemory::make(size_t size) {
    if (size == 0 || size > SIZE_MAX - kBigPage) {
        return nullptr;
    }
    // Made first, so that nothing is mapped that nobody would unmap.
    std::shared_ptr<PageMemory> memory(new PageMemory);
    const size_t mappedSize = size + kBigPage;
    void* const mapped =
        ::mmap(nullptr, mappedSize, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    if (mapped == MAP_FAILED) {
        return nullptr;
    }
    memory->m_mapped = static_cast<std::byte*>(mapped);
    memory->m_mappedSize = mappedSize;
    memory->m_begin = alignedUp(memory->m_mapped, kBigPage);
    memory->m_size = size;
#ifdef MADV_HUGEPAGE
    // Whole big pages only: the rest of the last one would be memory that nobody uses.
    if (size >= kBigPage) {
        static_cast<void>(::madvise(memory->m_begin, size / kBigPage * kBigPage, MADV_HUGEPAGE));
    }
#endif
    return memory;
}

PageMemory::~PageMemory() {
    if (m_mapped != nullptr) {
        ::munmap(m_mapped, m_mappedSize);
    }
}

std::shared_ptr<const void> PageMemory::lend(std::span<const std::byte> part) {
    const Part lent{part.data(), part.data() + part.size()};
    {
        const std::lock_guard hold(m_mutex);
        m_lent.push_back(lent);
    }
    return {part.data(), [self = shared_from_this(), lent](const void*) { self->giveBack(lent); }};
}

void PageMemory::giveBack(Part part) {
    const std::lock_guard hold(m_mutex);
    m_lent.erase(std::find(m_lent.begin(), m_lent.end(), part));
    for (const Part& other : m_lent) {
        if (part.first < other.second && other.first < part.second) {
            return;
        }
    }
    discard(part.first, part.second);
}

void PageMemory::giveBackUnlent() {
    const std::lock_guard hold(m_mutex);
    if (m_lent.empty()) {
        return;
    }
    std::vector<Part> lent = m_lent;
    std::sort(lent.begin(), lent.end());
    const std::byte* from = m_begin;
    for (const Part& part : lent) {
        discard(from, part.first);
        from = std::max(from, part.second);
    }
    discard(from, m_begin + m_size);
}

void PageMemory::discard(const std::byte* first, const std::byte* last) {
    // The pages at either end may hold bytes of others.
    const auto page = static_cast<size_t>(::sysconf(_SC_PAGESIZE));
    std::byte* const begin = alignedUp(m_begin + (first - m_begin), page);
    const auto end = reinterpret_cast<uintptr_t>(last);
    const auto size = static_cast<std::ptrdiff_t>(end - end % page) -
                      static_cast<std::ptrdiff_t>(reinterpret_cast<uintptr_t>(begin));
    if (size > 0) {
        static_cast<void>(::madvise(begin, static_cast<size_t>(size), MADV_DONTNEED));
    }
}

} // namespace Qx
