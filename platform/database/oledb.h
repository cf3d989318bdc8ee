#pragma once

#include "platform/base/critical_section.h"
#include "platform/base/export.h"
#include "platform/base/qx_string.h"
#include "platform/base/status.h"

#include <functional>
#include <memory>
#include <vector>

/// A table of records on disk: one text key a record, a fixed set of text columns, and beside the records a
/// small store of named values. It knows nothing of what its records mean.
///
/// It is meant for what can be made again from elsewhere (a cache): a commit survives a crash of the process,
/// and a crash of the machine leaves a table that opens, but the last commits may be missing. Several
/// processes may have one table open; a writer waits for another up to five seconds. All operations are safe
/// on any thread. The table is kept by SQLite 3, beside whose file its journal lies while it is open.
class QM_API oledb {
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

    oledb();
    ~oledb();
    oledb(const oledb&) = delete;
    oledb& operator=(const oledb&) = delete;

    /// Opens the table in a file, or makes it. Columns are matched by name without regard to case; their
    /// names may hold blanks. On a result other than 0 and 2 nothing is open.
    OpenResult open(const String& path, const std::vector<String>& columns, OtherColumns others = Refuse);
    void close();
    [[nodiscard]] bool isOpen() const;
    /// One sentence on the last failure.
    [[nodiscard]] String lastError() const;

    /// Position of a column; -1 if there is none of that name.
    [[nodiscard]] int columnIndex(std::string_view name) const;
    [[nodiscard]] const std::vector<String>& columns() const;

    /// One record's fields, in the order of the columns. False, leaving `fields`, if there is none.
    [[nodiscard]] bool findRecord(const String& key, std::vector<String>& fields) const;
    /// One field of a record. False, leaving `field`, if there is no such record or column.
    [[nodiscard]] bool getField(const String& key, int column, String& field) const;
    /// Stores a record, replacing one of the same key. As many fields as columns.
    Qx::Status putRecord(const String& key, const std::vector<String>& fields);
    /// Removing what is not there is a success.
    Qx::Status removeRecord(const String& key);
    Qx::Status removeAllRecords();
    [[nodiscard]] size_t numRecords() const;
    /// Hands over every record in the order of keys until the callback answers false. The callback must not
    /// use the table.
    void forEachRecord(
        const std::function<bool(const String& key, const std::vector<String>& fields)>& callback) const;

    /// Hands over the records that match every condition, in the order of keys, until the callback answers
    /// false. The callback must not use the table. Fails for a column that is none and where the table
    /// cannot be read.
    Qx::Status
    select(const std::vector<Condition>& conditions,
           const std::function<bool(const String& key, const std::vector<String>& fields)>& callback) const;

    /// Named values beside the records. False, leaving `value`, if there is none of that name.
    [[nodiscard]] bool getValue(const String& name, String& value) const;
    Qx::Status setValue(const String& name, const String& value);

    /// Many changes as one: what is done between the making of this object and `commit` is kept or dropped as
    /// a whole. Other threads wait meanwhile.
    class QM_API Transaction {
    public:
        explicit Transaction(oledb& table);
        ~Transaction();
        Transaction(const Transaction&) = delete;
        Transaction& operator=(const Transaction&) = delete;
        Qx::Status commit();

    private:
        oledb& m_table;
        bool m_open = false;
    };

private:
    class Connection;
    [[nodiscard]] static bool isEarlier(const std::vector<String>& found, const std::vector<String>& columns);
    std::unique_ptr<Connection> m_connection;
    std::vector<String> m_columns;
    String m_error;
    mutable criticalSection m_section;
};
