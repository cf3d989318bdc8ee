#pragma once

#include "platform/base/critical_section.h"
#include "platform/database/record_table.h"

/// The table of records that SQLite 3 keeps. A writer waits for another process up to five seconds.
class QM_API oledb final : public RecordTable {
public:
    oledb();
    ~oledb() override;

    OpenResult open(const String& path, const std::vector<String>& columns,
                    OtherColumns others = Refuse) override;
    void close() override;
    [[nodiscard]] bool isOpen() const override;
    [[nodiscard]] String lastError() const override;
    [[nodiscard]] std::vector<String> companions() const override;
    [[nodiscard]] const std::vector<String>& columns() const override;
    [[nodiscard]] int columnIndex(std::string_view name) const override;
    [[nodiscard]] bool findRecord(const String& key, std::vector<String>& fields) const override;
    [[nodiscard]] bool getField(const String& key, int column, String& field) const override;
    Qx::Status putRecord(const String& key, const std::vector<String>& fields) override;
    Qx::Status removeRecord(const String& key) override;
    Qx::Status removeAllRecords() override;
    [[nodiscard]] size_t numRecords() const override;
    void forEachRecord(const Visitor& callback) const override;
    Qx::Status select(const std::vector<Condition>& conditions, const Visitor& callback) const override;
    [[nodiscard]] bool getValue(const String& name, String& value) const override;
    Qx::Status setValue(const String& name, const String& value) override;
    [[nodiscard]] int64_t versionOfOthers() const override;

private:
    bool begin() override;
    Qx::Status commit() override;
    void end(bool drops) override;

    class Connection;
    [[nodiscard]] static bool isEarlier(const std::vector<String>& found, const std::vector<String>& columns);
    std::unique_ptr<Connection> m_connection;
    std::vector<String> m_columns;
    String m_error;
    mutable criticalSection m_section;
};
