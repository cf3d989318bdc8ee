#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/edit_json.h"
#include "tools/qmedit/import_source.h"
#include "tools/qmedit/interrupts.h"
#include "tools/qmedit/project_session.h"

#include "interchange/edl/edl_import.h"
#include "interchange/legacy_text.h"
#include "platform/services/files.h"

#include <memory>
#include <unordered_map>

namespace {

bool isLegacyText(const String& file) {
    return String::equalNoCase(Qx::extensionOf(Qx::fileNameOf(file)), ".ed2");
}

/// What became of one file.
struct Imported {
    String file;
    cookie item;
    String name;
    size_t shots = 0;
    size_t reused = 0;
    interchange::LossReport report;
    Qx::Status status;
};

/// The shots of a project by their names, looked up once and brought up to date by what is imported.
class KnownShots {
public:
    explicit KnownShots(ProjectSession& session) : m_session(session) {}

    std::vector<EditPtr> named(const String& name) {
        if (!m_isListed) {
            list();
        }
        std::vector<EditPtr> shots;
        for (const cookie& item : m_byName[name]) {
            EditPtr shot;
            if (m_session.readEdit(item, shot)) {
                shots.push_back(shot);
            }
        }
        return shots;
    }
    void add(const interchange::Import& import) {
        for (const EditPtr& shot : import.shots) {
            m_byName[shot->getName()].push_back(shot->get_cookie());
        }
    }

private:
    void list() {
        m_isListed = true;
        m_byName.clear();
        std::vector<ListedEdit> edits;
        std::vector<String> others;
        // Where the project cannot be listed its shots are not known, and others are made.
        if (m_session.exists() && m_session.list(edits, others)) {
            for (const ListedEdit& edit : edits) {
                if (edit.type == "shot" && edit.damage.empty()) {
                    m_byName[edit.name].push_back(edit.item);
                }
            }
        }
    }

