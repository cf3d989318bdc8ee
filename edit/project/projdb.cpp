#include "edit/project/projdb.h"

#include "platform/services/files.h"
#include "platform/services/log.h"

#include <vector>

namespace {

/// In the order of the columns.
constexpr const char* kNames[projdb::kNumColumns] = {"Type",
                                                     "Flags",
                                                     "chans",
                                                     "start time",
                                                     "end time",
                                                     "name",
                                                     "rate",
                                                     "duration",
                                                     "channels",
                                                     "created",
                                                     "modified",
                                                     "owner",
                                                     "file size",
                                                     "file time",
                                                     "damage",
                                                     "date",
                                                     "scene",
                                                     "shot",
                                                     "who",
                                                     "description",
                                                     "notes",
                                                     "cookie",
                                                     "reel",
                                                     "snd start",
                                                     "snd reel",
                                                     "aud qual",
                                                     "Compression Format",
                                                     "frame origin",
                                                     "pulldown",
                                                     "sequence",
                                                     "start 24P code",
                                                     "end 24P code",
                                                     "24P reel",
                                                     "start keycode",
                                                     "end keycode",
                                                     "start camcode",
                                                     "end camcode",
                                                     "cam reel",
                                                     "cam_date",
                                                     "lab reel",
                                                     "comp reel",
                                                     "start inkcode",
                                                     "end inkcode",
                                                     "Source Format",
                                                     "Reel Type",
                                                     "film duration"};

std::vector<String> columnNames() {
    return {std::begin(kNames), std::end(kNames)};
}

projdb::Record recordOf(const std::vector<String>& fields) {
    projdb::Record record;
    for (size_t i = 0; i < fields.size() && i < projdb::kNumColumns; ++i) {
        record[static_cast<projdb::Column>(i)] = fields[i];
    }
    return record;
}

/// Moves a damaged file out of the way, and removes what the table keeps beside it.
Qx::Status setAside(const String& path, const std::vector<String>& companions) {
    if (const Qx::FileError error = Qx::fileSystem().rename(path, path + ".DAMAGED")) {
        return error.status();
    }
    for (const String& beside : companions) {
        const Qx::FileAnswer found = Qx::askFile(path + beside);
        Qx::FileError error = found.obstacle("remove");
        if (found.isRegular()) {
            error = Qx::fileSystem().remove(path + beside);
        }
        if (error) {
            return error.status();
        }
    }
    return {};
}

} // namespace

projdb::projdb(std::unique_ptr<RecordTable> table) : m_table(std::move(table)) {}

const char* projdb::columnName(Column column) {
    return kNames[column];
}

Qx::Status projdb::open(const String& folder) {
    if (folder.empty()) {
        return Qx::Status::failure("there is no project folder to keep records in");
    }
    const String path = Qx::joinPath(folder, kFileName);
    RecordTable::OpenResult result = m_table->open(path, columnNames(), RecordTable::MakeAgain);
    if (result == RecordTable::Damaged) {
        const String damage = m_table->lastError();
        if (Qx::Status status = setAside(path, m_table->companions()); !status) {
            return status;
        }
        herc_printf("projdb: %s; it was set aside as %s.DAMAGED and is made again from the edits\n",
                    damage.c_str(), kFileName);
        result = m_table->open(path, columnNames(), RecordTable::MakeAgain);
    }
    m_isNew = result == RecordTable::Made;
    return m_table->isOpen() ? Qx::Status() : Qx::Status::failure(m_table->lastError());
}

void projdb::close() {
    m_table->close();
}

bool projdb::find(const cookie& item, Record& record) const {
    std::vector<String> fields;
    if (!m_table->findRecord(item.asString(), fields)) {
        return false;
    }
    record = recordOf(fields);
    return true;
}

bool projdb::getField(const cookie& item, int column, String& text) const {
    return m_table->getField(item.asString(), column, text);
}

Qx::Status projdb::put(const cookie& item, const Record& record) {
    if (!item.isStorable()) {
        return Qx::Status::failure(item.asString() + " names no stored item, so it has no record");
    }
    std::vector<String> fields(kNumColumns);
    for (int i = 0; i < kNumColumns; ++i) {
        fields[static_cast<size_t>(i)] = record[static_cast<Column>(i)];
    }
    return m_table->putRecord(item.asString(), fields);
}

Qx::Status projdb::remove(const cookie& item) {
    return m_table->removeRecord(item.asString());
}

Qx::Status projdb::removeAll() {
    return m_table->removeAllRecords();
}

void projdb::forEach(const std::function<bool(const cookie& item, const Record& record)>& callback) const {
    m_table->forEachRecord([&](const String& key, const std::vector<String>& fields) {
        const cookie item{std::string_view(key)};
        return !item.is_valid() || callback(item, recordOf(fields));
    });
}

Qx::Status
projdb::select(const std::vector<RecordTable::Condition>& conditions,
               const std::function<bool(const cookie& item, const Record& record)>& callback) const {
    std::vector<RecordTable::Condition> sound = conditions;
    sound.push_back({Damage, String()});
    return m_table->select(sound, [&](const String& key, const std::vector<String>& fields) {
        const cookie item{std::string_view(key)};
        return !item.is_valid() || callback(item, recordOf(fields));
    });
}

Qx::Status projdb::setValue(const String& name, const String& value) {
    String before;
    if (getValue(name, before) && before == value) {
        return {};
    }
    return m_table->setValue(name, value);
}
