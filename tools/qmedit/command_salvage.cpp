#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/edit_json.h"
#include "tools/qmedit/project_session.h"

#include "edit/persist/edit_salvage.h"
#include "interchange/import.h"
#include "platform/services/current_project.h"

#include <CLI/CLI.hpp>

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

void addSalvageCommand(CLI::App& app, CommandWork& work) {
    const auto arguments = std::make_shared<SalvageArguments>();
    CLI::App* command =
        app.add_subcommand("salvage", "Save what is sound of a damaged edit file as an edit of its own");
    command->add_option("FILE", arguments->file, "The damaged file, under any name; it is not changed")
        ->required()
        ->type_name("");
    command
        ->add_option_function<std::string>(
            "--into", [arguments](const std::string& folder) { arguments->into = folder; },
            "The project that the edit is saved to, made if it is not there")
        ->required()
        ->type_name("DIR")
        ->check([](const std::string& folder) {
            return folder.empty() ? std::string("the folder's name is empty") : "";
        });
    command->add_flag("--json", arguments->json, "Write JSON: an object with the cookie and what is lost");
    command->footer(
        "Example:\n  qmedit salvage E0001000.qme --into ~/rescue\n\n"
        "The last line on standard output is the edit's cookie in DIR; what is lost goes to standard "
        "error, a line each.");
    command->callback([arguments, &work] { work = [arguments] { return runSalvage(*arguments); }; });
}
