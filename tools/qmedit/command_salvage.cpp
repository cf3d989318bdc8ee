#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/edit_json.h"
#include "tools/qmedit/interrupts.h"
#include "tools/qmedit/project_session.h"

#include "edit/persist/edit_salvage.h"
#include "interchange/import.h"
#include "platform/services/current_project.h"

#include <memory>

namespace {

struct SalvageArguments {
    std::string file;
    String into;
    bool json = false;
};

int runSalvage(const SalvageArguments& arguments) {
    ProjectSession session(arguments.into);
    if (const Qx::Status prepared = session.prepare({}); !prepared) {
        return failed(prepared);
    }
    EditPtr edit;
    std::vector<String> lost;
    if (const Qx::Status salvaged = salvageEdit(arguments.file, edit, lost); !salvaged) {
        return failed(Qx::Status::failure("nothing could be salvaged: " + salvaged.reason()));
    }
    // A fresh project takes the edit's rate.
    if (const Qx::Status prepared = session.prepare(edit->getFrameRate()); !prepared) {
        return failed(prepared);
    }
    const interrupts::Hold hold(true);
    if (const Qx::Status created = session.create(); !created) {
        return failed(created);
    }
    edit->set_cookie(interchange::provisionalCookie(0));
    edit->Opts().setCookie("PROJECT_COOKIE", Qx::currentProject().project);
    edit->init_dirty();
    interchange::Import made;
    made.sequence = edit;
    if (const Qx::Status saved = interchange::saveImport(made); !saved) {
        return failed(saved);
    }
    const cookie item = edit->get_cookie();
    if (arguments.json) {
        writeOut(salvageJson(item, *edit, lost));
        return kDone;
    }
    for (const String& line : lost) {
        reportProgress("lost: " + line);
    }
    writeOut(item.asString() + "\n");
    return kDone;
}

} // namespace

Command salvageCommand() {
    const auto arguments = std::make_shared<SalvageArguments>();
    return {"salvage",
            "Save what is sound of a damaged edit file as an edit of its own",
            {{.name = "FILE",
              .value = &arguments->file,
              .help = "The damaged file, under any name; it is not changed",
              .required = true,
              .completes = Completes::Files},
             {.name = "--into",
              .value = &arguments->into,
              .help = "The project that the edit is saved to, made if it is not there",
              .form = "DIR",
              .required = true,
              .check = checkFolder,
              .completes = Completes::Folders},
             jsonOption(arguments->json, "Write JSON: an object with the cookie and what is lost")},
            "Example:\n  qmedit salvage E0001000.qme --into ~/rescue\n\n"
            "The last line on standard output is the edit's cookie in DIR; what is lost goes to standard "
            "error, a line each.",
            [arguments] { return runSalvage(*arguments); }};
}
