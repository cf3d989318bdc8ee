// A fault, or a signal, at every call that a command of qmedit makes on the files of a project.

#include "command_runs.h"
#include "tests/support/temporary_folder.h"
#include "torture.h"

#include <cerrno>
#include <csignal>
#include <cstring>
#include <map>

namespace torture {

namespace {

struct Command {
    const char* name;
    std::vector<std::string> arguments;
    bool changes;
    int edit; ///< the edit that is changed; 0 for none or fresh ones
};

const std::vector<Command> kCommands = {
    {"import", {"import", "$D/list.edl", "--new-shots"}, true, 0},
    {"apply", {"apply", "remove", "--to", "$1@1s-2s"}, true, 1},
    {"backup", {"backup", "$1"}, true, 1},
    {"undo", {"undo", "$1"}, true, 1},
    {"redo", {"redo", "$1"}, true, 1},
    {"recover", {"recover", "$3"}, true, 0},
    {"delete", {"delete", "$2", "--force"}, true, 0},
    {"salvage", {"salvage", "$D/project/P0001000/$3.qme", "--into", "$D/project"}, true, 0},
    {"flush", {"flush"}, true, 1},
    {"apply-source", {"apply", "insert", "--from", "$2@1s-3s", "--to", "$1@1s"}, true, 1},
    {"export", {"export", "$1", "$D/out.edl"}, false, 0},
    {"list", {"list"}, false, 0},
    {"show", {"show", "$1", "--json"}, false, 0},
    {"header", {"header", "$1"}, false, 0},
    {"history", {"history", "$1", "--json"}, false, 0},
    {"diff", {"diff", "$1.U1", "$1"}, false, 0},
    {"verify", {"verify", "$1", "$2"}, false, 0},
};

struct Fault {
    const char* name;
    int error;
    const char* mode;
};

constexpr Fault kFaultKinds[] = {
    {"EIO", EIO, "one"},          {"ENOSPC", ENOSPC, "one"},      {"EDQUOT", EDQUOT, "one"},
    {"EACCES", EACCES, "one"},    {"ESTALE", ESTALE, "one"},      {"EINTR", EINTR, "one"},
    {"ENOMEM", ENOMEM, "one"},    {"EMFILE", EMFILE, "one"},      {"EROFS", EROFS, "one"},
    {"a dead disk", EIO, "rest"}, {"a full disk", ENOSPC, "full"}};
constexpr int kSignals[] = {SIGINT, SIGTERM, SIGHUP, SIGKILL};

/// The number of a case: the command, what it meets, and at which call, in decimal places of their own.
constexpr size_t kCommandPlace = 1000000;
constexpr size_t kKindPlace = 10000;

/// What a command does when nothing meets it.
struct Reference {
    ProjectStates before;
    ProjectStates after;
    String out;
    size_t calls = 0;
};

/// Worked out once, in the process of all cases if that has begun with it.
const Reference& referenceOf(const Command& command) {
    static std::map<std::string, Reference> known;
    const auto [at, isNew] = known.try_emplace(command.name);
    Reference& reference = at->second;
    if (isNew) {
        const test::TemporaryFolder folder;
        const Workplace place(folder.path("place"));
        reference.before = place.states();
        const Met met = place.run(command.arguments);
        if (met.result.code != 0) {
            throw std::runtime_error(String(command.name) +
                                     " fails with nothing in its way: " + met.result.err);
        }
        reference.after = place.states();
        reference.out = met.result.out;
        reference.calls = met.calls;
    }
    return reference;
}

std::vector<size_t> casesWith(size_t kinds) {
    std::vector<size_t> numbers;
    for (size_t i = 0; i < kCommands.size(); ++i) {
        const size_t calls = referenceOf(kCommands[i]).calls;
        for (size_t kind = 0; kind < kinds; ++kind) {
            for (size_t at = 1; at <= calls; ++at) {
                numbers.push_back(kCommandPlace * (i + 1) + kKindPlace * kind + at);
            }
        }
        if (kinds == std::size(kFaultKinds)) {
            numbers.push_back(kCommandPlace * (i + 1) + kKindPlace * kinds + 1);
        }
    }
    return numbers;
}

/// Compares what a command left with what was there and with what it leaves when all goes well.
class Judge {
public:
    Judge(Case& its, const Command& command, const Workplace& place, const Reference& reference, String what,
          int error, int failure, bool away)
        : m_case(its), m_command(command), m_place(place), m_reference(reference), m_what(std::move(what)),
          m_cause(::strerror(error)), m_failure(failure), m_mayBeAway(away) {}

