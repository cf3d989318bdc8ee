#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/edit_json.h"
#include "tools/qmedit/leftovers.h"
#include "tools/qmedit/project_session.h"

#include "edit/persist/edit_salvage.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/files.h"

#include <algorithm>
#include <memory>
#include <optional>
#include <unordered_set>

namespace {

struct VerifyArguments {
    std::vector<std::string> items;
    String project;
    bool json = false;
    bool clean = false;
};

constexpr const char* kMilestones = "Milestones";

/// ".U1", ".R12".
bool isBackupExtension(const String& extension) {
    return extension.size() > 2 && (extension[1] == 'U' || extension[1] == 'R') &&
           extension.find_first_not_of("0123456789", 2) == String::npos;
}

/// The item that a file of the project's folder belongs to; false for a file that is none of an edit's. A
/// file with an edit's extension that is named after no item gives the invalid cookie.
bool itemOfFile(const String& name, cookie& item) {
    const String file = isBackupExtension(Qx::extensionOf(name)) ? Qx::withoutExtension(name) : name;
    if (Qx::extensionOf(file) != getEditFilenameExt()) {
        return false;
    }
    item = cookie(std::string_view(Qx::withoutExtension(file)));
    item = item.isStorable() ? item : invalid_cookie;
    return true;
}

/// The names of a folder; none of one that is not there or is a link.
Qx::Status namesIn(const String& folder, std::vector<String>& names) {
    names.clear();
    const Qx::FileAnswer found = Qx::askFile(folder);
    if (found.isUnknown()) {
        return Qx::Status::failure(found.obstacle().text());
    }
    if (!found.isFolder()) {
        return {};
    }
    const Qx::FileError error = Qx::fileSystem().list(folder, names);
    return error ? Qx::Status::failure(error.text()) : Qx::Status();
}

class Verifying {
public:
    Verifying(String folder, const std::vector<cookie>& items)
        : m_folder(std::move(folder)), m_items(items) {}

    Qx::Status run();
    [[nodiscard]] const std::vector<VerifiedFile>& files() const { return m_files; }
    [[nodiscard]] bool found(const cookie& item) const {
        return std::find(m_found.begin(), m_found.end(), item) != m_found.end();
    }

private:
    Qx::Status addMilestones();
    void add(const cookie& item, const String& name, bool needsItem);

