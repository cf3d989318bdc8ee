// Several processes on one project: qmedit and programs with a manager of their own, some of which are
// killed.

#include "command_runs.h"
#include "torture.h"

#include "edit/manager/edit_manager.h"
#include "edit/manager/edit_manager_lock.h"
#include "platform/services/current_project.h"

#include <atomic>
#include <csignal>
#include <mutex>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>

namespace torture {

namespace {

/// A program that opens, changes and writes the first edit again and again under the writers' lock, as a
/// command-line tool of somebody else does. It never ends: it is killed.
[[noreturn]] void writeForEver(const Workplace& place, int number) {
    Qx::CurrentProject project;
    project.rootFolder = place.folder() + "/project";
    project.user = "anna";
    Qx::setCurrentProject(project);
    const cookie item(Workplace::cookieOf(1).c_str());
    for (int i = 0;; ++i) {
        EditManagerLock lock;
        if (!lock.take(true)) {
            continue;
        }
        new edit_manager;
        {
            const EditPtr edit(item, eOpenExisting);
            if (edit.valid()) {
                if (i % 3 == 0) {
                    static_cast<void>(edit_manager::backup_edit(item).isOk());
                }
                edit->setName(String::format("writer %d", number));
            }
        }
        static_cast<void>(edit_manager::flush_changes());
        edit_manager::theEditManager(nullptr);
    }
}

class Crowd {
public:
    explicit Crowd(Case& its) : m_case(its), m_place(its.folder() + "/place"), m_before(m_place.states()) {}

    void run() {
        // Forked before there are threads.
        const int writers = static_cast<int>(1 + m_case.below(2));
        for (int i = 0; i < writers; ++i) {
            m_writers.push_back(startWriter());
        }
        const size_t rounds = 12;
        std::vector<std::vector<std::string>> plans[3];
        static const std::vector<std::vector<std::string>> kReaders = {
            {"show", "$1"},   {"list"},       {"verify", "$1", "$2"},        {"history", "$1"},
            {"header", "$1"}, {"show", "$2"}, {"export", "$1", "$D/out.edl"}};
        static const std::vector<std::vector<std::string>> kWriters = {
            {"apply", "remove", "--to", "$1@0s-0.04s"},
            {"backup", "$1"},
            {"undo", "$1"},
            {"redo", "$1"},
            {"flush"},
            {"import", "$D/list.edl", "--new-shots"}};
        for (size_t i = 0; i < rounds; ++i) {
            plans[0].push_back(m_case.oneOf(kReaders));
            plans[1].push_back(m_case.oneOf(kReaders));
            plans[2].push_back(m_case.oneOf(kWriters));
        }
        std::vector<std::thread> threads;
        for (const auto& plan : plans) {
            threads.emplace_back([this, &plan, readers = &plan != &plans[2]] { follow(plan, readers); });
        }
        for (std::thread& thread : threads) {
            thread.join();
        }
        for (const pid_t writer : m_writers) {
            ::kill(writer, SIGKILL);
            ::waitpid(writer, nullptr, 0);
        }
        judge();
        m_case.tried(3 * rounds);
    }

private:
    pid_t startWriter() {
        const pid_t writer = ::fork();
        if (writer == 0) {
            writeForEver(m_place, ++m_number);
        }
        ++m_number;
        return writer;
    }

    void follow(const std::vector<std::vector<std::string>>& plan, bool readers) {
        for (const auto& arguments : plan) {
            const Met met = m_place.run(arguments);
            const std::lock_guard hold(m_mutex);
            // What changes may be refused: another holds the lock, or there is nothing to undo.
            if (met.result.code > 2 || (readers && met.result.code != 0)) {
                m_case.found(String(arguments[0]) + " fails beside writers",
                             String::format("code %d: ", met.result.code) + met.result.err.substr(0, 400) +
                                 met.result.out.substr(0, 400));
            }
            if (readers && arguments[0] == "list" && met.result.out.find("REEL 1") == String::npos &&
                met.result.out.find("writer") == String::npos) {
                m_case.found("list leaves an edit out beside writers", met.result.out.substr(0, 800));
            }
            // A writer dies now and then, wherever it is.
            if (!readers && !m_writers.empty() && arguments[0] == "flush") {
                ::kill(m_writers.back(), SIGKILL);
                ::waitpid(m_writers.back(), nullptr, 0);
                m_writers.pop_back();
            }
        }
    }

    void judge() {
        const Met shown = m_place.run({"show", "$1"});
        m_case.expect(shown.result.code == 0, "the edit is not shown after writers were killed",
                      shown.result.err);
        for (const auto& [path, digest] : m_place.states()) {
            const bool known = holds(m_before, digest);
            const bool written =
                digest.starts_with("writer ") || digest.starts_with("REEL 1") || digest.starts_with("FRESH");
            const bool shot = path.find(Workplace::cookieOf(1)) == std::string::npos;
            m_case.expect(known || written || (shot && digest != kDamaged), "a file holds what nobody wrote",
                          path + "=" + digest);
            m_case.expect(path.find("CORRUPT") == std::string::npos, "a file is set aside beside writers",
                          path + "=" + digest);
        }
        for (const auto& [path, digest] : m_before) {
            // The clipboard changes with every operation.
            const bool others = path.find(Workplace::cookieOf(1)) == std::string::npos &&
                                path.find("0HZ") == std::string::npos;
            m_case.expect(!others || digest == kDamaged || digestOf(m_place.project() + "/" + path) == digest,
                          "an edit that nobody changes is another", path);
        }
    }

    Case& m_case;
    Workplace m_place;
    ProjectStates m_before;
    std::vector<pid_t> m_writers;
    int m_number = 0;
    std::mutex m_mutex;
};

} // namespace

const Attack kProcesses{"processes", "many processes on one project, some of them killed",
                        [](Case& its) { Crowd(its).run(); }, nullptr, 60};

} // namespace torture
