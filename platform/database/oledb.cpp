#include "platform/database/oledb.h"

#include <algorithm>
#include <mutex>
#include <sqlite3.h>

namespace {

using Hold = std::lock_guard<criticalSection>;

constexpr int kBusyMilliseconds = 5000;

/// A column's name as an SQL identifier. Column names come from the program, but a quote in one does no harm.
String quoted(const String& name) {
    String text = "\"";
    for (const char c : name) {
        text.append(c == '"' ? 2 : 1, c);
    }
    text += '"';
    return text;
}

/// A prepared statement, reset after each use.
class Statement {
public:
    Statement() = default;
    ~Statement() { sqlite3_finalize(m_statement); }
    Statement(const Statement&) = delete;
    Statement& operator=(const Statement&) = delete;

    bool prepare(sqlite3* database, const String& sql) {
        return sqlite3_prepare_v3(database, sql.c_str(), -1, SQLITE_PREPARE_PERSISTENT, &m_statement,
                                  nullptr) == SQLITE_OK;
    }
    void bind(int position, const String& text) {
        sqlite3_bind_text(m_statement, position, text.data(), static_cast<int>(text.size()), SQLITE_STATIC);
    }
    bool step() { return sqlite3_step(m_statement) == SQLITE_ROW; }
    [[nodiscard]] String text(int column) const {
        const void* const bytes = sqlite3_column_blob(m_statement, column);
        const auto size = static_cast<size_t>(sqlite3_column_bytes(m_statement, column));
        return bytes == nullptr ? String() : String(static_cast<const char*>(bytes), size);
    }
    [[nodiscard]] int64_t number(int column) const { return sqlite3_column_int64(m_statement, column); }
    /// Ends a use; the result code of the last step.
    int reset() {
        const int code = sqlite3_reset(m_statement);
        sqlite3_clear_bindings(m_statement);
        return code;
    }

private:
    sqlite3_stmt* m_statement = nullptr;
};

bool isDamage(int code) {
    const int primary = code & 0xFF;
    return primary == SQLITE_CORRUPT || primary == SQLITE_NOTADB;
}

} // namespace

class oledb::Connection {
public:
    ~Connection() { close(); }

    void close() {
        m_find.reset();
        m_put.reset();
        m_remove.reset();
        m_all.reset();
        m_getValue.reset();
        m_setValue.reset();
        sqlite3_close(m_database);
        m_database = nullptr;
    }

    bool execute(const String& sql) {
        return sqlite3_exec(m_database, sql.c_str(), nullptr, nullptr, nullptr) == SQLITE_OK;
    }

    /// Opens the file and sets it up; the columns of a table that is there are put in `found`.
    bool open(const String& path, std::vector<String>& found) {
        const int flags =
            SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE | SQLITE_OPEN_NOFOLLOW | SQLITE_OPEN_FULLMUTEX;
        if (sqlite3_open_v2(path.c_str(), &m_database, flags, nullptr) != SQLITE_OK) {
            return false;
        }
        sqlite3_extended_result_codes(m_database, 1);
        sqlite3_busy_timeout(m_database, kBusyMilliseconds);
        if (!execute("PRAGMA journal_mode=WAL") || !execute("PRAGMA synchronous=NORMAL")) {
            return false;
        }
        Statement info;
        if (!info.prepare(m_database, "PRAGMA table_info(records)")) {
            return false;
        }
        while (info.step()) {
            found.push_back(info.text(1));
        }
        return !isDamage(info.reset());
    }

    bool make(const std::vector<String>& columns) {
        String sql = "CREATE TABLE IF NOT EXISTS records (\"key\" TEXT PRIMARY KEY NOT NULL";
        for (const String& column : columns) {
            sql += ", " + quoted(column) + " TEXT NOT NULL";
        }
        return execute(sql + ") WITHOUT ROWID");
    }

