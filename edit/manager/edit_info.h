#pragma once

#include "edit/manager/edit_manager.h"

/// Answers questions about an edit cheaply: from the edit where it is open, else from its row in the
/// project's records, and opens the edit only where those cannot answer. The row is that of the edit's file;
/// while that is away, of the undo backup that opening would bring back. What the row answers moves no file.
/// Once opened it stays open as long as this object, or a copy, has it. Nothing here fails: what cannot be
/// known is an empty text, 0, false or `Qx::kNoTime`. One object is used on one thread at a time.
class QM_API EditInfo {
public:
    EditInfo(EditPtr& edit);
    /// Opened at once if it is in memory, else when a question needs it, with the behaviour.
    EditInfo(const cookie& item, eEditOpenBehaviour behaviour);

    /// The edit, opened if it was not; null when it cannot be.
    [[nodiscard]] EditPtr& ed() const;
    /// The text of a column of the item's row (`projdb::columnName`, without regard to case); empty without
    /// records, such a column or a row. In wide text the second.
    [[nodiscard]] String getAttrib(const char* column) const;
    [[nodiscard]] WString getAttribW(const char* column) const;

    /// \name Questions that open the edit
    /// @{
    /// Video (effects among them) and audio channels.
    [[nodiscard]] int m_get_num_chans() const;
    /// How many events a channel's cel has; -1, without opening, for a number below -1.
    [[nodiscard]] int m_get_event_count(int chan) const;
    /// The channel's `Edit_Chan_Type`.
    [[nodiscard]] int m_get_channel_type(int chan) const;
    [[nodiscard]] int m_get_real_channel(int chan) const { return chan; }
    /// @}

    /// More than one audio channel; more than one effects channel.
    [[nodiscard]] bool hasAudioTracks() const;
    [[nodiscard]] bool hasFxTracks() const;
    [[nodiscard]] bool isHidden() const;
    /// Has channels, none of them video, and is not of log type 2. From the records in every case, but for
    /// the log type.
    [[nodiscard]] bool isSoundOnlyShot() const;
    /// The "Flags" of the row (`EditRecordFlags`), in every case; 0 without any.
    [[nodiscard]] int getFlags() const;
    /// Opens the edit where there is no row; `kLogNone`, without opening it, where its file does not read.
    [[nodiscard]] edit_log_type_t getLogType() const;
    /// Seconds. Without an open edit they are rounded to frames of the project.
    [[nodiscard]] double getStartTime() const;
    [[nodiscard]] double getEndTime() const;
    [[nodiscard]] double getDuration() const;

private:
    void openIfPresent();
    [[nodiscard]] bool hasLetter(char letter) const;

    mutable EditPtr m_edit;
    cookie m_item;
    eEditOpenBehaviour m_behaviour = eOpenExisting;
};
