#pragma once

#include "platform/media/label.h"
#include "platform/media/medium_roll.h"
#include "platform/media/pulldown.h"

/// The labels of one roll along an edit: which label stands at one edit time, and how its frames pass. From
/// it follows the label at every time, and the time of every label. A plain value of fixed size.
class QM_API edit_label {
public:
    /// Every channel of an edit.
    static constexpr uint32_t kAllChannels = 0xFFFFFFFF;

    /// No label: not valid.
    edit_label() = default;
    /// `first` stands at edit time `at` (seconds) and the edit passes `rate` frames a second. How the label's
    /// frames lie on the edit's is the usual pulldown between the rates; film counts 24 frames.
    edit_label(const MediumRollIdent& roll, const label& first, double at, Qx::FrameRate rate);
    /// Reads a keep string. Not valid when the text is none.
    explicit edit_label(const char* keepString);

    [[nodiscard]] bool is_valid() const;
    /// The text that keeps it in a header, with no line end:
    ///
    ///     TC29.97DF 8 1 0 29.97 01:00:00;00,LABEL_REV:1 ffffffff none
    ///
    /// scale ("TC", rate and "DF"; "KK", "FF" or "IN" and the gauge's number), medium, roll, edit time in
    /// seconds, the edit's rate, the label; then the mask of channels and the pulldown. What follows the
    /// comma may be missing: all channels and the usual pulldown. Empty when it is not valid.
    [[nodiscard]] String make_keep_string() const;

    [[nodiscard]] const MediumRollIdent& get_MediumRoll() const { return m_roll; }
    void set_MediumRoll(const MediumRollIdent& roll) { m_roll = roll; }
    [[nodiscard]] label::UserType user_type() const { return m_first.userType(); }
    /// The channels that it holds for: bit n is channel index n.
    [[nodiscard]] uint32_t channels() const { return m_channels; }
    void set_channels(uint32_t channels) { m_channels = channels; }
    [[nodiscard]] const Qx::Pulldown& pulldown() const { return m_pulldown; }
    void set_pulldown(const Qx::Pulldown& pulldown) { m_pulldown = pulldown; }
    [[nodiscard]] Qx::FrameRate rate() const { return m_rate; }
    [[nodiscard]] const label& first() const { return m_first; }
    [[nodiscard]] double at() const { return m_at; }

    /// The label of the frame that is seen at an edit time; no label when this is none or the time is not
    /// finite. A time within 1e-6 s before a frame is that frame's.
    [[nodiscard]] label labelAt(double editTime) const;
    /// The edit time at which a label's frame begins; empty when the two cannot be compared.
    [[nodiscard]] std::optional<double> timeOf(const label& wanted) const;

    /// Set when it is to be written into the header at the next save.
    [[nodiscard]] bool toBeSaved() const { return m_toBeSaved; }
    void setToBeSaved(bool save) { m_toBeSaved = save; }

private:
    [[nodiscard]] bool labelCountsFilm() const;

    MediumRollIdent m_roll = get_invalid_MediumRollIdent();
    label m_first;
    double m_at = 0;
    Qx::FrameRate m_rate;
    Qx::Pulldown m_pulldown;
    uint32_t m_channels = kAllChannels;
    bool m_toBeSaved = true;
};