    bool prepare(size_t numColumns) {
        String marks = "?1";
        for (size_t i = 0; i < numColumns; ++i) {
            marks += String::format(", ?%zu", i + 2);
        }
        return execute("CREATE TABLE IF NOT EXISTS \"values\" (name TEXT PRIMARY KEY NOT NULL, value TEXT "
                       "NOT NULL) WITHOUT ROWID") &&
               make(m_find, "SELECT * FROM records WHERE \"key\" = ?1") &&
               make(m_put, "INSERT OR REPLACE INTO records VALUES (" + marks + ")") &&
               make(m_remove, "DELETE FROM records WHERE \"key\" = ?1") &&
               make(m_all, "SELECT * FROM records ORDER BY \"key\"") &&
               make(m_getValue, "SELECT value FROM \"values\" WHERE name = ?1") &&
               make(m_setValue, "INSERT OR REPLACE INTO \"values\" VALUES (?1, ?2)");
    }

    /// A quick look for damage; the whole of a large table is not read.
    bool isSound() {
        Statement check;
        if (!check.prepare(m_database, "PRAGMA quick_check(1)") || !check.step()) {
            return false;
        }
        return check.text(0) == "ok";
    }

    [[nodiscard]] int code() const { return sqlite3_extended_errcode(m_database); }
    [[nodiscard]] String message() const {
        return m_database == nullptr ? "out of memory" : sqlite3_errmsg(m_database);
    }

    std::unique_ptr<Statement> m_find;
    std::unique_ptr<Statement> m_put;
    std::unique_ptr<Statement> m_remove;
    std::unique_ptr<Statement> m_all;
    std::unique_ptr<Statement> m_getValue;
    std::unique_ptr<Statement> m_setValue;
    sqlite3* m_database = nullptr;

private:
    bool make(std::unique_ptr<Statement>& statement, const String& sql) {
        statement = std::make_unique<Statement>();
        return statement->prepare(m_database, sql);
    }
};

oledb::oledb() = default;
oledb::~oledb() = default;

/// True if a table has a key and only some of the columns.
bool oledb::isEarlier(const std::vector<String>& found, const std::vector<String>& columns) {
    const auto isKnown = [&columns](const String& name) {
        return std::any_of(columns.begin(), columns.end(),
                           [&name](const String& column) { return String::equalNoCase(column, name); });
    };
    return found.size() <= columns.size() && found.front() == "key" &&
           std::all_of(found.begin() + 1, found.end(), isKnown);
}

oledb::OpenResult oledb::open(const String& path, const std::vector<String>& columns, OtherColumns others) {
    const Hold hold(m_section);
    close();
    auto connection = std::make_unique<Connection>();
    std::vector<String> found;
    const auto refuse = [&](OpenResult result) {
        m_error = "cannot use the table " + path + ": " + connection->message();
        return result;
    };
    if (!connection->open(path, found)) {
        return refuse(isDamage(connection->code()) ? Damaged : NotOpened);
    }
    bool made = found.empty();
    if (!made && others == MakeAgain && isEarlier(found, columns) && connection->isSound()) {
        made = connection->execute("DROP TABLE records");
    }
    if (made && !connection->make(columns)) {
        return refuse(isDamage(connection->code()) ? Damaged : NotOpened);
    }
    if (!made) {
        bool same = found.size() == columns.size() + 1;
        for (size_t i = 0; same && i < columns.size(); ++i) {
            same = String::equalNoCase(found[i + 1], columns[i]);
        }
        if (!same || !connection->isSound()) {
            m_error =
                "the table " + path + (same ? " is damaged" : " has other columns than this program uses");
            return Damaged;
        }
    }
    if (!connection->prepare(columns.size())) {
        return refuse(isDamage(connection->code()) ? Damaged : NotOpened);
    }
    m_connection = std::move(connection);
    m_columns = columns;
    m_error.clear();
    return made ? Made : Opened;
}

void oledb::close() {
    const Hold hold(m_section);
    m_connection.reset();
    m_columns.clear();
}

bool oledb::isOpen() const {
    const Hold hold(m_section);
    return m_connection != nullptr;
}

