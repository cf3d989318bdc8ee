#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/edit_json.h"
#include "tools/qmedit/project_session.h"

#include "edit/inspect/usage.h"
#include "edit/inspect/verification.h"
#include "edit/manager/leftovers.h"
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

/// For a person.
const char* leftoverText(Leftover::Kind kind) {
    switch (kind) {
    case Leftover::Temporary:
        return "a temporary file";
    case Leftover::RecoveryCopy:
        return "the copy of a recovery that did not come to its end";
    case Leftover::ImportedShot:
        return "a shot of an import that did not come to its end";
    case Leftover::ImportNote:
        return "the note of an import that did not come to its end";
    }
    return "";
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
        addPlayed(*edit, played);
    }
    return {};
}

/// Tells of what killed programs left, and with `clean` removes it.
Qx::Status tellLeftovers(ProjectSession& session, bool clean) {
    std::vector<Leftover> leftovers;
    const Qx::Status found = findLeftovers(session.folder(), leftovers);
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
        removeAllLeftovers(session.folder(), isPlayed);
    }
    size_t left = 0;
    for (const Leftover& leftover : leftovers) {
        const bool isGone = clean && Qx::askFile(leftover.path).isMissing();
        left += isGone ? 0 : 1;
        reportProgress((isGone ? "removed: " : "left over: ") + leftover.path.substr(start) + ", " +
                       leftoverText(leftover.kind));
    }
    if (left > 0 && !clean) {
        reportProgress(String::format("%zu file%s left over by programs that were killed; 'qmedit verify "
                                      "--clean' removes what nothing refers to",
                                      left, left == 1 ? "" : "s"));
    }
    return found;
}

int runVerify(const VerifyArguments& arguments) {
    ProjectSession session(arguments.project);
    if (const Qx::Status opened = session.openExisting(); !opened) {
        return failed(opened);
    }
    std::vector<cookie> items;
    for (const std::string& text : arguments.items) {
        if (const Qx::Status found = session.findItem(text, items.emplace_back()); !found) {
            return failed(found);
        }
    }
    std::vector<VerifiedFile> files;
    size_t checked = 0;
    const auto checking = [&checked](const String& name) {
        constexpr size_t kStep = 20;
        if (++checked % kStep == 0) {
            showProgress(String::format("checking file %zu, ", checked) + name);
        }
    };
    const Qx::Status verified = verifyProject(session.folder(), items, files, checking);
    showProgress("");
    if (!verified) {
        return failed(verified);
    }
    if (arguments.json) {
        writeOut(verifyJson(files));
    } else {
        writeOut(verifyTable(files, Console::forStandardOutput()));
    }
    if (items.empty() || arguments.clean) {
        if (const Qx::Status told = tellLeftovers(session, arguments.clean); !told) {
            return failed(told);
        }
    }
    int code = kDone;
    for (const VerifiedFile& file : files) {
        code = file.faults.empty() ? code : static_cast<int>(kFailed);
    }
    for (const cookie& item : items) {
        if (std::none_of(files.begin(), files.end(),
                         [&](const VerifiedFile& file) { return file.item == item; })) {
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
            {{.name = "COOKIE",
              .value = &arguments->items,
              .help = "Only the files of these edits",
              .completes = Completes::Items},
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
