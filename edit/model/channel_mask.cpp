#include "edit/model/channel_mask.h"

#include <bit>
#include <charconv>

namespace {

constexpr int kLastChan = 16;

bool isBlank(char c) {
    return c == ' ' || (c >= '\t' && c <= '\r');
}

/// The decimal number that a text begins with, after blanks and a sign, as `atoi` reads it; -1 for one that
/// is no audio channel.
int leadingNumber(const char* text) {
    while (isBlank(*text)) {
        ++text;
    }
    if (*text == '+') {
        ++text;
    }
    int number = 0;
    for (; *text >= '0' && *text <= '9'; ++text) {
        number = number * 10 + (*text - '0');
        if (number > kLastChan) {
            return -1;
        }
    }
    return number > 0 ? number : -1;
}

} // namespace

channel_mask::channel_mask(const char* text) {
    set(text);
}

channel_mask& channel_mask::operator=(const channel_mask& other) {
    m_bits = other.m_bits;
    return *this;
}

channel_mask& channel_mask::operator=(unsigned bits) {
    m_bits = bits & CM_max_chan_mask;
    return *this;
}

channel_mask& channel_mask::operator|=(const channel_mask& other) {
    m_bits |= other.m_bits;
    return *this;
}

channel_mask& channel_mask::operator&=(const channel_mask& other) {
    m_bits &= other.m_bits;
    return *this;
}

channel_mask& channel_mask::operator|=(unsigned bits) {
    m_bits |= bits & CM_max_chan_mask;
    return *this;
}

channel_mask& channel_mask::operator&=(unsigned bits) {
    m_bits &= bits & CM_max_chan_mask;
    return *this;
}

channel_mask::operator const char*() const {
    if (m_text == nullptr) {
        m_text = std::make_unique<Text>();
    }
    char* at = m_text->data();
    char* const end = at + m_text->size() - 1;
    for (int chan = 0; chan <= kLastChan; ++chan) {
        if (!get(chan)) {
            continue;
        }
        *at++ = chan == 0 ? 'V' : 'A';
        if (chan > 0) {
            at = std::to_chars(at, end, chan).ptr;
        }
    }
    *at = '\0';
    return m_text->data();
}

void channel_mask::set(int chan, bool on) {
    if (ok_chan(chan)) {
        m_bits = on ? m_bits | chan_to_bit(chan) : m_bits & ~chan_to_bit(chan);
    }
}

void channel_mask::set(const char* text) {
    m_bits = 0;
    for (; text != nullptr && *text != '\0'; ++text) {
        if (*text == 'V' || *text == 'v') {
            m_bits |= 1u;
        } else if (*text == 'A' || *text == 'a') {
            set(leadingNumber(text + 1), true);
        }
    }
}

int channel_mask::count_bits() const {
    return std::popcount(m_bits & CM_max_chan_mask);
}

int channel_mask::highest_channel_set() const {
    return static_cast<int>(std::bit_width(m_bits & CM_max_chan_mask)) - 1;
}

int channel_mask::lowest_channel_set() const {
    const unsigned searched = m_bits & 0xFFFFu;
    return searched != 0 ? std::countr_zero(searched) : -1;
}