String oledb::lastError() const {
    const Hold hold(m_section);
    return m_error;
}

int oledb::columnIndex(std::string_view name) const {
    const Hold hold(m_section);
    for (size_t i = 0; i < m_columns.size(); ++i) {
        if (String::equalNoCase(m_columns[i], name)) {
            return static_cast<int>(i);
        }
    }
    return -1;
}

const std::vector<String>& oledb::columns() const {
    return m_columns;
}

bool oledb::findRecord(const String& key, std::vector<String>& fields) const {
    const Hold hold(m_section);
    if (m_connection == nullptr) {
        return false;
    }
    Statement& find = *m_connection->m_find;
    find.bind(1, key);
    const bool there = find.step();
    if (there) {
        fields.resize(m_columns.size());
        for (size_t i = 0; i < fields.size(); ++i) {
            fields[i] = find.text(static_cast<int>(i) + 1);
        }
    }
    find.reset();
    return there;
}

bool oledb::getField(const String& key, int column, String& field) const {
    const Hold hold(m_section);
    if (m_connection == nullptr || column < 0 || column >= static_cast<int>(m_columns.size())) {
        return false;
    }
    Statement& find = *m_connection->m_find;
    find.bind(1, key);
    const bool there = find.step();
    if (there) {
        field = find.text(column + 1);
    }
    find.reset();
    return there;
}

namespace {

Qx::Status outcome(Statement& statement, sqlite3* database, const char* what) {
    statement.step();
    if (statement.reset() == SQLITE_OK) {
        return {};
    }
    return Qx::Status::failure(String("cannot ") + what + ": " + sqlite3_errmsg(database));
}

const char* const kNotOpen = "the table is not open";

} // namespace

Qx::Status oledb::putRecord(const String& key, const std::vector<String>& fields) {
    const Hold hold(m_section);
    if (m_connection == nullptr) {
        return Qx::Status::failure(kNotOpen);
    }
    if (fields.size() != m_columns.size()) {
        return Qx::Status::failure(String::format(
            "a record of %zu fields does not fit a table of %zu columns", fields.size(), m_columns.size()));
    }
    Statement& put = *m_connection->m_put;
    put.bind(1, key);
    for (size_t i = 0; i < fields.size(); ++i) {
        put.bind(static_cast<int>(i) + 2, fields[i]);
    }
    return outcome(put, m_connection->m_database, "store a record");
}

Qx::Status oledb::removeRecord(const String& key) {
    const Hold hold(m_section);
    if (m_connection == nullptr) {
        return Qx::Status::failure(kNotOpen);
    }
    m_connection->m_remove->bind(1, key);
    return outcome(*m_connection->m_remove, m_connection->m_database, "remove a record");
}

Qx::Status oledb::removeAllRecords() {
    const Hold hold(m_section);
    if (m_connection == nullptr) {
        return Qx::Status::failure(kNotOpen);
    }
    return m_connection->execute("DELETE FROM records")
               ? Qx::Status()
               : Qx::Status::failure("cannot remove the records: " + m_connection->message());
}

size_t oledb::numRecords() const {
    const Hold hold(m_section);
    Statement count;
    if (m_connection == nullptr || !count.prepare(m_connection->m_database, "SELECT count(*) FROM records") ||
        !count.step()) {
        return 0;
    }
    return static_cast<size_t>(count.number(0));
}

void oledb::forEachRecord(const Visitor& callback) const {
    const Hold hold(m_section);
    if (m_connection == nullptr) {
        return;
    }
    Statement& all = *m_connection->m_all;
    std::vector<String> fields(m_columns.size());
    while (all.step()) {
        for (size_t i = 0; i < fields.size(); ++i) {
            fields[i] = all.text(static_cast<int>(i) + 1);
        }
        if (!callback(all.text(0), fields)) {
            break;
        }
    }
    all.reset();
}

