#pragma once

#include <cstdint>

/// Kind of a channel, as a bit so that a set of kinds can be given as a mask. The numbers live in files and
/// in notification texts: do not change them.
enum Edit_Chan_Type : uint32_t {
    VideoChan = 1,   ///< "V": video, and effects by subtype
    AudioChan = 2,   ///< "A"
    TChan = 4,       ///< "T": converted only, an edit holds none
    ControlChan = 8, ///< "C", "M", "G": an edit holds none
    AnyChan = 127,   ///< filter: every type
    NoChan = 128     ///< "X": the answer for what names no typed channel
};

[[nodiscard]] constexpr Edit_Chan_Type operator|(Edit_Chan_Type a, Edit_Chan_Type b) {
    return static_cast<Edit_Chan_Type>(uint32_t{a} | uint32_t{b});
}

/// Subtype of a channel, as a bit. The numbers and names live in files: do not change them.
enum class Edit_Chan_SubType : uint32_t {
    NONE = 0,
    MIXER_CTL_TRACK = 1,
    GPI_CTL_TRACK = 2,
    FX = 4,
    ALIAS = 8, ///< effects channels (`VFXCel`)
    ANY = 15,  ///< filter: every subtype
    INVALID = 16
};

[[nodiscard]] constexpr Edit_Chan_SubType operator|(Edit_Chan_SubType a, Edit_Chan_SubType b) {
    return static_cast<Edit_Chan_SubType>(static_cast<uint32_t>(a) | static_cast<uint32_t>(b));
}

/// The letter that stands for a channel type in texts.
enum class Edit_Chan_Letter : char { V = 'V', A = 'A', T = 'T', C = 'C', M = 'M', G = 'G', X = 'X' };

/// "No channel": what every search for a channel index answers when it fails.
inline constexpr int32_t NO_CHAN = 0x8000;
/// Start value of a loop over channels.
inline constexpr int32_t kBeforeFirstChan = -1;

/// The greatest numbers of channels that an edit holds.
inline constexpr unsigned kMaxAudioChans = 32;
inline constexpr unsigned kMaxVideoChans = 24;
