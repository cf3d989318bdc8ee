#pragma once

#include "platform/base/export.h"
#include "platform/base/status.h"
#include "platform/media/film_gauge.h"
#include "platform/media/frame_rate.h"

#include <array>
#include <optional>

/// The kinds of label by which a frame of film or tape is found again. The numbers live in edit files: do not
/// change them.
enum UserLabelType : int32_t {
    kNoLabelType = 0,
    kAnyLabelType = 1,  ///< a label of any kind
    kTextLabelType = 2, ///< a reel's name or another text
    kTimecodeLabelType = 3,
    kKeyKodeLabelType = 4,
    kFootFrameLabelType = 5,
    kInkCodeLabelType = 6
};

/// One label: a number that names one frame, of a timecode, a key number (SMPTE 254), feet and frames, or an
/// ink number. A plain value of fixed size: making, copying and counting allocate nothing.
///
/// A label counts in whole frames along its series, never in seconds. Timecode goes round at 24 hours. The
/// others keep the exact count beyond what their digits show ("9999" is followed by "0000"); such a label is
/// ambiguous and says so.
class QM_API label {
public:
    /// A kind of label as one asks for it: two match when they are equal or either is any kind.
    class UserType {
    public:
        constexpr UserType(UserLabelType type = kAnyLabelType) : m_type(type) {}
        [[nodiscard]] constexpr UserLabelType type() const { return m_type; }
        [[nodiscard]] constexpr bool matches(UserType other) const {
            return m_type == other.m_type || m_type == kAnyLabelType || other.m_type == kAnyLabelType;
        }
        constexpr bool operator==(const UserType&) const = default;

    private:
        UserLabelType m_type;
    };

    /// How a label counts: timecode by rate and drop frame (SMPTE ST 12-1; drop frame exists at 29.97 and
    /// 59.94 only), the others by the film's gauge.
    struct Scale {
        UserLabelType type = kNoLabelType;
        Qx::FrameRate rate;
        bool dropFrame = false;
        FilmGauge gauge = FilmGauge::None;

        [[nodiscard]] static Scale timecode(Qx::FrameRate rate, bool dropFrame = false) {
            return {kTimecodeLabelType, rate, dropFrame && rate.hasDropFrame(), FilmGauge::None};
        }
        [[nodiscard]] static Scale film(UserLabelType type, FilmGauge gauge) {
            return {type, {}, false, gauge};
        }
        /// True if labels can be counted on it.
        [[nodiscard]] bool valid() const;
        bool operator==(const Scale&) const = default;
    };

    /// How a key number is written: "KJ 12 3456 7890+12" or "KJ123456 7890+12". Other labels have one form.
    enum Style { Spaced, Compact };

    /// No label: not valid, of empty text.
    label() = default;
    /// A timecode, or feet and frames, by its frames from 00:00:00:00 or 0+00. Not valid on another scale.
    label(const Scale& scale, int64_t frames);

    /// Reads a label as the field writes it. Blanks at the ends do not count; letters may be lower case.
    ///
    ///     timecode        01:00:00:00   01:00:00;00   (';' , ',' only where the scale drops frames)
    ///     key number      KJ 12 3456 7890+12   KJ123456 7890+12   KX654321-0070+00   KU 22 9611 1802+02.3
    ///                     KQ123456 1234+00(1)  the foot's place in the turn of three of 35 mm 3-perf
    ///     feet + frames   123+04   -1+04
    ///     ink number      AA 1234+05   012 3456+07   ABC12345+06   1234+05
    ///
    /// A failure leaves `read` and names what is wrong and at which character (from 1), for example a frame
    /// that the foot does not have, or a timecode that drop frame leaves out.
    [[nodiscard]] static Qx::Status parse(std::string_view text, const Scale& scale, label& read);

    [[nodiscard]] bool valid() const { return m_scale.type != kNoLabelType; }
    [[nodiscard]] const Scale& scale() const { return m_scale; }
    [[nodiscard]] UserType userType() const { return m_scale.type; }
    /// The label's text, by the forms that `parse` reads; empty for no label. Up to 15 characters allocate
    /// nothing.
    [[nodiscard]] String asString(Style style = Spaced) const;
    /// Frames from the start of the label's series: midnight, count 0000 of a key number's prefix, 0+00.
    [[nodiscard]] int64_t frames() const { return m_frames; }
    /// The prefix of a key number (two letters and six digits) or an ink number; empty for others.
    [[nodiscard]] std::string_view prefix() const { return {m_prefix.data(), m_prefixLength}; }
    /// Perforations from the start of the frame, which a key number may carry.
    [[nodiscard]] int perforations() const { return m_perforations; }
    /// True if the count went past what its digits can show, so that the text names an earlier or another
    /// frame too: some makers then raise the prefix.
    [[nodiscard]] bool isAmbiguous() const;

    /// The label so many frames later (or, negative, earlier). No label stays none; the count stops at
    /// +-2^53.
    [[nodiscard]] label plus(int64_t frames) const;
    /// Frames from `other` to this label; for timecode the shorter way round the day. Empty where the two
    /// cannot be compared: other scales, or other prefixes.
    [[nodiscard]] std::optional<int64_t> minus(const label& other) const;

    bool operator==(const label&) const = default;

private:
    struct Reader;

    [[nodiscard]] Qx::FilmCount count() const;
    [[nodiscard]] int64_t countLimit() const;
    void wrapDay();
    void appendCount(String& text) const;

    Scale m_scale;
    int64_t m_frames = 0;
    std::array<char, 8> m_prefix{};
    uint8_t m_prefixLength = 0;
    uint8_t m_digits = 0; ///< of an ink number's feet, 4 or 5
    uint8_t m_perforations = 0;
    uint8_t m_pattern = 0; ///< the place of count 0 in the turn of three
    bool m_showsPerforations = false;
    bool m_showsPlace = false;
    bool m_spaced = false; ///< an ink number's prefix stands apart
};

/// The name of a kind of label for a person: "Timecode", "KeyKode", "Foot/frame", "Inkcode"; empty for the
/// others.
QM_API const char* UserLabelType_to_UserString(UserLabelType type);
