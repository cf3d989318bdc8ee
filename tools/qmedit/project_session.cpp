#include "tools/qmedit/project_session.h"

#include "edit/manager/edit_record.h"
#include "edit/manager/leftovers.h"
#include "edit/manager/revision_chain.h"
#include "edit/material/log_attributes.h"
#include "edit/persist/edit_init.h"
#include "edit/persist/edit_salvage.h"
#include "edit/project/project_details.h"
#include "interchange/edl/edl_records.h"
#include "platform/services/current_project.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/files.h"
#include "tools/qmedit/console.h"

#include <cstdlib>
#include <map>

namespace {

/// The folder that a --project option, or in its place the environment, means.
String folderOfOption(const String& option) {
    if (!option.empty()) {
        return option;
    }
    const char* environment = std::getenv("QMEDIT_PROJECT");
    return environment != nullptr && *environment != '\0' ? environment : "./quillmarch-project";
}

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

String missingText(const cookie& item) {
    return "its file is missing and it has no undo backup; 'qmedit history " + item.asString() +
           "' shows what is left of it, 'qmedit recover " + item.asString() + "' brings it back";
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

} // namespace

ProjectSession::ProjectSession(const String& option) : m_session(folderOfOption(option)) {}

String ProjectSession::fileOf(const cookie& item) {
    const RevisionChain undo(item, RevisionChain::Undo, edit_manager::backupDepth());
    int number = 0;
    const bool hasBackup = Qx::askFile(undo.file()).isMissing() && undo.findNewest(number) && number != 0;
    return hasBackup ? undo.path(number) : undo.file();
}

void ProjectSession::useUnwritten(Qx::FrameRate rate) {
    ProjectDetails usual;
    if (rate.valid()) {
        usual.frameRateCode = rate.code();
    }
    m_session.useUnwritten(usual);
}

Qx::Status ProjectSession::openExisting() {
    Qx::Status used = m_session.useExisting();
    if (used.code() == Qx::StatusCode::NotFound) {
        return used.retold(used.reason() +
                           "; name another with --project DIR, or make one with 'qmedit import FILE'");
    }
    if (!used) {
        // The edits are there all the same. What writes asks again, and fails, in `create`.
        reportWarning(used.reason() + "; the usual settings are taken");
        useUnwritten({});
    }
    return {};
}

Qx::Status ProjectSession::prepare(Qx::FrameRate rateOfFresh) {
    if (exists()) {
        return openExisting();
    }
    m_rateOfFresh = rateOfFresh;
    useUnwritten(rateOfFresh);
    return {};
}

Qx::Status ProjectSession::create() {
    const interrupts::Hold hold(false);
    ProjectDetails defaults;
    if (m_rateOfFresh.valid()) {
        defaults.frameRateCode = m_rateOfFresh.code();
    }
    if (Qx::Status made = m_session.make(defaults); !made) {
        return made;
    }
    if (const Qx::Status started = edit_init(); !started) {
        reportWarning(started.reason());
    }
    // What a writer of the project has in hand is no leftover; it cleans up itself.
    if (EditManagerLock writers(folder()); writers.take()) {
        cleanUp();
    }
    return {};
}

/// True if the folder has a file of the item, or what is left of one. It is gone through once: a sequence may
/// play very many shots that are not there.
bool ProjectSession::isListed(const cookie& item) const {
    if (!m_listed) {
        std::vector<String> names;
        std::vector<String> others;
        static_cast<void>(Qx::fileSystem().list(folder(), names).code);
        m_listed.emplace();
        for (const ItemFile& file : itemFiles(names, others)) {
            m_listed->insert(file.item);
        }
    }
    return m_listed->contains(item);
}

bool ProjectSession::readBackup(const cookie& item, EditPtr& edit, Qx::Status& status) const {
    const RevisionChain undo(item, RevisionChain::Undo, edit_manager::backupDepth());
    int number = 0;
    if (status = undo.findNewest(number); !status) {
        return true;
    }
    if (number == 0) {
        return false;
    }
    const String backup = undo.path(number);
    if (status = readRevision(backup, edit); !status) {
        // It may have been moved meanwhile, to the edit's name or to another number.
        return Qx::askFile(undo.file()).isMissing() && !Qx::askFile(backup).isMissing();
    }
    edit->set_cookie(item);
    if (m_toldAway.insert(item).second) {
        reportWarning(undo.file() + " is away, as a program writes it or died; this is its undo backup " +
                      std::to_string(number));
    }
    return true;
}

Qx::Status ProjectSession::readRevision(const String& path, EditPtr& edit) {
    EditPtr read;
    std::vector<String> lost;
    if (Qx::Status status = salvageEdit(path, read, lost); !status) {
        return status;
    }
    if (!lost.empty()) {
        return Qx::Status::failure(Qx::StatusCode::Damaged,
                                   path + " is damaged: " + lost.front() +
                                       "; 'qmedit salvage' saves what is sound of it");
    }
    edit = read;
    return {};
}

Qx::Status ProjectSession::readEdit(const cookie& item, EditPtr& edit) const {
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
    if (isListed(item)) {
        return Qx::Status::failure(Qx::StatusCode::NotFound, path + ": " + missingText(item));
    }
    return Qx::Status::failure(Qx::StatusCode::NotFound, "there is no edit " + item.asString() +
                                                             " in the project " + root() +
                                                             "; 'qmedit list' shows those there are");
}

Qx::Status ProjectSession::lockForWriting() {
    if (Qx::Status taken = m_session.lockForWriting(std::chrono::seconds(kLockPatience)); !taken) {
        return taken.retold("nothing was changed: " + taken.reason());
    }
    m_uninterrupted.emplace(true);
    cleanUp();
    return {};
}

void ProjectSession::cleanUp() {
    if (!m_isClean) {
        removeLeftovers(folder());
        m_isClean = true;
    }
}

projdb* ProjectSession::openRecords() {
    const String path = Qx::joinPath(folder(), projdb::kFileName);
    const Qx::FileAnswer before = Qx::askFile(path);
    if (!before.isRegular()) {
        return nullptr;
    }
    manage();
    projdb* const records = edit_manager::get_projdb();
    const Qx::FileAnswer after = Qx::askFile(path);
    if (after.isRegular() && after.info().inode != before.info().inode) {
        reportWarning("the project's record was damaged; it was set aside as " + path +
                      ".DAMAGED and is made again. It is only a cache: no edit is concerned");
    }
    return records;
}

/// What the record says of an item, or else its file; `fresh` gets what only the file told.
projdb::Record ProjectSession::recordOf(const cookie& item, const Records& known, Records& fresh) {
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

ListedEdit ProjectSession::listedAway(const cookie& item) const {
    EditPtr edit;
    projdb::Record record;
    if (const Qx::Status read = readEdit(item, edit); read) {
        record = editRecordOf(*edit, nullptr);
    } else {
        record[projdb::Damage] = read.reason();
    }
    return listedEdit(item, record);
}

Qx::Status ProjectSession::list(std::vector<ListedEdit>& edits, std::vector<String>& others) {
    std::vector<String> names;
    if (const Qx::FileError error = Qx::fileSystem().list(folder(), names); error) {
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

SourceNamer ProjectSession::sourceNamer() {
    return [this](SourceReport& source) {
        const auto [place, added] = m_known.try_emplace(source.strip);
        if (added) {
            place->second = look(source.strip);
        }
        source.name = place->second.name;
        source.problem = place->second.problem;
        if (source.problem.empty()) {
            source.dropFrame = place->second.dropFrame;
        }
    };
}

ProjectSession::Known ProjectSession::look(const cookie& item) const {
    EditPtr edit;
    if (const Qx::Status read = readEdit(item, edit); !read) {
        return {{}, read.reason(), false};
    }
    return {edit->getAttribute(LogAttribute::kName), {}, edit->isDropFrame(false)};
}
