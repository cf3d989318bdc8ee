#include "edit/manager/edit_search.h"

#include "edit/manager/edit_manager.h"
#include "edit/material/log_attributes.h"

#include <algorithm>

namespace {

constexpr size_t kLongestPattern = 1000;

/// The column of an attribute or column as a user writes it; -1 for none.
int columnOf(const projdb& records, String name) {
    for (int look = 0; look < 2; ++look) {
        const char* const field =
            LogAttributes::getProjDBFieldNameForAttrib(LogAttributes::getFromPersistableString(name));
        if (const int column = records.columnIndex(field != nullptr ? field : name.c_str()); column >= 0) {
            return column;
        }
        std::replace(name.begin(), name.end(), '_', ' ');
    }
    return -1;
}

} // namespace

Qx::Status findEdits(const std::vector<String>& conditions, std::vector<FoundEdit>& found) {
    const projdb* const records = edit_manager::get_projdb();
    if (records == nullptr) {
        return Qx::Status::failure("the project has no record that can be used");
    }
    std::vector<RecordTable::Condition> wanted;
    for (const String& condition : conditions) {
        const size_t sign = condition.find('=');
        if (sign == String::npos || condition.size() - sign > kLongestPattern) {
            return Qx::Status::failure(Qx::StatusCode::BadArgument,
                                       "'" + condition.substr(0, kLongestPattern) +
                                           "' is no condition; write it as NAME=PATTERN, such as scene=12 or "
                                           "reel=A*");
        }
        const String name = String(condition.substr(0, sign)).trimmed();
        const int column = columnOf(*records, name);
        if (column < 0) {
            return Qx::Status::failure(Qx::StatusCode::BadArgument,
                                       "nothing is recorded under the name '" + name +
                                           "'; there are name, scene, shot, reel, date, type and others");
        }
        wanted.push_back({column, condition.substr(sign + 1)});
    }
    std::vector<FoundEdit> matching;
    const Qx::Status looked = records->select(wanted, [&](const cookie& item, const projdb::Record& record) {
        matching.push_back({item, record});
        return true;
    });
    if (looked) {
        found = std::move(matching);
    }
    return looked;
}
