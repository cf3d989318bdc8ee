#pragma once

#include "platform/base/export.h"
#include "platform/base/qx_string.h"
#include "platform/base/status.h"

#include <cstdint>
#include <functional>
#include <memory>
#include <vector>

/// A table of records on disk: one text key a record, a set of text columns that is fixed when it is opened,
/// and beside the records a small store of named values. It knows nothing of what its records mean, and who
/// uses it nothing of what keeps them.
///
/// It is meant for what can be made again from elsewhere (a cache): a commit survives a crash of the process,
/// and a crash of the machine leaves a table that opens, but the last commits may be missing. Several
/// processes may have one table open. All operations are safe on any thread.
class QM_API RecordTable {
public:
    enum OpenResult {
        Opened = 0,    ///< the table was there and is sound
        NotOpened = 1, ///< the file system refused; see `lastError`
        Made = 2,      ///< there was none: an empty one was made
        Damaged = 3    ///< the file is no table of this kind, is damaged, or has other columns
    };

    /// What is done with a sound table whose columns are others.
    enum OtherColumns {
        Refuse,   ///< the answer is `Damaged`
        MakeAgain ///< one that has only some of the columns is of an earlier version: its records go
    };
    /// One field of a record and what its text is to be, without regard to the case of ASCII letters. In the
    /// pattern '*' stands for any text, also an empty one, and '?' for one character.
    struct Condition {
        int column = 0;
        String pattern;
    };

    RecordTable() = default;
    virtual ~RecordTable() = default;
    RecordTable(const RecordTable&) = delete;
    RecordTable& operator=(const RecordTable&) = delete;

    /// A closed table of the kind that this platform keeps.
    [[nodiscard]] static std::unique_ptr<RecordTable> make();

    /// Opens the table in a file, or makes it. Columns are matched by name without regard to case; their
    /// names may hold blanks. On a result other than 0 and 2 nothing is open.
    virtual OpenResult open(const String& path, const std::vector<String>& columns,
                            OtherColumns others = Refuse) = 0;
    virtual void close() = 0;
    [[nodiscard]] virtual bool isOpen() const = 0;
    /// One sentence on the last failure of `open`.
    [[nodiscard]] virtual String lastError() const = 0;
    /// The names that lie beside the file of a table while it is open, or after a crash, behind its own.
    [[nodiscard]] virtual std::vector<String> companions() const = 0;

    [[nodiscard]] virtual const std::vector<String>& columns() const = 0;
    /// Position of a column; -1 if there is none of that name.
    [[nodiscard]] virtual int columnIndex(std::string_view name) const = 0;

    /// One record's fields, in the order of the columns. False, leaving `fields`, if there is none.
    [[nodiscard]] virtual bool findRecord(const String& key, std::vector<String>& fields) const = 0;
    /// One field of a record. False, leaving `field`, if there is no such record or column.
    [[nodiscard]] virtual bool getField(const String& key, int column, String& field) const = 0;
    /// Stores a record, replacing one of the same key. As many fields as columns.
    virtual Qx::Status putRecord(const String& key, const std::vector<String>& fields) = 0;
    /// Removing what is not there is a success.
    virtual Qx::Status removeRecord(const String& key) = 0;
    virtual Qx::Status removeAllRecords() = 0;
    [[nodiscard]] virtual size_t numRecords() const = 0;
    /// Hands over every record in the order of keys until the callback answers false. The callback must not
    /// use the table.
    using Visitor = std::function<bool(const String& key, const std::vector<String>& fields)>;
    virtual void forEachRecord(const Visitor& callback) const = 0;
    /// Hands over the records that match every condition, in the order of keys, until the callback answers
    /// false. The callback must not use the table. Fails for a column that is none and where the table
    /// cannot be read.
    virtual Qx::Status select(const std::vector<Condition>& conditions, const Visitor& callback) const = 0;

    /// Named values beside the records. False, leaving `value`, if there is none of that name.
    [[nodiscard]] virtual bool getValue(const String& name, String& value) const = 0;
    virtual Qx::Status setValue(const String& name, const String& value) = 0;

    /// A number that is another one than before when another connection, of this process or of another, has
    /// changed the table since; changes made through this object leave it. 0 when the table is not open.
    [[nodiscard]] virtual int64_t versionOfOthers() const = 0;

    /// Many changes as one: what is done between the making of this object and `commit` is kept or dropped as
    /// a whole. Other threads wait meanwhile.
    class QM_API Transaction {
    public:
        explicit Transaction(RecordTable& table) : m_table(table), m_isOpen(table.begin()) {}
        ~Transaction() { m_table.end(m_isOpen); }
        Transaction(const Transaction&) = delete;
        Transaction& operator=(const Transaction&) = delete;
        Qx::Status commit();

    private:
        RecordTable& m_table;
        bool m_isOpen; ///< there is something to be dropped
    };

private:
    /// Keeps other threads away and begins; false if nothing was begun, and they are kept away all the same.
    virtual bool begin() = 0;
    virtual Qx::Status commit() = 0;
    /// Lets other threads go on, having dropped what was begun and not committed.
    virtual void end(bool drops) = 0;
};