    ProjectSession& m_session;
    std::unordered_map<std::string, std::vector<cookie>> m_byName;
    bool m_isListed = false;
};

Qx::Status readList(const String& file, bool isStandardInput, const interchange::ImportOptions& options,
                    interchange::Import& import) {
    if (!isStandardInput) {
        return interchange::importEdl(file, options, import);
    }
    String text;
    if (Qx::Status read = readStandardInput(file, interchange::kMaxEdlBytes, text); !read) {
        return read;
    }
    import.report.setFile(file);
    interchange::EdlList list;
    const auto bad = options.skipBad ? interchange::BadLines::Skip : interchange::BadLines::Refuse;
    Qx::Status status = interchange::readEdl(text, options.rate, list, import.report, bad);
    return status ? interchange::importEdlList(list, file, options, import) : status;
}

Qx::Status readSource(const String& file, bool isStandardInput, const ImportOptions& options,
                      interchange::Import& import) {
    if (isLegacyText(file)) {
        if (!options.rate.empty()) {
            return Qx::Status::failure(file + ": legacy text states its frame rate; leave out --rate");
        }
        return interchange::importLegacyText(file, import);
    }
    const Qx::FrameRate rate = Qx::FrameRate::fromString(options.rate);
    interchange::ImportOptions importing;
    importing.rate = rate.valid() ? rate : Qx::projectFrameRate();
    importing.strict = options.strict;
    importing.skipBad = options.skipBad;
    return readList(file, isStandardInput, importing, import);
}

/// Writes what was read, with the progress on a terminal.
Qx::Status save(ProjectSession& session, const ImportOptions& options, KnownShots& known,
                interchange::Import& import, Imported& result) {
    const interrupts::Hold hold(true);
    if (Qx::Status created = session.create(); !created) {
        return created;
    }
    if (!options.newShots) {
        result.reused =
            interchange::reuseShots(import, [&known](const String& name) { return known.named(name); });
    }
    const size_t edits = import.shots.size() + 1;
    size_t asked = 0;
    const auto cancelled = [&] {
        constexpr size_t kStep = 50;
        if (asked % kStep == 0 && edits > kStep) {
            showProgress(result.file + String::format(": writing %zu of %zu edits", asked, edits));
        }
        ++asked;
        return interrupts::noted();
    };
    Qx::Status saved = interchange::saveImport(import, cancelled);
    showProgress("");
    return saved;
}

Qx::Status importOne(ProjectSession& session, const ImportOptions& options, KnownShots& known,
                     Imported& result) {
    const bool isStandardInput = result.file == "-";
    String file = "standard input";
    if (!isStandardInput) {
        if (Qx::Status checked = checkImportSource(result.file, file); !checked) {
            return checked;
        }
    }
    if (Qx::Status prepared = session.prepare(Qx::FrameRate::fromString(options.rate)); !prepared) {
        return prepared;
    }
    interchange::Import import;
    Qx::Status read = readSource(file, isStandardInput, options, import);
    result.report = import.report;
    if (!read) {
        return read;
    }
    if (const size_t losses = import.report.losses().size(); options.strict && losses > 0) {
        return Qx::Status::failure(result.file +
                                   String::format(": %zu loss%s", losses, losses == 1 ? "" : "es") +
                                   ", so nothing was imported; without --strict the edit is made all the "
                                   "same");
    }
    // A fresh project takes the rate of the edit, which a legacy text states.
    if (Qx::Status prepared = session.prepare(import.sequence->getFrameRate()); !prepared) {
        return prepared;
    }
    if (Qx::Status saved = save(session, options, known, import, result); !saved) {
        return saved;
    }
    known.add(import);
    result.item = import.sequence->get_cookie();
    result.name = import.sequence->getName();
    result.shots = import.shots.size();
    return {};
}

/// Tells people what became of a file: what was lost or odd, and why it was not imported.
void tell(const Imported& result) {
    // A single bad line is the failure itself.
    const bool onlyError = result.report.errors().size() == 1;
    for (const String& line : onlyError ? std::vector<String>() : result.report.lines()) {
        reportProgress(line);
    }
    if (result.reused > 0 && result.status) {
        reportProgress(result.file +
                       String::format(": %zu shot%s of the project %s played again, %zu %s made",
                                      result.reused, result.reused == 1 ? "" : "s",
                                      result.reused == 1 ? "is" : "are", result.shots,
                                      result.shots == 1 ? "was" : "were"));
    }
}

/// One object a file, on a line of its own.
String importedJson(const std::vector<Imported>& results) {
    String out = "[";
    for (const Imported& result : results) {
        out += (out.size() > 1 ? ",\n  " : "\n  ") +
               reportJson({{"file", result.file},
                           {"cookie", result.status ? result.item.asString() : String()},
                           {"name", result.name},
                           {"problem", result.status.reason()}},
                          {{"shots", result.shots}, {"shots_reused", result.reused}}, result.report);
    }
    return out + "\n]\n";
}

int runImport(const ImportOptions& options, std::vector<Imported>& results) {
    ProjectSession session(options.project);
    KnownShots known(session);
    int code = kDone;
    for (const std::string& file : options.files) {
        Imported& result = results.emplace_back();
        result.file = file;
        result.status = importOne(session, options, known, result);
        if (!options.json) {
            tell(result);
        }
        if (!result.status) {
            const bool canSkip = !options.skipBad && result.report.errors().size() > 1;
            code = failed(canSkip ? Qx::Status::failure(result.status.reason() +
                                                        "; --skip-bad imports the list without them")
                                  : result.status);
        }
        if (interrupts::noted()) {
            break;
        }
    }
    return code;
}

} // namespace

int importFile(const ImportOptions& options, cookie& item) {
    std::vector<Imported> results;
    const int code = runImport(options, results);
    item = results.front().item;
    return code;
}

Command importCommand() {
    const auto options = std::make_shared<ImportOptions>();
    return {
        "import",
        "Make edits of cut lists (CMX 3600 EDL) or of legacy text (.ed2)",
        {{.name = "FILE",
          .value = &options->files,
          .help = "A list: an EDL, or a legacy text by its extension .ed2; '-' is an EDL on standard input",
          .required = true,
          .completes = Completes::Files},
         projectOption(options->project),
         {.name = "--rate",
          .value = &options->rate,
          .help = "Frames a second, which an EDL does not state (else the project's; 25 in a fresh one)",
          .form = "FPS",
          .check = checkRate,
          .completes = Completes::Rates},
         strictOption(options->strict, "Import nothing of a list if anything of it would be lost"),
         {.name = "--skip-bad",
          .value = &options->skipBad,
          .help = "Go on without the lines that cannot be read",
          .excludes = "--strict"},
         {.name = "--new-shots",
          .value = &options->newShots,
          .help = "Make every shot anew, also one that the project has"},
         jsonOption(options->json, "Write JSON: an array of what became of each file")},
        "Example:\n  qmedit import reel2.edl --rate 24 --project ~/feature\n\n"
        "Standard output gets the cookie of each new edit, a line each; what was lost or odd goes to "
        "standard error.",
        [options] {
            std::vector<Imported> results;
            const int code = runImport(*options, results);
            String cookies;
            for (const Imported& result : results) {
                cookies += result.status ? result.item.asString() + "\n" : String();
            }
            writeOut(options->json ? importedJson(results) : cookies);
            return code;
        }};
}
