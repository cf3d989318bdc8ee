#pragma once

#include "platform/base/export.h"

#include <array>
#include <cstdint>
#include <memory>

/// The channels that a mask can hold: the video channel (bit 0) and audio channels 1 to 16.
inline constexpr unsigned CM_max_chan_mask = 0x1FFFF;

/// True for the number of a channel that a mask can hold, 0 to 16.
[[nodiscard]] constexpr bool ok_chan(int chan) {
    return chan >= 0 && chan < 17;
}

/// A set of one video channel and up to sixteen audio channels, with a short text form such as "VA1A2A10".
/// A value; the text form is made on request in a buffer of the mask's own. Not thread-safe, asking for the
/// text included.
class QM_API channel_mask {
public:
    channel_mask() = default;
    /// Keeps bits 0 to 16.
    channel_mask(unsigned bits) : m_bits(bits & CM_max_chan_mask) {}
    channel_mask(int bits) : channel_mask(static_cast<unsigned>(bits)) {}
    /// See `set`.
    channel_mask(const char* text);
    channel_mask(const channel_mask& other) : m_bits(other.m_bits) {}
    ~channel_mask() = default;
    channel_mask& operator=(const channel_mask& other);
    channel_mask& operator=(unsigned bits);

    channel_mask& operator|=(const channel_mask& other);
    channel_mask& operator&=(const channel_mask& other);
    /// The number is cut to bits 0 to 16 first.
    channel_mask& operator|=(unsigned bits);
    channel_mask& operator&=(unsigned bits);
    bool operator==(const channel_mask& other) const { return m_bits == other.m_bits; }
    bool operator==(unsigned bits) const { return m_bits == bits; }
    bool operator==(int bits) const { return m_bits == static_cast<unsigned>(bits); }

    operator unsigned int() const { return m_bits; }
    /// "V" for bit 0, then "A" and the number of each audio channel, in order; "" for the empty mask. The
    /// text belongs to the mask and lasts until the next request.
    operator const char*() const;

    /// False for a number that is no channel.
    [[nodiscard]] bool get(int chan) const { return ok_chan(chan) && (m_bits & chan_to_bit(chan)) != 0; }
    bool operator[](int chan) const { return get(chan); }
    /// Does nothing for a number that is no channel.
    void set(int chan, bool on);
    /// Reads the text form: without regard to case, "V" sets bit 0 and "A" the audio channel whose number
    /// follows, if that is 1 to 16; everything else is passed over. A null text gives the empty mask.
    void set(const char* text);

    /// 1 shifted left by `chan` mod 32, whether it is a channel or not.
    [[nodiscard]] static constexpr unsigned chan_to_bit(int chan) {
        return 1u << (static_cast<unsigned>(chan) % 32u);
    }
    /// Number of channels in the mask.
    [[nodiscard]] int count_bits() const;
    [[nodiscard]] int num_set() const { return count_bits(); }
    [[nodiscard]] int num_audio_set() const { return count_bits() - (has_video() ? 1 : 0); }
    [[nodiscard]] bool has_video() const { return (m_bits & 1u) != 0; }
    [[nodiscard]] bool has_audio() const { return (m_bits & CM_max_chan_mask) >= 2; }
    /// From 16 down to 0; -1 if none is set.
    [[nodiscard]] int highest_channel_set() const;
    /// From 0 up to 15 only: -1 if none of those is set, be 16 set or not.
    [[nodiscard]] int lowest_channel_set() const;
    /// Toggles bits 0 to 16.
    void invert() { m_bits ^= CM_max_chan_mask; }

private:
    using Text = std::array<char, 64>;

    unsigned m_bits = 0;
    mutable std::unique_ptr<Text> m_text;
};
