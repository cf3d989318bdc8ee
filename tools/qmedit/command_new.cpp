#include "tools/qmedit/channel_choice.h"
#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/interrupts.h"
#include "tools/qmedit/project_session.h"

#include "edit/model/edit.h"
#include "edit/model/edit_keys.h"
#include "interchange/import.h"
#include "platform/services/current_project.h"

#include <memory>

namespace {

struct NewArguments {
    std::string name;
    std::string channels = "V1A2";
    String rate;
    String project;
};

int runNew(const NewArguments& arguments) {
    ChannelChoice channels;
    if (const Qx::Status read = ChannelChoice::parse(arguments.channels, channels); !read) {
        reportError(read.reason());
        return kWrongUsage;
    }
    ProjectSession session(arguments.project);
    const Qx::FrameRate rate = Qx::FrameRate::fromString(arguments.rate);
    if (const Qx::Status prepared = session.prepare(rate); !prepared) {
        return failed(prepared);
    }
    EditPtr edit(new Edit);
    // From the start, so that nothing announces an item that no project has.
    edit->init_dirty();
    edit->setCreationDetails();
    edit->setName(arguments.name);
    edit->setFrameRate(rate.valid() ? rate : Qx::projectFrameRate());
    for (const Edit_Chan_Type type : {VideoChan, AudioChan}) {
        for (int i = 0; i < channels.highest(type); ++i) {
            if (edit->addChan(type) == NO_CHAN) {
                return failed(Qx::Status::failure("an edit cannot have as many channels as " +
                                                  arguments.channels + "; nothing was made"));
            }
        }
    }
    edit->set_cookie(interchange::provisionalCookie(0));
    EditKeys::kProjectCookie.set(edit->Opts(), Qx::currentProject().project);
    edit->resetChangeDescription();
    const interrupts::Hold hold(true);
    if (const Qx::Status created = session.create(); !created) {
        return failed(created);
    }
    interchange::Import made;
    made.sequence = edit;
    if (const Qx::Status saved = interchange::saveImport(made); !saved) {
        return failed(saved);
    }
    writeOut(edit->get_cookie().asString() + "\n");
    return kDone;
}

} // namespace

Command newCommand() {
    const auto arguments = std::make_shared<NewArguments>();
    return {"new",
            "Make an empty edit, and the project if there is none",
            {{.name = "NAME",
              .value = &arguments->name,
              .help = "Its name",
              .required = true,
              .check = checkName},
             projectOption(arguments->project),
             {.name = "--rate",
              .value = &arguments->rate,
              .help = "Frames a second (else the project's; 25 in a fresh one)",
              .form = "FPS",
              .check = checkRate,
              .completes = Completes::Rates},
             {.name = "--channels",
              .value = &arguments->channels,
              .help = "How many channels it has: one of picture and two of sound without",
              .form = "V1A2"}},
            "Example:\n  qmedit new 'Reel 3' --rate 24\n\n"
            "The last line on standard output is the edit's cookie.",
            [arguments] { return runNew(*arguments); }};
}
