#pragma once

#include "platform/base/cookie.h"
#include "platform/base/export.h"
#include "platform/base/status.h"
#include "platform/database/record_table.h"

#include <array>
#include <functional>

/// The records of a project: one row an edit, which answers questions about the edit without opening it, and
/// named values of the project. It is a cache in the file "Project.db" of the project's folder: everything in
/// it can be made again from the edits' files, and deleting the file loses nothing. What the rows say is made
/// by the edit manager; this class knows their columns only.
///
/// Several processes may have the file open. All operations are safe on any thread.
class QM_API projdb {
public:
    /// The columns, in the order of the table. The table is made anew when they change.
    enum Column : int {
        Type,      ///< "Type": the kind of item ("edit", "shot", "ghost", "reel", "magic", "FXT")
        Flags,     ///< "Flags": an integer: 8 hidden, 128, 512, 1024 and 2048 kinds of ghost
        Chans,     ///< "chans": the channels by kind and number, see `edit_record.h`
        StartTime, ///< "start time" and "end time": timecode at the project's rate, on beyond 24 hours; may
                   ///< be empty
        EndTime,
        Name,     ///< "name": UTF-8
        Rate,     ///< "rate": frames a second, as `Qx::FrameRate::asString`
        Duration, ///< "duration": seconds, as `Qx::doubleToText`
        NumChans, ///< "channels": how many channels of all kinds
        Created,  ///< "created" and "modified": seconds since 1970
        Modified,
        Owner,    ///< "owner": UTF-8
        FileSize, ///< "file size" and "file time" (nanoseconds since 1970): the file that the row was made
                  ///< from; empty while the row tells what no file says yet
        FileTime,
        Damage, ///< "damage": why the file cannot be read; then the other columns but the file's are empty
        /// The log of the item, under the field names of the log attributes ("scene", "snd reel", ...).
        Date, ///< when it was made: ISO 8601, UTC
        Scene,
        Shot,
        Who,
        Description,
        Notes,
        Cookie,
        Reel,
        SoundStart,
        SoundReel,
        AudioQuality,
        CompressionFormat,
        FrameOrigin,
        Pulldown,
        Sequence,
        Start24PCode,
        End24PCode,
        Reel24P,
        StartKeycode,
        EndKeycode,
        StartCamcode,
        EndCamcode,
        CamReel,
        CamDate,
        LabReel,
        CompReel,
        StartInkcode,
        EndInkcode,
        SourceFormat,
        ReelType,
        FilmDuration,
        kNumColumns
    };

    /// One row. A plain value; fields are texts, empty where there is nothing to say.
    class Record {
    public:
        [[nodiscard]] String& operator[](Column column) { return m_fields[static_cast<size_t>(column)]; }
        [[nodiscard]] const String& operator[](Column column) const {
            return m_fields[static_cast<size_t>(column)];
        }
        bool operator==(const Record&) const = default;

    private:
        std::array<String, kNumColumns> m_fields;
    };

    static constexpr const char* kFileName = "Project.db";

    /// With another kind of table than the platform's own, which is closed.
    explicit projdb(std::unique_ptr<RecordTable> table = RecordTable::make());

    /// Opens the records of the project in a folder, or makes them. Those of an earlier version, which had
    /// fewer columns, are emptied. A file that is damaged, or of a later version, is set aside as "Project.db.DAMAGED", over an earlier one, and an empty one made: `isNew` is
    /// then true. Fails, with nothing open, when the file system refuses; the text says why.
    Qx::Status open(const String& folder);
    void close();
    [[nodiscard]] bool isOpen() const { return m_table->isOpen(); }
    /// True if the records were made empty when they were opened, so that they say nothing yet.
    [[nodiscard]] bool isNew() const { return m_isNew; }

    /// A column's name, as the file has it, and the column of a name without regard to case; -1 if none.
    [[nodiscard]] static const char* columnName(Column column);
    [[nodiscard]] int columnIndex(std::string_view name) const { return m_table->columnIndex(name); }

    /// False, leaving `record`, if there is none.
    [[nodiscard]] bool find(const cookie& item, Record& record) const;
    /// The text of one column. False, leaving `text`, without such a record or column.
    [[nodiscard]] bool getField(const cookie& item, int column, String& text) const;
    /// Fails for a cookie that no file can be named after.
    Qx::Status put(const cookie& item, const Record& record);
    /// Removing what is not there is a success.
    Qx::Status remove(const cookie& item);
    /// Removes every record; the named values stay.
    Qx::Status removeAll();
    [[nodiscard]] size_t numRecords() const { return m_table->numRecords(); }
    /// Every record, by cookies, until the callback answers false. It must not use the records.
    void forEach(const std::function<bool(const cookie& item, const Record& record)>& callback) const;

    /// The records whose fields match every condition, by cookies, until the callback answers false. Those of
    /// files that cannot be read match nothing. The callback must not use the records. A failure names what
    /// the table refused.
    Qx::Status select(const std::vector<RecordTable::Condition>& conditions,
                      const std::function<bool(const cookie& item, const Record& record)>& callback) const;

    /// Named values. False, leaving `value`, if there is none of that name.
    [[nodiscard]] bool getValue(const String& name, String& value) const {
        return m_table->getValue(name, value);
    }
    /// A value that is the same already is not written.
    Qx::Status setValue(const String& name, const String& value);

    /// A number that is another one than before when another process has changed the records since; what is
    /// changed through this object leaves it.
    [[nodiscard]] int64_t versionOfOthers() const { return m_table->versionOfOthers(); }

    /// Many changes as one, kept or dropped as a whole.
    class QM_API Transaction {
    public:
        explicit Transaction(projdb& records) : m_inner(*records.m_table) {}
        Qx::Status commit() { return m_inner.commit(); }

    private:
        RecordTable::Transaction m_inner;
    };

private:
    std::unique_ptr<RecordTable> m_table;
    bool m_isNew = false;
};
