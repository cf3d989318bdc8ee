#include "tools/qmedit/column_table.h"
#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/log_json.h"
#include "tools/qmedit/managed_edit.h"

#include "edit/manager/edit_record.h"

#include <algorithm>
#include <memory>

namespace {

struct LogArguments : EditArguments {
    std::vector<std::string> set;
    bool json = false;
};

/// Every attribute of an edit that says something, from the edit itself or from the record that it gives.
LogAttributes::Map attributesOf(const Edit& edit) {
    const projdb::Record record = editRecordOf(edit, nullptr);
    LogAttributes::Map map;
    for (uint32_t number = LogAttributes::kFirst; number <= LogAttributes::kLast; ++number) {
        const LogAttribute attribute{number};
        String text = edit.getAttribute(attribute);
        const char* const field = LogAttributes::getProjDBFieldNameForAttrib(attribute);
        for (int i = 0; field != nullptr && text.empty() && i < projdb::kNumColumns; ++i) {
            const auto column = static_cast<projdb::Column>(i);
            if (String::equalNoCase(projdb::columnName(column), field)) {
                text = record[column];
            }
        }
        if (!text.empty()) {
            map.add(attribute, text);
        }
    }
    return map;
}

String logTable(const LogAttributes::Map& attributes, const Console& console) {
    constexpr bool rightAligned[] = {false, false};
    ColumnTable table({"attribute", "text"}, rightAligned);
    for (const auto& [attribute, text] : attributes) {
        table.add({LogAttributes::getPersistableString(attribute), console.safe(text)}, Console::Ink::None);
    }
    return table.text(console, true);
}

/// Reads "scene=12A". False, with a report, for what is no attribute that users may change.
bool readSetting(const std::string& word, LogAttributes::Map& settings) {
    const size_t sign = word.find('=');
    const String name(word.substr(0, sign));
    String blanks = name;
    std::replace(blanks.begin(), blanks.end(), '_', ' ');
    LogAttribute attribute = LogAttributes::getFromPersistableString(name);
    if (attribute == LogAttribute::kNoAttribute) {
        attribute = LogAttributes::getFromPersistableString(blanks);
    }
    if (sign == std::string::npos || !LogAttributes::isUserEditable(attribute)) {
        String known;
        for (uint32_t number = LogAttributes::kFirst; number <= LogAttributes::kLast; ++number) {
            if (LogAttributes::isUserEditable(LogAttribute{number})) {
                known +=
                    (known.empty() ? "" : ", ") + LogAttributes::getPersistableString(LogAttribute{number});
            }
        }
        reportError("'" + word + "' sets no attribute; write NAME=TEXT with one of " + known);
        return false;
    }
    settings.add(attribute, String(word.substr(sign + 1)));
    return true;
}

/// Changes the attributes in the file, whose state before becomes an undo backup.
int setLog(const LogArguments& arguments, const LogAttributes::Map& settings) {
    ManagedEdit managed(arguments);
    if (const int code = managed.prepare(); code != kDone) {
        return code;
    }
    EditPtr edit;
    if (!managed.open(edit)) {
        return kFailed;
    }
    const cookie item = managed.item();
    const String nothing = "nothing was changed: ";
    LogAttributes::Map changed;
    for (const auto& [attribute, text] : settings) {
        if (edit->getAttribute(attribute) != text) {
            changed.add(attribute, text);
        }
    }
    if (changed.empty()) {
        writeOut(item.asString() + ": its log says that already\n");
        return kDone;
    }
    // A copy shows whether the texts are taken, before any file is moved.
    if (!edit->copy()->setAttributes(changed)) {
        return failed(Qx::Status::failure(nothing + "a reel's name is at most 255 bytes on one line"));
    }
    const std::optional<size_t> numRedo = managed.numRedo();
    if (const Qx::Status kept = managed.change(edit, "the log of " + item.asString() + " was not changed",
                                               [&](Edit& logged) { logged.setAttributes(changed); });
        !kept) {
        return failed(kept);
    }
    writeOut(item.asString() +
             String::format(": %zu attribute%s set", changed.size(), changed.size() == 1 ? "" : "s") +
             undoText(managed, numRedo) + "\n");
    return kDone;
}

int showLog(const LogArguments& arguments) {
    ProjectSession session(arguments.project);
    if (const Qx::Status opened = session.openExisting(); !opened) {
        return failed(opened);
    }
    cookie item;
    if (const Qx::Status found = session.findItem(arguments.item, item); !found) {
        return failed(found);
    }
    EditPtr edit;
    if (const Qx::Status read = session.readEdit(item, edit); !read) {
        return failed(read);
    }
    const LogAttributes::Map attributes = attributesOf(*edit);
    writeOut(arguments.json ? attributesJson(attributes)
                            : logTable(attributes, Console::forStandardOutput()));
    return kDone;
}

int runLog(const LogArguments& arguments) {
    LogAttributes::Map settings;
    for (const std::string& word : arguments.set) {
        if (!readSetting(word, settings)) {
            return kWrongUsage;
        }
    }
    return settings.empty() ? showLog(arguments) : setLog(arguments, settings);
}

} // namespace

Command logCommand() {
    const auto arguments = std::make_shared<LogArguments>();
    return {"log",
            "Show what is logged of a shot or an edit, or change it",
            {cookieOption(arguments->item),
             {.name = "--set",
              .value = &arguments->set,
              .help = "Set these attributes, all or none",
              .form = "NAME=TEXT"},
             projectOption(arguments->project),
             jsonOption(arguments->json, "Write JSON: an object of the attributes")},
            "Example:\n  qmedit log E0001000 --set scene=12A 'description=the ship leaves'\n\n"
            "The state before is kept as an undo backup.",
            [arguments] { return runLog(*arguments); }};
}