    void judge(const Met& met) {
        m_words = met.result.err;
        const ProjectStates found = m_place.states();
        // What was promised with exit code 0 is there, the rest of the project is as it was.
        if (met.result.code == 0) {
            // A refusal that stands in the answer itself, as in a list's row, tells too.
            const bool told = !met.result.err.empty() || met.result.out.find(m_cause) != String::npos;
            m_case.expect(found == m_reference.after || (!m_command.changes && found == m_reference.before) ||
                              isLeftAsTold(found, met),
                          kind("says done, and it is not"), differenceOf(m_reference.after, found) + words());
            if (!m_command.changes && !told) {
                m_case.expect(met.result.out == m_reference.out, kind("answers wrongly without a word"),
                              met.result.out.substr(0, 400));
            }
            return;
        }
        m_case.expect(met.result.code >= 1000 || !(met.result.err + met.result.out).empty(),
                      kind("fails without a word"));
        m_case.expect(met.result.code == m_failure || met.result.code == 1 || met.result.code >= 1000,
                      kind("has another exit code than those that are told of"),
                      String::format("%d", met.result.code) + words());
        m_case.expect(met.result.err.find(".tmp") == String::npos, kind("names a temporary file"), words());
        if (found != m_reference.after) {
            judgeUnfinished(found);
        } else if (m_command.edit != 0 && m_reference.after != m_reference.before && met.result.code == 1) {
            m_case.expect(met.result.err.find(Workplace::cookieOf(m_command.edit)) != String::npos,
                          kind("fails, and does not say that the edit was changed"), words());
        }
    }

    /// The same command again, with nothing in its way.
    void judgeAgain(const ProjectStates& left) {
        if (m_command.changes && left != m_reference.before) {
            return;
        }
        const Met again = m_place.run(m_command.arguments);
        const ProjectStates found = m_place.states();
        // The cookies that were taken for fresh edits need not be the same.
        const bool makes = m_command.edit == 0 && m_reference.after.size() > m_reference.before.size();
        const bool done = makes ? found.size() == m_reference.after.size() : found == m_reference.after;
        m_case.expect(again.result.code == 0 && done &&
                          (m_command.changes || again.result.out == m_reference.out),
                      kind("does not work afterwards"),
                      String::format("code %d %s", again.result.code, again.result.err.c_str()) +
                          differenceOf(m_reference.after, found) + words());
    }

    /// The readers find the edits, wherever their files are at the moment.
    void judgeReaders() {
        for (const int edit : {1, 2}) {
            const bool deleted = String(m_command.name) == "delete" && edit == 2;
            const Met shown = m_place.run({"show", "$" + std::to_string(edit)});
            m_case.expect(shown.result.code == 0 || deleted, kind("leaves an edit that is not shown"),
                          shown.result.err);
        }
    }

private:
    /// The clipboard may stay behind its edit, and a deletion that was told to go on may make no milestone,
    /// when the command says so.
    [[nodiscard]] bool isLeftAsTold(const ProjectStates& found, const Met& met) const {
        const String words = met.result.out + met.result.err;
        const auto differOnlyIn = [&](const char* names) {
            const auto others = [names](ProjectStates states) {
                std::erase_if(states, [names](const auto& state) { return state.first.starts_with(names); });
                return states;
            };
            return others(found) == others(m_reference.after);
        };
        return (words.find("E00050HZ") != String::npos && differOnlyIn("E00050HZ")) ||
               (words.find("no milestone of") != String::npos && differOnlyIn("Milestones/"));
    }

