// Damage to the files of a project, and what stands in the place of files.

#include "command_runs.h"
#include "torture.h"

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <set>
#include <sys/stat.h>
#include <unistd.h>

namespace torture {

namespace {

namespace fs = std::filesystem;

constexpr uid_t kNobody = 65534;

std::string bytesOf(const fs::path& path) {
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

class Damage {
public:
    explicit Damage(Case& its) : m_case(its), m_place(its.folder() + "/place") {}

    void run() {
        const bool asNobody = ::geteuid() == 0 && m_case.chance(2);
        std::vector<fs::path> files;
        for (const auto& entry : fs::recursive_directory_iterator(m_place.folder() + "/project")) {
            files.push_back(entry.path());
        }
        std::sort(files.begin(), files.end());
        for (size_t i = 1 + m_case.below(3); i > 0; --i) {
            harm(m_case.oneOf(files), files);
        }
        if (asNobody) {
            giveAway();
        }
        const ProjectStates before = m_place.states();
        static const std::vector<std::vector<std::string>> kCommands = {
            {"list"},
            {"show", "$1"},
            {"verify"},
            {"history", "$1"},
            {"header", "$1"},
            {"diff", "$1.U1", "$1"},
            {"export", "$1", "$D/out.edl"},
            {"recover", "$1"},
            {"recover", "$3"},
            {"undo", "$1"},
            {"redo", "$1"},
            {"backup", "$1"},
            {"flush"},
            {"import", "$D/list.edl", "--new-shots"},
            {"apply", "remove", "--to", "$1@0s-1s"},
            {"salvage", "$D/project/P0001000/$1.qme", "--into", "$D/saved"},
            {"delete", "$2"}};
        const size_t commands = 4;
        for (size_t i = 0; i < commands; ++i) {
            const auto& command = m_case.oneOf(kCommands);
            const ProjectStates left = m_place.states();
            const auto strange = strangeFiles();
            const Met met = m_place.run(command);
            m_case.expect(met.result.code >= 0 && met.result.code <= 2,
                          String(command[0]) + " crashes on damaged files",
                          String::format("code %d ", met.result.code) + m_harm +
                              met.result.err.substr(0, 300));
            judge(command, left, met);
            // A backup drops what could be redone, read or not.
            const bool drops = met.result.code == 0 && (command[0] == "backup" || command[0] == "apply");
            if (command[0] != "delete" && command[0] != "flush" && !drops) {
                const auto still = strangeFiles();
                for (const std::string& content : strange) {
                    m_case.expect(still.contains(content),
                                  String(command[0]) + " destroys what does not read",
                                  content.substr(0, 80) + m_harm);
                }
            }
        }
        m_case.tried(commands - 1);
        ::chmod((m_place.folder() + "/project/P0001000").c_str(), 0777);
    }

private:
    /// Every state that reads is still there, under some name.
    void judge(const std::vector<std::string>& command, const ProjectStates& before, const Met& met) {
        const ProjectStates after = m_place.states();
        const bool drops = command[0] == "delete" ||
                           (met.result.code == 0 && (command[0] == "backup" || command[0] == "apply"));
        for (const auto& [path, digest] : before) {
            if (digest != kDamaged && !drops && !holds(after, digest)) {
                m_case.found(String(command[0]) + " loses a state of damaged files",
                             path + "=" + digest + m_harm + " | " + met.result.err.substr(0, 300) +
                                 differenceOf(before, after));
            }
        }
        if (met.result.code == 0 && command.size() > 1 && command[1] == "$1" &&
            (command[0] == "undo" || command[0] == "redo" || command[0] == "recover" ||
             command[0] == "apply")) {
            const auto edit = after.find(Workplace::fileOf(1));
            m_case.expect(edit != after.end() && edit->second != kDamaged,
                          String(command[0]) + " says done and leaves no sound edit",
                          m_harm + differenceOf(before, after));
        }
    }

    /// What stands under the names of edit files and is no sound edit: the bytes of damaged ones, the targets
    /// of links.
    [[nodiscard]] std::set<std::string> strangeFiles() const {
        std::set<std::string> contents;
        std::error_code ignored;
        for (const auto& entry : fs::directory_iterator(m_place.project(), ignored)) {
            const std::string path = entry.path().string();
            if (path.find(".qme") == std::string::npos) {
                continue;
            }
            if (entry.is_symlink(ignored)) {
                contents.insert("a link to " + fs::read_symlink(entry.path(), ignored).string());
            } else if (entry.is_regular_file(ignored) && digestOf(path) == kDamaged) {
                contents.insert("bytes " + bytesOf(entry.path()));
            }
        }
        return contents;
    }

    /// Does something to one file or folder.
    void harm(const fs::path& path, const std::vector<fs::path>& files) {
        std::error_code ignored;
        const fs::file_status status = fs::symlink_status(path, ignored);
        const bool regular = fs::is_regular_file(status);
        size_t kind = m_case.below(12);
        m_harm += String::format(" | harm %zu to ", kind) + path.filename().string();
        std::string bytes = regular ? bytesOf(path) : std::string();
        const fs::path other = m_case.oneOf(files);
        if (!regular && kind < 6) {
            return;
        }
        switch (kind) {
        case 0:
            for (size_t i = 1 + m_case.below(4); i > 0 && !bytes.empty(); --i) {
                bytes[m_case.below(bytes.size())] ^= static_cast<char>(1 + m_case.below(255));
            }
            break;
        case 1:
            bytes.resize(m_case.below(bytes.size() + 1));
            break;
        case 2:
            for (size_t at = m_case.below(bytes.size() + 1), n = m_case.below(5000);
                 n > 0 && at < bytes.size(); --n) {
                bytes[at++] = 0;
            }
            break;
        case 3:
            bytes.append(m_case.below(5000), static_cast<char>(m_case.below(256)));
            break;
        case 4:
            // A length or a count that is huge.
            for (size_t i = 0, at = m_case.below(bytes.size() + 1) & ~size_t{3};
                 i < 4 && at + i < bytes.size(); ++i) {
                bytes[at + i] = static_cast<char>(m_case.chance(4) ? 0x7f : 0xff);
            }
            break;
        case 5:
            bytes = fs::is_regular_file(other) ? bytesOf(other) : "";
            break;
        case 6:
            fs::remove_all(path, ignored);
            fs::create_directories(path / "inside", ignored);
            return;
        case 7:
        case 8:
            fs::remove_all(path, ignored);
            fs::create_symlink(kind == 7 ? path : other, path, ignored);
            return;
        case 9:
            fs::remove_all(path, ignored);
            ::mkfifo(path.c_str(), 0666);
            return;
        case 10:
            ::chmod(path.c_str(), static_cast<mode_t>(m_case.below(8) * 0111));
            return;
        default:
            fs::remove_all(path, ignored);
            return;
        }
        std::ofstream(path, std::ios::binary) << bytes;
    }

    /// Goes on as a user whom permissions hold: the superuser is refused nothing.
    void giveAway() {
        std::error_code ignored;
        for (const auto& entry : fs::recursive_directory_iterator(
                 m_case.folder(), fs::directory_options::skip_permission_denied, ignored)) {
            static_cast<void>(!::lchown(entry.path().c_str(), kNobody, kNobody));
        }
        for (const std::string& folder : {m_case.folder(), m_place.folder()}) {
            static_cast<void>(!::lchown(folder.c_str(), kNobody, kNobody));
        }
        m_case.expect(::setgid(kNobody) == 0 && ::setuid(kNobody) == 0, "another user cannot be taken");
    }

    Case& m_case;
    Workplace m_place;
    String m_harm;
};

} // namespace

const Attack kDamage{"damage", "damaged files, and others in their place",
                     [](Case& its) { Damage(its).run(); }, nullptr};

} // namespace torture
