#include "platform/store/pstream.h"

#include <algorithm>
#include <array>
#include <bit>
#include <cstring>
#include <limits>

namespace {

/// Fewer bytes are copied also where they last.
constexpr size_t kLeastReferred = size_t{64} << 10;

/// The little-endian bytes of a number, or the number of such bytes.
template <typename Number>
Number inFileOrder(Number value) {
    if constexpr (std::endian::native == std::endian::big) {
        auto bytes = std::bit_cast<std::array<std::byte, sizeof(Number)>>(value);
        std::reverse(bytes.begin(), bytes.end());
        return std::bit_cast<Number>(bytes);
    } else {
        return value;
    }
}

template <typename Number>
void put(PStream& stream, Number value) {
    const Number ordered = inFileOrder(value);
    stream.setRaw(&ordered, sizeof ordered);
}

template <typename Number>
Number take(PStream& stream) {
    Number value{};
    return stream.getRaw(&value, sizeof value) ? inFileOrder(value) : Number{};
}

} // namespace

void PStream::setUnsignedLong(uint32_t value) {
    put(*this, value);
}

void PStream::setLong(int32_t value) {
    put(*this, value);
}

void PStream::setUnsignedLongLong(uint64_t value) {
    put(*this, value);
}

void PStream::setCookedChar(uint8_t value) {
    put(*this, value);
}

void PStream::setUnsignedShort(uint16_t value) {
    put(*this, value);
}

void PStream::setFloat(float value) {
    put(*this, std::bit_cast<uint32_t>(value));
}

void PStream::setDouble(double value) {
    put(*this, std::bit_cast<uint64_t>(value));
}

void PStream::setString(std::string_view text) {
    if (text.size() > std::numeric_limits<uint32_t>::max()) {
        fail();
        return;
    }
    setUnsignedLong(static_cast<uint32_t>(text.size()));
    setRaw(text.data(), text.size());
}

void PStream::setRaw(const void* from, size_t size) {
    if (m_reading) {
        fail();
        return;
    }
    const auto* bytes = static_cast<const std::byte*>(from);
    if (size > 0) {
        m_output.insert(m_output.end(), bytes, bytes + size);
    }
}

void PStream::setLasting(const void* from, size_t size) {
    if (!m_gathers || m_reading || size < kLeastReferred) {
        setRaw(from, size);
        return;
    }
    m_referred.push_back({m_output.size(), {static_cast<const std::byte*>(from), size}});
    m_numReferred += size;
}

std::vector<std::span<const std::byte>> PStream::pieces(size_t from) const {
    std::vector<std::span<const std::byte>> found;
    size_t position = 0;
    const auto add = [&](std::span<const std::byte> piece) {
        const size_t skipped = std::min(piece.size(), from > position ? from - position : 0);
        position += piece.size();
        if (skipped < piece.size()) {
            found.push_back(piece.subspan(skipped));
        }
    };
    const std::span<const std::byte> own(m_output);
    size_t done = 0;
    for (const Referred& other : m_referred) {
        add(own.subspan(done, other.behind - done));
        add(other.bytes);
        done = other.behind;
    }
    add(own.subspan(done));
    return found;
}

void PStream::setAlignment(unsigned boundary) {
    const uint64_t next = m_place + size() + 1;
    const auto filling = static_cast<uint8_t>((boundary - next % boundary) % boundary);
    setCookedChar(filling);
    for (unsigned i = 0; i < filling; ++i) {
        setCookedChar(0);
    }
}

void PStream::reserve(size_t size) {
    const size_t needed = m_output.size() + size;
    if (needed > m_output.capacity()) {
        m_output.reserve(std::max(needed, m_output.capacity() * 2));
    }
}

void PStream::patchUnsignedLong(size_t at, uint32_t value) {
    // Where the four bytes lie among those that were copied.
    size_t before = 0;
    for (const Referred& other : m_referred) {
        const size_t start = other.behind + before;
        if (at < start && start - at >= sizeof value) {
            break;
        }
        if (at < start + other.bytes.size()) {
            fail();
            return;
        }
        before += other.bytes.size();
    }
    at -= before;
    if (m_output.size() < sizeof value || at > m_output.size() - sizeof value) {
        fail();
        return;
    }
    const uint32_t ordered = inFileOrder(value);
    std::memcpy(m_output.data() + at, &ordered, sizeof ordered);
}

uint32_t PStream::getUnsignedLong() {
    return take<uint32_t>(*this);
}

int32_t PStream::getLong() {
    return take<int32_t>(*this);
}

uint64_t PStream::getUnsignedLongLong() {
    return take<uint64_t>(*this);
}

uint8_t PStream::getCookedChar() {
    return take<uint8_t>(*this);
}

uint16_t PStream::getUnsignedShort() {
    return take<uint16_t>(*this);
}

float PStream::getFloat() {
    return std::bit_cast<float>(take<uint32_t>(*this));
}

double PStream::getDouble() {
    return std::bit_cast<double>(take<uint64_t>(*this));
}

String PStream::getString() {
    const std::span<const std::byte> bytes = getSpan(getUnsignedLong());
    String text;
    if (!bytes.empty()) {
        text.resize(bytes.size());
        std::memcpy(text.data(), bytes.data(), bytes.size());
    }
    return text;
}

bool PStream::getRaw(void* to, size_t size) {
    const std::span<const std::byte> bytes = getSpan(size);
    if (m_failed) {
        return false;
    }
    if (size > 0) {
        std::memcpy(to, bytes.data(), size);
    }
    return true;
}

std::span<const std::byte> PStream::getSpan(size_t size) {
    if (m_failed || size > remaining()) {
        fail();
        return {};
    }
    const std::span<const std::byte> bytes = m_input.subspan(m_position, size);
    m_position += size;
    return bytes;
}

void PStream::passAlignment() {
    const std::span<const std::byte> filling = getSpan(getCookedChar());
    if (std::any_of(filling.begin(), filling.end(), [](std::byte value) { return value != std::byte{0}; })) {
        fail();
    }
}

uint32_t PStream::getCount(size_t leastSize) {
    const uint32_t count = getUnsignedLong();
    if (m_failed || count > remaining() / std::max<size_t>(leastSize, 1)) {
        fail();
        return 0;
    }
    return count;
}