    void judgeUnfinished(const ProjectStates& found) {
        const String difference = differenceOf(m_reference.before, found) + words();
        for (const auto& [path, digest] : m_reference.before) {
            const auto there = found.find(path);
            const auto expected = m_reference.after.find(path);
            const bool stays = expected != m_reference.after.end();
            const bool isEdit = path.ends_with(".qme");
            if (isEdit && stays && there == found.end() && !m_mayBeAway) {
                m_case.found(kind("leaves no file under the edit's name"), difference);
            }
            if (there != found.end() && isEdit && there->second != digest &&
                !(stays && there->second == expected->second)) {
                m_case.found(kind("leaves the edit in a state that it never had"), difference);
            }
            // A revision may go only when the command got as far as the state in which it is gone.
            const bool goes = !holds(m_reference.after, digest);
            const bool got = m_command.edit != 0 && reached(found);
            const bool mayGo = goes && (got || m_command.edit == 0 || m_mayBeAway);
            if (!holds(found, digest) && digest != kDamaged && !mayGo) {
                m_case.found(kind(goes ? "fails and drops what could be redone" : "loses a revision"),
                             digest + difference);
            }
        }
        for (const auto& [path, digest] : found) {
            const bool isNew = !m_reference.before.contains(path);
            if (isNew && digest == kDamaged && m_reference.after.count(path) == 0 &&
                path.find("CORRUPT") == std::string::npos) {
                m_case.found(kind("leaves a damaged file"), path + difference);
            }
            if (isNew && path.find("CORRUPT") != std::string::npos && digest != kDamaged) {
                m_case.found(kind("sets a sound file aside"), path + difference);
            }
            if (isNew && !m_mayBeAway && path.ends_with(".qme") && !holds(m_reference.before, digest)) {
                m_case.found(kind("fails and leaves edit files"), path + difference);
            }
        }
    }

    /// True if the edit's file has become what the command makes of it.
    [[nodiscard]] bool reached(const ProjectStates& found) const {
        const std::string file = Workplace::fileOf(m_command.edit);
        const auto there = found.find(file);
        const auto before = m_reference.before.find(file);
        return there != found.end() && before != m_reference.before.end() && there->second != before->second;
    }

    [[nodiscard]] String kind(const char* what) const { return String(m_command.name) + " " + what; }
    [[nodiscard]] String words() const { return " | " + m_what + " | " + m_words.substr(0, 300); }

    Case& m_case;
    const Command& m_command;
    const Workplace& m_place;
    const Reference& m_reference;
    String m_what;
    String m_cause;
    String m_words;
    int m_failure; ///< the exit code of a command that did not come to its end
    bool m_mayBeAway;
};

const Command& commandOf(const Case& its) {
    return kCommands[std::min(its.number() / kCommandPlace, kCommands.size()) - 1];
}

void runFault(Case& its) {
    const Command& command = commandOf(its);
    // The kind after the last is a standard output that takes nothing.
    const size_t number = its.number() % kCommandPlace / kKindPlace;
    const bool outputFull = number >= std::size(kFaultKinds);
    const Fault fault = outputFull ? Fault{"a full standard output", 0, "one"} : kFaultKinds[number];
    const Reference& reference = referenceOf(command);
    const Workplace place(its.folder() + "/place");
    const Interference interference{outputFull ? 0 : its.number() % kKindPlace, fault.error, 0, fault.mode,
                                    outputFull};
    const Met met = place.run(command.arguments, interference);
    if (met.call.empty() && !outputFull) {
        return; // The command came to its end before.
    }
    // With a disk that does nothing any more nothing can be put back.
    const bool dead = fault.mode[0] == 'r';
    Judge judge(its, command, place, reference, String(fault.name) + (outputFull ? "" : " from ") + met.call,
                fault.error, 1, dead);
    judge.judge(met);
    const ProjectStates left = place.states();
    judge.judgeReaders();
    judge.judgeAgain(left);
    const bool cannotClean = dead || met.call.starts_with("unlink");
    its.expect(cannotClean || numTemporaries(place.folder()) == 0,
               String(command.name) + " leaves temporary files", met.call);
}

void runInterrupt(Case& its) {
    const Command& command = commandOf(its);
    const int signal = kSignals[std::min(its.number() % kCommandPlace / kKindPlace, std::size(kSignals) - 1)];
    const Reference& reference = referenceOf(command);
    const Workplace place(its.folder() + "/place");
    const Met met = place.run(command.arguments, {its.number() % kKindPlace, 0, signal, "one", false});
    if (met.call.empty()) {
        return;
    }
    const bool killed = signal == SIGKILL;
    Judge judge(its, command, place, reference, String(::strsignal(signal)) + " before " + met.call, 0,
                128 + signal, killed);
    judge.judge(met);
    judge.judgeReaders();
    its.expect(killed || numTemporaries(place.folder()) == 0,
               String(command.name) + " leaves temporary files when interrupted", met.call);
    judge.judgeAgain(place.states());
}

} // namespace

const Attack kFaults{"faults", "a fault at every call of every command, with every error",
                     runFault, [] { return casesWith(std::size(kFaultKinds)); },
                     20,       4};
const Attack kInterrupts{"interrupts", "Ctrl-C and its like at every call of every command",
                         runInterrupt, [] { return casesWith(std::size(kSignals)); },
                         20,           2};

} // namespace torture
