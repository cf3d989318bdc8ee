#pragma once

#include "edit/model/cel.h"
#include "edit/model/cue_list.h"
#include "edit/model/edit.h"
#include "edit/model/edit_keys.h"
#include "platform/store/text_file.h"

/// What reading and writing do inside an edit. The steps are called in the order in which they are declared;
/// a step that fails says why in one sentence.
class EditFile {
public:
    /// What a salvage does with the parts that fail (edit_salvager.h).
    class Salvager;

    /// While it lives, changes of the header and of channels do not dirty the edit: for changes that a load
    /// or a save itself makes.
    class Quiet {
    public:
        explicit Quiet(Edit& edit) : m_edit(edit), m_before(edit.m_initialising) {
            edit.m_initialising = true;
        }
        ~Quiet() { m_edit.m_initialising = m_before; }
        Quiet(const Quiet&) = delete;
        Quiet& operator=(const Quiet&) = delete;

    private:
        Edit& m_edit;
        bool m_before;
    };

    /// A flag of the edit that is set while this lives.
    class Raised {
    public:
        explicit Raised(bool& flag) : m_flag(flag) { flag = true; }
        ~Raised() { m_flag = false; }
        Raised(const Raised&) = delete;
        Raised& operator=(const Raised&) = delete;

    private:
        bool& m_flag;
    };

    /// Ends the lending of cels and header to the store, on whatever way they are left.
    class CelLoan {
    public:
        explicit CelLoan(Edit& edit) : m_edit(edit) {}
        ~CelLoan() { m_edit.extractCelsFromStore(m_isWritten); }
        void setWritten() { m_isWritten = true; }
        CelLoan(const CelLoan&) = delete;
        CelLoan& operator=(const CelLoan&) = delete;

    private:
        Edit& m_edit;
        bool m_isWritten = false;
    };

    /// Records why a read or write failed; always false.
    static bool fail(Edit& edit, Qx::Status why);
    /// No channels, no cues, the header of a new edit; the cookie and the store stay.
    static void reset(Edit& edit);
    /// The clean state after a load or a save: nothing is marked as changed.
    static void markWritten(Edit& edit);
    /// The state after a save that failed: the edit is dirty, and whoever writes dirty edits knows of it.
    static void markUnwritten(Edit& edit);
    /// The number that legacy headers give a channel: 0 the video channel, 1 the first audio channel and so
    /// on.
    [[nodiscard]] static int oldIndex(const Edit& edit, const IdStamp& audio);

    /// \name Reading from the open store
    /// An object that does not read, or is none of what its name stands for, costs what it holds and nothing
    /// else: with `salvaging` that is told there, without it on the log, and the object's bytes stay in the
    /// store (`setAside`).
    /// @{
    static Qx::Status readHeader(Edit& edit);
    static void readCues(Edit& edit);
    /// Fails for an edit without channels or with too many.
    static Qx::Status readCels(Edit& edit, Salvager* salvager = nullptr);
    static void readGroups(Edit& edit, Salvager* salvager = nullptr);
    /// Gives an object that does not read a name that no part of an edit has, and tells why on the log.
    static void setAside(Edit& edit, const String& object, const String& why);
    /// @}

    /// \name Numbers of channels
    /// Header keys and cues name channels by their place in the edit, and mean by that the channels of their
    /// file.
    /// @{
    /// A channel of a file, in the order of the file's numbers.
    struct FileChannel {
        IdStamp id; ///< null for a channel that the edit does not have
        bool isAudio = false;
    };
    /// Gives the header keys and the cues of a file the numbers that its channels have in the edit. A key of
    /// a channel that the edit does not have goes; a cue of one stays where it is, on any channel.
    static void renumber(Edit& edit, const std::vector<FileChannel>& file);
    /// Gives cues of the edit the numbers that its channels have in a file of the channels `order`.
    static void renumberFor(const Edit& edit, const Vector<IdStamp>& order, cue_list& cues);
    /// @}

    /// Reads all that is sound of a file into an edit without a file. Fails when that makes no edit.
    static Qx::Status salvage(Edit& edit, const String& path, Salvager& salvager);
    /// Takes stamps of channels that could not be read out of the groups of an edit that was salvaged.
    static void leaveLostChannelsOut(Edit& edit);
    /// Brings an edit that was salvaged up to date; what fails is told in `lost`.
    static void convert(Edit& edit, std::vector<String>& lost);

    /// \name Writing
    /// @{
    /// A failure for an edit whose file could not be read again.
    static Qx::Status checkStorable(const Edit& edit);
    /// The channels of the edit's object store: all but levels channels without an audio channel.
    [[nodiscard]] static Vector<IdStamp> storedChannels(const Edit& edit);
    /// Directs the store to a path, opening it when it is not open; objects bound to it stay.
    static Qx::Status openStore(Edit& edit, const String& path);
    /// What the header says of channels, times and flags, for a file that has the channels `order`.
    static void updateHeader(const Edit& edit, configb& header, const Vector<IdStamp>& order);
    static void lendCels(Edit& edit);
    /// @}

    /// \name Legacy text
    /// @{
    /// The first video channel and the audio channels: what a legacy text holds. Empty without video.
    [[nodiscard]] static Vector<IdStamp> legacyChannels(const Edit& edit);
    static Qx::Status readLegacy(Edit& edit, const String& path);
    /// Adds the channels of a text; `sections` tells which channel each of its sections became.
    static Qx::Status readLegacyChannels(Edit& edit, const TextFile& file,
                                         std::vector<FileChannel>& sections);
    /// @}

    struct LoadedCel;
    struct LoadedLevels;

private:
    static Qx::Status addLegacyChannel(Edit& edit, Edit_Chan_Type type, const std::vector<String>& fields,
                                       std::unique_ptr<cel> content, IdStamp& added);
    static std::vector<LoadedCel> loadCels(Edit& edit, Salvager* salvager);
    static std::vector<LoadedLevels> loadLevels(Edit& edit, const std::vector<LoadedCel>& cels,
                                                Salvager* salvager);
    static Qx::Status setupChannels(Edit& edit, std::vector<LoadedCel>& cels, std::vector<FileChannel>& file);
    static void setLevelsAside(Edit& edit, const std::vector<LoadedLevels>& levels);
    static void setupLevels(Edit& edit, std::vector<LoadedLevels>& levels, std::vector<FileChannel>& file);
};
