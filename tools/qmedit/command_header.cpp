#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/edit_json.h"
#include "tools/qmedit/project_session.h"
#include "tools/qmedit/safe_text.h"
#include "tools/qmedit/value_text.h"

#include <algorithm>
#include <memory>

namespace {

struct HeaderOptions {
    std::string item;
    std::string key;
    String project;
    bool json = false;
};

String headerTable(const configb& header, const std::vector<String>& keys, const Console& console) {
    int width = 0;
    for (const String& key : keys) {
        width = std::max(width, safe_text::columns(console.safe(key)));
    }
    String out;
    for (const String& key : keys) {
        const configb::Value* value = header.find(key);
        out += console.inked(Console::Ink::Bold,
                             safe_text::padded(console.safe(key), width, console.ellipsis()));
        out += "  " + (value != nullptr ? valueText(*value, console) : String()) + "\n";
    }
    return out;
}

int runHeader(const HeaderOptions& options) {
    cookie item;
    ProjectSession session(options.project);
    if (const Qx::Status opened = session.openExisting(); !opened) {
        return failed(opened);
    }
    if (const Qx::Status found = session.findItem(options.item, item); !found) {
        return failed(found);
    }
    EditPtr edit;
    if (const Qx::Status read = session.readEdit(item, edit); !read) {
        return failed(read);
    }
    const configb& header = std::as_const(*edit).Opts();
    std::vector<String> keys = header.keys();
    if (!options.key.empty()) {
        if (!header.contains(options.key)) {
            return failed(Qx::Status::failure("the header of " + item.asString() + " has no key '" +
                                              options.key + "'; 'qmedit header " + item.asString() +
                                              "' shows those it has"));
        }
        std::erase_if(keys, [&](const String& key) { return !String::equalNoCase(key, options.key); });
    }
    const Console console = Console::forStandardOutput();
    if (options.json) {
        writeOut(headerJson(header, keys));
    } else if (!options.key.empty()) {
        writeOut(valueText(*header.find(options.key), console) + "\n");
    } else {
        writeOut(headerTable(header, keys, console));
    }
    return kDone;
}

} // namespace

Command headerCommand() {
    const auto options = std::make_shared<HeaderOptions>();
    return {"header",
            "Show the header properties of an edit, or one of them",
            {cookieOption(options->item),
             {.name = "KEY",
              .value = &options->key,
              .help = "Only this property, its value alone (in any case)",
              .completes = Completes::HeaderKeys},
             projectOption(options->project),
             jsonOption(options->json, "Write JSON: an object of the properties")},
            "Example:\n  qmedit header E0001000 FRAME_RATE",
            [options] { return runHeader(*options); }};
}
