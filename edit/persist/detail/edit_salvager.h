#pragma once

#include "edit/persist/detail/stored_channels.h"

#include <map>

/// Collects, a line each, what of a damaged file is lost. It reads the edit's header and store and changes
/// nothing of them.
class EditFile::Salvager {
public:
    Salvager(std::vector<String>& lost, bool mayScan) : m_lost(lost), m_mayScan(mayScan) {}

    /// True if a file without a whole table is searched for objects.
    [[nodiscard]] bool mayScan() const { return m_mayScan; }
    /// The file could not be read here, or is of a later version.
    [[nodiscard]] bool isRefused() const { return m_isRefused; }
    void setRefused(bool refused) { m_isRefused = refused; }
    /// The objects of the table that are not sound: told of when the part that they belong to is read.
    void setUnsound(const std::vector<StoredObjectInfo>& objects);
    /// The store and header are those of this edit. Called when the header was read or is known to be lost.
    void begin(Edit& edit, bool headerLost);
    void lose(String what) { m_lost.push_back(std::move(what)); }
    /// Tells of an object if it is unsound.
    bool loseIfUnsound(const String& object, const String& part);

    /// The greatest number of a cel that the file has, or had; -1 for none.
    [[nodiscard]] int lastCel() const;
    void celMissing(int number);
    void celFailed(int number, const String& why);
    void celRead(const LoadedCel& loaded);
    void levelsMissing(int number, bool hasAudio);
    void levelsFailed(int number, const String& why);
    /// Without its header nothing tells the kind of a channel that has a name of its own: it is taken for one
    /// that fits the order of the channels, and that is told. False where the header is there, the name is
    /// one by place ("A2"), or the cel does not read.
    bool guessKind(LoadedCel& loaded);
    /// Tells of the unsound objects that no part told of.
    void finish();

private:
    /// More objects of this name than a file can hold channels are not looked for.
    static constexpr int kMostCels = 1000;

    [[nodiscard]] char kindOf(int number) const;
    [[nodiscard]] int audioIndex(int number) const;
    [[nodiscard]] String channelName(int number) const;
    [[nodiscard]] String levelsName(int number) const;

    std::vector<String>& m_lost;
    bool m_mayScan;
    bool m_isRefused = false;
    Edit* m_edit = nullptr;
    bool m_headerLost = false;
    bool m_audioSeen = false;
    bool m_celsLost = false;
    std::map<String, String> m_unsound; ///< why, by the object's name
};
