#pragma once

#define XXH_INLINE_ALL
#include <xxhash.h>

#include <cstddef>
#include <cstdint>
#include <span>

namespace Qx::detail {

/// The checksum of everything in an object store: XXH3, 64 bits, seed 0.
inline uint64_t checksum(std::span<const std::byte> bytes) {
    return XXH3_64bits(bytes.data(), bytes.size());
}

/// The same over bytes that come in pieces.
class RunningChecksum {
public:
    RunningChecksum() { XXH3_64bits_reset(&m_state); }
    void add(std::span<const std::byte> bytes) { XXH3_64bits_update(&m_state, bytes.data(), bytes.size()); }
    [[nodiscard]] uint64_t value() const { return XXH3_64bits_digest(&m_state); }

private:
    XXH3_state_t m_state;
};

} // namespace Qx::detail
