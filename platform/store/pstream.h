#pragma once

#include "platform/base/export.h"
#include "platform/base/qx_string.h"

#include <cstddef>
#include <cstdint>
#include <memory>
#include <span>
#include <vector>

/// A stream of packed values in memory. Writing appends to the stream's own buffer; reading walks a span that
/// the caller keeps alive. Numbers are little-endian, a `double` is its IEEE bits, a string is a 32-bit
/// length and that many bytes. These forms live in files: do not change them.
///
/// Every read is checked against what is left. A short or refused read sets the error state and yields zero
/// or an empty text; from then on every read does so and nothing more is consumed. The state is checked once,
/// at the end of an object, by whoever unpacks it. Writing sets the error state for a text longer than its
/// length can tell and on a stream made for reading; writing it to a file is then refused.
///
/// A stream is used by one thread at a time.
class QM_API PStream {
public:
    /// For writing.
    PStream() = default;
    /// For reading `bytes`, which must outlive the stream.
    explicit PStream(std::span<const std::byte> bytes) : m_input(bytes), m_reading(true) {}
    /// The same for bytes that whoever holds a copy of `keeper` may go on using after the stream. They never
    /// change.
    PStream(std::span<const std::byte> bytes, std::shared_ptr<const void> keeper)
        : m_input(bytes), m_keeper(std::move(keeper)), m_reading(true) {}

    /// \name Writing
    /// @{
    void setUnsignedLong(uint32_t value);
    void setLong(int32_t value);
    void setUnsignedLongLong(uint64_t value);
    void setCookedChar(uint8_t value);
    void setUnsignedShort(uint16_t value);
    void setFloat(float value);
    void setDouble(double value);
    void setString(std::string_view text);
    /// Bytes as they are, without a length.
    void setRaw(const void* from, size_t size);
    /// The same for bytes that stay where they are, unchanged, until the stream is cleared or gone: a stream
    /// that gathers refers to them, if they are many, instead of copying them.
    void setLasting(const void* from, size_t size);
    /// Makes an empty stream gather. What it holds is then read by `pieces`, not by `bytes`.
    void gather() { m_gathers = true; }
    /// Tells where the stream's first byte will lie; 0 at first. Only `setAlignment` asks for it.
    void setPlace(uint64_t place) { m_place = place; }
    /// Fills up to a place that is a multiple of `boundary` (2 to 128): a byte that tells how many zero bytes
    /// follow it, and those. Read by `passAlignment`.
    void setAlignment(unsigned boundary);
    /// Room for `size` more bytes is made ahead. The buffer at least doubles when it must grow, so that
    /// calls for small amounts stay cheap.
    void reserve(size_t size);
    /// Overwrites four bytes written before, for a length known only afterwards. The error state is set, and
    /// nothing written, when they do not lie within what was written.
    void patchUnsignedLong(size_t at, uint32_t value);
    [[nodiscard]] const std::vector<std::byte>& bytes() const { return m_output; }
    /// What was written from a position on, piece after piece; good until the next change.
    [[nodiscard]] std::vector<std::span<const std::byte>> pieces(size_t from = 0) const;
    [[nodiscard]] size_t size() const { return m_output.size() + m_numReferred; }
    /// Empties the buffer and keeps its memory.
    void clear() {
        m_output.clear();
        m_referred.clear();
        m_numReferred = 0;
    }
    /// @}

    /// \name Reading
    /// @{
    uint32_t getUnsignedLong();
    int32_t getLong();
    uint64_t getUnsignedLongLong();
    uint8_t getCookedChar();
    uint16_t getUnsignedShort();
    float getFloat();
    double getDouble();
    String getString();
    /// Copies `size` bytes out. False, with nothing copied and the error state set, when fewer are left.
    bool getRaw(void* to, size_t size);
    /// A view of the next `size` bytes, which are passed over; empty with the error state set if fewer are
    /// left.
    std::span<const std::byte> getSpan(size_t size);
    /// Passes over what `setAlignment` wrote; the error state is set if it is not that.
    void passAlignment();
    /// What keeps the stream's bytes, for who goes on using them where they lie; null if nothing does.
    [[nodiscard]] const std::shared_ptr<const void>& keeper() const { return m_keeper; }
    /// A count of items that each take at least `leastSize` bytes: a count that what is left cannot hold
    /// sets the error state and gives 0, before anybody reserves memory for it.
    uint32_t getCount(size_t leastSize);
    [[nodiscard]] size_t remaining() const { return m_input.size() - m_position; }
    [[nodiscard]] bool good() const { return !m_failed; }
    /// Sets the error state, for a value that makes no sense.
    void fail() { m_failed = true; }
    /// @}

private:
    /// Bytes that lie elsewhere, and how many of those in `m_output` come before them.
    struct Referred {
        size_t behind;
        std::span<const std::byte> bytes;
    };

    std::vector<std::byte> m_output;
    std::vector<Referred> m_referred;
    size_t m_numReferred = 0; ///< bytes
    bool m_gathers = false;
    std::span<const std::byte> m_input;
    std::shared_ptr<const void> m_keeper;
    uint64_t m_place = 0;
    size_t m_position = 0;
    bool m_reading = false;
    bool m_failed = false;
};
