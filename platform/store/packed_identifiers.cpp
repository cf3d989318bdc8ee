#include "platform/base/cookie.h"
#include "platform/base/id_stamp.h"
#include "platform/store/pstream.h"

// The packed forms of the identifiers live in files: do not change them.

void IdStamp::pack(PStream& stream) const {
    for (const uint32_t word : m_words) {
        stream.setUnsignedLong(word);
    }
}

void IdStamp::unpack(PStream& stream, unsigned) {
    std::array<uint32_t, 3> words{};
    for (uint32_t& word : words) {
        word = stream.getUnsignedLong();
    }
    m_words = stream.good() ? words : std::array<uint32_t, 3>{};
}

void cookie::pack(PStream& stream) const {
    for (const uint32_t word : m_words) {
        stream.setUnsignedLong(word);
    }
}

void cookie::unpack(PStream& stream) {
    const uint32_t first = stream.getUnsignedLong();
    const uint32_t second = stream.getUnsignedLong();
    const uint32_t third = stream.getUnsignedLong();
    *this = stream.good() ? fromWords(first, second, third) : cookie();
}
