#include "edit/manager/project_items.h"

#include "edit/manager/edit_record.h"
#include "edit/manager/revision_chain.h"
#include "edit/material/log_attributes.h"
#include "edit/model/edit.h"
#include "edit/model/edit_keys.h"
#include "edit/persist/edit_salvage.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/files.h"

#include <algorithm>
#include <map>

namespace {

/// Why an edit file cannot be read, and where its newest backup is if it has one.
Qx::Status damage(const String& path, const Qx::Status& why) {
    String text = why.reason();
    const String backup = path + ".U1";
    if (Qx::askFile(backup).isRegular()) {
        text += "; its newest backup is " + backup;
    }
    return why.retold(std::move(text));
}

/// The name of the edit file that a backup, or a file that was set aside, belongs to; empty for other names.
String fileOfRevision(const String& name) {
    const String mark = getEditFilenameExt() + ".";
    const size_t end = name.find(mark);
    if (end == String::npos) {
        return {};
    }
    const std::string_view rest = std::string_view(name).substr(end + mark.size());
    const bool isRevision = rest.starts_with('U') || rest.starts_with('R') || rest.starts_with("CORRUPT");
    return isRevision ? String(name.substr(0, end)) + getEditFilenameExt() : String();
}

/// An item of the project's folder, and whether its own file is there or only backups and what was set aside.
struct ItemFile {
    cookie item;
    bool isThere;
};

/// The items that the names of a folder tell of, in order of their cookies.
std::vector<ItemFile> itemFiles(const std::vector<String>& names, std::vector<String>& others) {
    std::map<String, bool> stems;
    for (const String& name : names) {
        if (Qx::extensionOf(name) == getEditFilenameExt()) {
            stems[Qx::withoutExtension(name)] = true;
        } else if (const String file = fileOfRevision(name); !file.empty()) {
            stems.try_emplace(Qx::withoutExtension(file), false);
        }
    }
    std::vector<ItemFile> files;
    for (const auto& [stem, isThere] : stems) {
        if (const cookie item{std::string_view(stem)}; item.isStorable()) {
            files.push_back({item, isThere});
        } else if (isThere) {
            others.push_back(stem + getEditFilenameExt());
        }
    }
    return files;
}

ListedEdit listedEdit(const cookie& item, const projdb::Record& record) {
    ListedEdit entry;
    entry.item = item;
    entry.damage = record[projdb::Damage];
    if (!entry.damage.empty()) {
        return entry;
    }
    entry.type = record[projdb::Type];
    entry.name = record[projdb::Name];
    entry.rate = Qx::FrameRate::fromString(record[projdb::Rate]);
    static_cast<void>(Qx::textToDouble(record[projdb::Duration], entry.duration));
    static_cast<void>(Qx::textToInt(record[projdb::NumChans], entry.channels));
    if (long long modified = 0; Qx::textToInt(record[projdb::Modified], modified)) {
        entry.modified = modified;
    }
    return entry;
}

/// What cannot be stored is read again the next time.
void storeRecords(projdb& records, const std::unordered_map<cookie, projdb::Record>& fresh) {
    projdb::Transaction together(records);
    for (const auto& [item, record] : fresh) {
        if (!records.put(item, record)) {
            return;
        }
    }
    static_cast<void>(together.commit().isOk());
}

/// The items of a name: those of the very name, else those of it in any case.
std::vector<cookie> itemsNamed(const std::vector<ListedEdit>& edits, const String& name) {
    std::vector<cookie> items;
    for (const bool anyCase : {false, true}) {
        for (const ListedEdit& edit : edits) {
            if (anyCase ? String::equalNoCase(edit.name, name) : edit.name == name) {
                items.push_back(edit.item);
            }
        }
        if (!items.empty()) {
            break;
        }
    }
    return items;
}

} // namespace

ProjectItems::ProjectItems(Session& session, std::function<void(const String&)> warn)
    : m_session(session), m_warn(std::move(warn)) {}

