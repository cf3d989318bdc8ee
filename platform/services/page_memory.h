#pragma once

#include "platform/base/export.h"

#include <cstddef>
#include <memory>
#include <mutex>
#include <span>
#include <utility>
#include <vector>

namespace Qx {

/// A large block of memory straight from the system, for bytes that are read once and then used where they
/// lie. Big pages are asked for, which makes touching fresh memory several times cheaper. Parts of it are
/// lent: a part's pages go back to the system when its loan ends, whatever becomes of the rest, so that a
/// small part that is used for long does not hold the whole.
///
/// The block lives as long as the pointer to it and every loan. Safe on any thread, but for the bytes
/// themselves.
class QM_API PageMemory : public std::enable_shared_from_this<PageMemory> {
public:
    /// Below this the heap serves as well, bytes.
    static constexpr size_t kLeastSize = size_t{2} << 20;

    /// A block of `size` bytes, zero; null when the system has none.
    static std::shared_ptr<PageMemory> make(size_t size);
    ~PageMemory();
    PageMemory(const PageMemory&) = delete;
    PageMemory& operator=(const PageMemory&) = delete;

    [[nodiscard]] std::span<std::byte> bytes() const { return {m_begin, m_size}; }
    /// Lends a part of the block, which keeps its bytes as long as the loan is held. When that ends, what no
    /// other loan covers is lost: it reads as zero.
    [[nodiscard]] std::shared_ptr<const void> lend(std::span<const std::byte> part);
    /// Gives back the pages that no loan covers; their bytes are lost. Does nothing when nothing is lent: then the
    /// whole goes with its pointer.
    void giveBackUnlent();

private:
    using Part = std::pair<const std::byte*, const std::byte*>;

    PageMemory() = default;
    void giveBack(Part part);
    /// Gives the whole pages between two places back to the system.
    void discard(const std::byte* first, const std::byte* last);

    std::byte* m_begin = nullptr;
    size_t m_size = 0;
    std::byte* m_mapped = nullptr; ///< what was asked of the system, `m_begin` at a big page's start in it
    size_t m_mappedSize = 0;
    std::mutex m_mutex;
    std::vector<Part> m_lent; ///< guarded by `m_mutex`
};

} // namespace Qx
