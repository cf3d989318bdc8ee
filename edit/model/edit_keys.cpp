#include "edit/model/edit_keys.h"

#include <algorithm>

namespace EditKeys {

String numbered(std::string_view name, int number) {
    return String(name) + std::to_string(number);
}

void removeNumbered(configb& header, std::string_view name, int from) {
    for (const String& key : header.keys()) {
        int number = 0;
        if (key.size() > name.size() && String::equalNoCase(key.substr(0, name.size()), name) &&
            Qx::textToInt(std::string_view(key).substr(name.size()), number) && number >= from) {
            header.remove(key);
        }
    }
}

bool isBookkeeping(std::string_view key) {
    const std::string_view name = key.substr(0, key.find_last_not_of("0123456789") + 1);
    return std::any_of(std::begin(kTable), std::end(kTable), [&](const Row& row) {
        return row.role == Role::Bookkeeping &&
               (row.form == Form::Plain ? String::equalNoCase(key, row.name)
                                        : name.size() < key.size() && String::equalNoCase(name, row.name));
    });
}

} // namespace EditKeys