void ProjectItems::warn(const String& sentence) const {
    if (m_warn) {
        m_warn(sentence);
    }
}

String ProjectItems::fileOf(const cookie& item) {
    const RevisionChain undo(item, RevisionChain::Undo, edit_manager::backupDepth());
    int number = 0;
    const bool hasBackup = Qx::askFile(undo.file()).isMissing() && undo.findNewest(number) && number != 0;
    return hasBackup ? undo.path(number) : undo.file();
}

/// A sequence may play very many shots that are not there.
bool ProjectItems::isListed(const cookie& item) const {
    if (!m_listed) {
        std::vector<String> names;
        std::vector<String> others;
        static_cast<void>(Qx::fileSystem().list(m_session.folder(), names).code);
        m_listed.emplace();
        for (const ItemFile& file : itemFiles(names, others)) {
            m_listed->insert(file.item);
        }
    }
    return m_listed->contains(item);
}

bool ProjectItems::readBackup(const cookie& item, EditPtr& edit, Qx::Status& status) const {
    const RevisionChain undo(item, RevisionChain::Undo, edit_manager::backupDepth());
    int number = 0;
    if (status = undo.findNewest(number); !status) {
        return true;
    }
    if (number == 0) {
        return false;
    }
    const String backup = undo.path(number);
    if (status = readFile(backup, edit); !status) {
        // It may have been moved meanwhile, to the edit's name or to another number.
        return Qx::askFile(undo.file()).isMissing() && !Qx::askFile(backup).isMissing();
    }
    edit->set_cookie(item);
    if (m_toldAway.insert(item).second) {
        warn(undo.file() + " is away, as a program writes it or died; this is its undo backup " +
             std::to_string(number));
    }
    return true;
}

Qx::Status ProjectItems::readFile(const String& path, EditPtr& edit) {
    EditPtr read;
    std::vector<String> lost;
    if (Qx::Status status = salvageEdit(path, read, lost); !status) {
        return status;
    }
    if (!lost.empty()) {
        return Qx::Status::failure(Qx::StatusCode::Damaged, path + " is damaged: " + lost.front());
    }
    edit = read;
    return {};
}

Qx::Status ProjectItems::read(const cookie& item, EditPtr& edit) const {
    // Under one of its names it lies at every moment; a writer may move it between two looks.
    constexpr int kLooks = 5;
    const String path = getFilenameForCookie(item);
    Qx::Status status;
    for (int look = 0; look < kLooks; ++look) {
        if (!Qx::askFile(path).isMissing()) {
            EditPtr read(new Edit);
            if (read->read_file(item, eOpenExisting) == Edit::kReadOk) {
                edit = read;
                return {};
            }
            if (!Qx::askFile(path).isMissing()) {
                return damage(path, read->lastFileStatus());
            }
        }
        if (readBackup(item, edit, status)) {
            return status;
        }
        if (Qx::askFile(path).isMissing() && !isListed(item)) {
            break;
        }
    }
    return Qx::Status::failure(Qx::StatusCode::NotFound,
                               isListed(item) ? path + ": its file is missing and it has no undo backup"
                                              : String("there is no edit " + item.asString() +
                                                       " in the project " + m_session.root()));
}

Qx::Status ProjectItems::find(const String& text, cookie& item) {
    const cookie stated(text, true);
    if (stated.isStorable() && isListed(stated)) {
        item = stated;
        return {};
    }
    std::vector<ListedEdit> edits;
    std::vector<String> others;
    if (Qx::Status listed = text.empty() ? Qx::Status() : list(edits, others); !listed) {
        return listed;
    }
    const std::vector<cookie> found = itemsNamed(edits, text);
    if (found.size() > 1) {
        String cookies;
        for (const cookie& one : found) {
            cookies += (cookies.empty() ? "" : ", ") + one.asString();
        }
        return Qx::Status::failure(Qx::StatusCode::BadArgument, "'" + text + "' is the name of " +
                                                                    std::to_string(found.size()) +
                                                                    " items, " + cookies);
    }
    if (found.empty() && !stated.isStorable()) {
        return Qx::Status::failure(Qx::StatusCode::NotFound,
                                   "'" + text +
                                       "' is neither the cookie nor the name of an edit in the project " +
                                       m_session.root());
    }
    item = found.empty() ? stated : found.front();
    return {};
}