    String m_folder;
    const std::vector<cookie>& m_items;
    std::vector<cookie> m_found;
    std::vector<VerifiedFile> m_files;
};

void Verifying::add(const cookie& item, const String& name, bool needsItem) {
    if (!m_items.empty() && std::find(m_items.begin(), m_items.end(), item) == m_items.end()) {
        return;
    }
    m_found.push_back(item);
    VerifiedFile& file = m_files.emplace_back();
    file.name = name;
    verifyEditFile(Qx::joinPath(m_folder, name), file.faults);
    if (needsItem && !item.is_valid()) {
        file.faults.push_back("its name is not that of an item, so nothing opens it; rename it to a cookie");
    }
}

Qx::Status Verifying::addMilestones() {
    std::vector<String> items;
    if (Qx::Status listed = namesIn(Qx::joinPath(m_folder, kMilestones), items); !listed) {
        return listed;
    }
    for (const String& name : items) {
        const cookie item = cookie(std::string_view(name));
        const String folder = Qx::joinPath(kMilestones, name);
        std::vector<String> copies;
        if (Qx::Status listed = namesIn(Qx::joinPath(m_folder, folder), copies); !listed) {
            return listed;
        }
        for (const String& copy : copies) {
            if (item.isStorable() && copy.starts_with(name + ".")) {
                add(item, Qx::joinPath(folder, copy), false);
            }
        }
    }
    return {};
}

Qx::Status Verifying::run() {
    std::vector<String> names;
    if (const Qx::FileError error = Qx::fileSystem().list(m_folder, names); error) {
        return Qx::Status::failure(error.text());
    }
    for (const String& name : names) {
        if (cookie item; itemOfFile(name, item)) {
            add(item, name, true);
        }
    }
    return addMilestones();
}

/// One line a file.
String verifyTable(const std::vector<VerifiedFile>& files, const Console& console) {
    String out;
    size_t unsound = 0;
    for (const VerifiedFile& file : files) {
        out += console.safe(file.name);
        if (file.faults.empty()) {
            out += "  sound\n";
            continue;
        }
        ++unsound;
        String why;
        for (const String& fault : file.faults) {
            why += (why.empty() ? "" : "; ") + console.safe(fault);
        }
        out += "  " + console.inked(Console::Ink::Error, "NOT SOUND") + ": " + why + "\n";
    }
    return out +
           String::format("%zu file%s, %zu not sound\n", files.size(), files.size() == 1 ? "" : "s", unsound);
}

/// The items that the edits of a project play. Fails when one cannot be read, which may play anything.
Qx::Status findPlayed(ProjectSession& session, std::unordered_set<cookie>& played) {
    std::vector<ListedEdit> edits;
    std::vector<String> others;
    if (Qx::Status listed = session.list(edits, others); !listed) {
        return listed;
    }
    for (const ListedEdit& listed : edits) {
        EditPtr edit;
        if (listed.type == "shot") {
            continue;
        }
        if (Qx::Status read = session.readEdit(listed.item, edit); !read) {
            return read;
        }
        for (const SourceReport& source : reportOf(*edit, {}).sources) {
            played.insert(source.strip);
        }
    }
    return {};
}

/// Tells of what killed programs left, and with `clean` removes it.
Qx::Status tellLeftovers(ProjectSession& session, bool clean) {
    const std::vector<Leftover> leftovers = findLeftovers(session.folder());
    const size_t start = session.folder().size() + 1;
    if (clean) {
        if (Qx::Status locked = session.lockForWriting(); !locked) {
            return locked;
        }
        std::unordered_set<cookie> played;
        std::optional<Qx::Status> looked;
        const auto isPlayed = [&](const cookie& shot) {
            if (!looked) {
                looked = findPlayed(session, played);
            }
            return !*looked || played.contains(shot);
        };
        static_cast<void>(removeAllLeftovers(session.folder(), isPlayed));
    }
    size_t left = 0;
    for (const Leftover& leftover : leftovers) {
        const bool isGone = clean && Qx::askFile(leftover.path).isMissing();
        left += isGone ? 0 : 1;
        reportProgress((isGone ? "removed: " : "left over: ") + leftover.path.substr(start) + ", " +
                       leftover.what);
    }
    if (left > 0 && !clean) {
        reportProgress(String::format("%zu file%s left over by programs that were killed; 'qmedit verify "
                                      "--clean' removes what nothing refers to",
                                      left, left == 1 ? "" : "s"));
    }
    return {};
}

int runVerify(const VerifyArguments& arguments) {
    std::vector<cookie> items;
    for (const std::string& text : arguments.items) {
        if (!readCookie(text, items.emplace_back())) {
            return kWrongUsage;
        }
    }
    ProjectSession session(arguments.project);
    if (const Qx::Status opened = session.openExisting(); !opened) {
        return failed(opened);
    }
    Verifying verifying(session.folder(), items);
    if (const Qx::Status ran = verifying.run(); !ran) {
        return failed(ran);
    }
    if (arguments.json) {
        writeOut(verifyJson(verifying.files()));
    } else {
        writeOut(verifyTable(verifying.files(), Console::forStandardOutput()));
    }
    if (items.empty() || arguments.clean) {
        if (const Qx::Status told = tellLeftovers(session, arguments.clean); !told) {
            return failed(told);
        }
    }
    int code = kDone;
    for (const VerifiedFile& file : verifying.files()) {
        code = file.faults.empty() ? code : static_cast<int>(kFailed);
    }
    for (const cookie& item : items) {
        if (!verifying.found(item)) {
            code = failed(Qx::Status::failure("there is no edit " + item.asString() + " in the project " +
                                              session.root() + "; 'qmedit list' shows those there are"));
        }
    }
    return code;
}

} // namespace

Command verifyCommand() {
    const auto arguments = std::make_shared<VerifyArguments>();
    return {"verify",
            "Check every edit file, backup and milestone of a project",
            {{.name = "COOKIE", .value = &arguments->items, .help = "Only the files of these edits"},
             projectOption(arguments->project),
             jsonOption(arguments->json, "Write JSON: an array of files"),
             {.name = "--clean",
              .value = &arguments->clean,
              .help = "Remove what killed programs left and nothing refers to"}},
            "Example:\n  qmedit verify --project ~/feature\n\n"
            "Nothing is written without --clean. The exit code is 1 if any file is not sound; 'qmedit "
            "salvage' saves what is sound of one. What killed programs left is told of on standard error.",
            [arguments] { return runVerify(*arguments); }};
}
