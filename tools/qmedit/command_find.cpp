#include "tools/qmedit/column_table.h"
#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/log_json.h"
#include "tools/qmedit/project_session.h"

#include "platform/services/files.h"

#include <memory>

namespace {

struct FindArguments {
    std::vector<std::string> conditions;
    String project;
    bool json = false;
};

String foundTable(const std::vector<FoundEdit>& found, const Console& console) {
    constexpr bool rightAligned[] = {false, false, false, false, false, false, false};
    ColumnTable table({"cookie", "type", "scene", "shot", "reel", "date", "name"}, rightAligned);
    for (const FoundEdit& edit : found) {
        std::vector<String> row{edit.item.asString()};
        for (const projdb::Column column :
             {projdb::Type, projdb::Scene, projdb::Shot, projdb::Reel, projdb::Date, projdb::Name}) {
            row.push_back(edit.record[column].empty() ? String("-") : console.safe(edit.record[column]));
        }
        table.add(std::move(row), Console::Ink::None);
    }
    return table.text(console, true);
}

int runFind(const FindArguments& arguments) {
    ProjectSession session(arguments.project);
    if (const Qx::Status opened = session.openExisting(); !opened) {
        return failed(opened);
    }
    const bool hasRecord = Qx::askFile(Qx::joinPath(session.folder(), projdb::kFileName)).isRegular();
    session.manage();
    const projdb* const records = edit_manager::get_projdb();
    if (records != nullptr && (!hasRecord || records->isNew()) && !edit_manager::update_projdb()) {
        return failed(Qx::Status::failure("the project's record could not be made; see whether " +
                                          session.folder() + " can be written"));
    }
    std::vector<FoundEdit> found;
    const std::vector<String> conditions(arguments.conditions.begin(), arguments.conditions.end());
    if (const Qx::Status looked = findEdits(conditions, found); !looked) {
        reportError(looked.reason());
        return looked.code() == Qx::StatusCode::BadArgument ? kWrongUsage : kFailed;
    }
    writeOut(arguments.json ? foundJson(found) : foundTable(found, Console::forStandardOutput()));
    return kDone;
}

} // namespace

Command findCommand() {
    const auto arguments = std::make_shared<FindArguments>();
    return {
        "find",
        "Find shots and edits by what is logged of them",
        {{.name = "NAME=PATTERN",
          .value = &arguments->conditions,
          .help = "What must hold, each: * is any text, ? any character, in any case",
          .required = true},
         projectOption(arguments->project),
         jsonOption(arguments->json, "Write JSON: an array of objects")},
        "Example:\n  qmedit find scene=12 'reel=A*' type=shot\n\n"
        "The answer comes from the project's record alone and is as old as that; 'qmedit flush' brings it "
        "up to date. A name is one that 'qmedit log' shows, or a column of the record.",
        [arguments] { return runFind(*arguments); }};
}