projdb* ProjectItems::openRecords() {
    const String path = Qx::joinPath(m_session.folder(), projdb::kFileName);
    const Qx::FileAnswer before = Qx::askFile(path);
    if (!before.isRegular()) {
        return nullptr;
    }
    m_session.manage();
    projdb* const records = edit_manager::get_projdb();
    const Qx::FileAnswer after = Qx::askFile(path);
    if (after.isRegular() && after.info().inode != before.info().inode) {
        warn("the project's record was damaged; it was set aside as " + path +
             ".DAMAGED and is made again. It is only a cache: no edit is concerned");
    }
    return records;
}

/// What the record says of an item, or else its file; `fresh` gets what only the file told.
projdb::Record ProjectItems::recordOf(const cookie& item, const Records& known, Records& fresh) {
    const String path = getFilenameForCookie(item);
    const Qx::FileInfo info = Qx::askFile(path).info();
    const bool hasInfo = info.kind == Qx::FileKind::Regular;
    // A record of damage is not trusted: what kept a file from being read may be gone.
    if (const auto place = known.find(item);
        hasInfo && place != known.end() && isRecordOfFile(place->second, info) &&
        place->second[projdb::Damage].empty() && !place->second[projdb::Modified].empty()) {
        return place->second;
    }
    ++m_numRead;
    projdb::Record record;
    EditPtr edit(new Edit);
    if (edit->read_file(item, eOpenExisting) == Edit::kReadOk) {
        record = editRecordOf(*edit, &info);
    } else {
        const String& reason = edit->lastFileError();
        record[projdb::Damage] = reason.empty() ? String("cannot be read") : reason;
        stampRecord(record, info);
    }
    if (hasInfo) {
        fresh[item] = record;
    }
    return record;
}

ListedEdit ProjectItems::listedAway(const cookie& item) const {
    EditPtr edit;
    projdb::Record record;
    if (const Qx::Status found = read(item, edit); found) {
        record = editRecordOf(*edit, nullptr);
    } else {
        record[projdb::Damage] = found.reason();
    }
    return listedEdit(item, record);
}

Qx::Status ProjectItems::list(std::vector<ListedEdit>& edits, std::vector<String>& others) {
    std::vector<String> names;
    if (const Qx::FileError error = Qx::fileSystem().list(m_session.folder(), names); error) {
        return error.status();
    }
    projdb* const records = openRecords();
    Records known;
    Records fresh;
    if (records != nullptr) {
        known.reserve(records->numRecords());
        records->forEach([&known](const cookie& item, const projdb::Record& record) {
            known.emplace(item, record);
            return true;
        });
    }
    m_numRead = 0;
    for (const ItemFile& file : itemFiles(names, others)) {
        ListedEdit entry =
            file.isThere ? listedEdit(file.item, recordOf(file.item, known, fresh)) : listedAway(file.item);
        // A writer may have taken the file away since the folder was listed.
        if (file.isThere && !entry.damage.empty() &&
            Qx::askFile(getFilenameForCookie(file.item)).isMissing()) {
            entry = listedAway(file.item);
        }
        edits.push_back(std::move(entry));
    }
    if (records != nullptr && !fresh.empty()) {
        storeRecords(*records, fresh);
    }
    return {};
}

const SourceFacts& ProjectItems::factsOf(const cookie& source) {
    const auto [place, added] = m_facts.try_emplace(source);
    if (added) {
        EditPtr edit;
        if (const Qx::Status found = read(source, edit); found) {
            place->second = {
                edit->getName(), {}, edit->Opts().getString(EditKeys::kReel), edit->isDropFrame(false)};
        } else {
            place->second.problem = found.reason();
        }
    }
    return place->second;
}