namespace {

/// A pattern as LIKE has it.
String likePattern(const String& pattern) {
    String text;
    for (const char c : pattern) {
        switch (c) {
        case '*':
            text += '%';
            break;
        case '?':
            text += '_';
            break;
        case '%':
        case '_':
        case '\\':
            text += '\\';
            [[fallthrough]];
        default:
            text += c;
        }
    }
    return text;
}

} // namespace

Qx::Status oledb::select(const std::vector<Condition>& conditions, const Visitor& callback) const {
    const Hold hold(m_section);
    if (m_connection == nullptr) {
        return Qx::Status::failure(kNotOpen);
    }
    String sql = "SELECT * FROM records";
    std::vector<String> patterns;
    for (const Condition& condition : conditions) {
        if (condition.column < 0 || condition.column >= std::ssize(m_columns)) {
            return Qx::Status::failure(Qx::StatusCode::BadArgument, "the table has no such column");
        }
        const bool isExact = condition.pattern.find_first_of("*?") == String::npos;
        patterns.push_back(isExact ? condition.pattern : likePattern(condition.pattern));
        sql += (patterns.size() == 1 ? " WHERE " : " AND ") +
               quoted(m_columns[static_cast<size_t>(condition.column)]) +
               String::format(isExact ? " = ?%zu COLLATE NOCASE" : " LIKE ?%zu ESCAPE '\\'", patterns.size());
    }
    const auto refused = [this] {
        return Qx::Status::failure("cannot look records up: " + m_connection->message());
    };
    Statement found;
    if (!found.prepare(m_connection->m_database, sql + " ORDER BY \"key\"")) {
        return refused();
    }
    for (size_t i = 0; i < patterns.size(); ++i) {
        found.bind(static_cast<int>(i) + 1, patterns[i]);
    }
    std::vector<String> fields(m_columns.size());
    while (found.step()) {
        for (size_t i = 0; i < fields.size(); ++i) {
            fields[i] = found.text(static_cast<int>(i) + 1);
        }
        if (!callback(found.text(0), fields)) {
            return {};
        }
    }
    return found.reset() == SQLITE_OK ? Qx::Status() : refused();
}

bool oledb::getValue(const String& name, String& value) const {
    const Hold hold(m_section);
    if (m_connection == nullptr) {
        return false;
    }
    Statement& get = *m_connection->m_getValue;
    get.bind(1, name);
    const bool there = get.step();
    if (there) {
        value = get.text(0);
    }
    get.reset();
    return there;
}

Qx::Status oledb::setValue(const String& name, const String& value) {
    const Hold hold(m_section);
    if (m_connection == nullptr) {
        return Qx::Status::failure(kNotOpen);
    }
    m_connection->m_setValue->bind(1, name);
    m_connection->m_setValue->bind(2, value);
    return outcome(*m_connection->m_setValue, m_connection->m_database, "store a value");
}

int64_t oledb::versionOfOthers() const {
    const Hold hold(m_section);
    Statement version;
    const bool known = m_connection != nullptr &&
                       version.prepare(m_connection->m_database, "PRAGMA data_version") && version.step();
    return known ? version.number(0) : 0;
}

std::vector<String> oledb::companions() const {
    return {"-wal", "-shm", "-journal"};
}

bool oledb::begin() {
    m_section.lock();
    return m_connection != nullptr && m_connection->execute("BEGIN IMMEDIATE");
}

Qx::Status oledb::commit() {
    return m_connection->execute("COMMIT")
               ? Qx::Status()
               : Qx::Status::failure("cannot keep the changes: " + m_connection->message());
}

void oledb::end(bool drops) {
    if (drops) {
        m_connection->execute("ROLLBACK");
    }
    m_section.unlock();
}

std::unique_ptr<RecordTable> RecordTable::make() {
    return std::make_unique<oledb>();
}

Qx::Status RecordTable::Transaction::commit() {
    if (!m_isOpen) {
        return Qx::Status::failure(
            Qx::StatusCode::Locked,
            "the table could not be locked for changing; another program may be writing to it");
    }
    Qx::Status kept = m_table.commit();
    m_isOpen = !kept;
    return kept;
}
