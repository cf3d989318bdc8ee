// Runs the attacks: as many cases at a time as there are jobs, the next one of the attack that has had the
// least time so far.

#include "torture.h"
#include "command_runs.h"

#include <algorithm>
#include <chrono>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <map>
#include <sstream>
#include <string_view>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

namespace torture {

Case::Case(uint64_t seed, size_t number, std::string folder, int reportTo)
    : m_number(number), m_folder(std::move(folder)), m_reportTo(reportTo), m_random(seed * 1000003 + number) {
}

void Case::found(const String& kind, const String& seen) {
    std::string line = kind + '\t' + seen;
    line.resize(std::min<size_t>(line.size(), 2000));
    for (char& character : line) {
        character = character != '\t' && (character < ' ' || character > '~') ? ' ' : character;
    }
    line += '\n';
    static_cast<void>(!::write(m_reportTo, line.data(), line.size()));
}

void Case::tried(size_t more) {
    const std::string line = "+" + std::to_string(more) + '\n';
    static_cast<void>(!::write(m_reportTo, line.data(), line.size()));
}

namespace {

using Clock = std::chrono::steady_clock;
namespace fs = std::filesystem;

constexpr const Attack* kAttacks[] = {&kCrashStates, &kReorderedCrashStates,
                                      &kFaults,      &kDisk,
                                      &kAllocations, &kInterrupts,
                                      &kProcesses,   &kThreads,
                                      &kProjects,    &kCels,
                                      &kDamage};

struct Settings {
    double minutes = 5;
    uint64_t seed = 20261121;
    std::string only;
    size_t number = 0; ///< 0 for all cases
    size_t jobs = 2;
    std::string foundFolder = "found";
};

/// One kind of fault and where it was seen first.
struct Finding {
    size_t times = 0;
    size_t number = 0;
    String seen;
};

/// An attack and how far it has come.
struct Progress {
    const Attack* attack = nullptr;
    std::vector<size_t> order; ///< of a finite attack: the numbers in the order in which they are run
    size_t next = 0;
    size_t cases = 0;
    size_t tried = 0;
    double seconds = 0;
    std::map<String, Finding> findings;

    [[nodiscard]] bool exhausted(const Settings& settings) const {
        return settings.number != 0 ? next > 0 : attack->cases != nullptr && next == order.size();
    }
};

/// A case that is running.
struct Running {
    pid_t process = 0;
    Progress* progress = nullptr;
    size_t number = 0;
    std::string folder;
    Clock::time_point began;
    Clock::time_point lastBusy;
    unsigned long long used = 0; ///< processor time, in the system's ticks
};

volatile sig_atomic_t stopAsked = 0;

/// The processor time that a process and the children that it waited for have used; 0 when it is gone.
unsigned long long processorTime(pid_t process) {
    std::ifstream file("/proc/" + std::to_string(process) + "/stat");
    std::string text((std::istreambuf_iterator<char>(file)), {});
    std::istringstream fields(text.substr(std::min(text.size(), text.rfind(')') + 1)));
    std::string skipped;
    unsigned long long sum = 0;
    for (int field = 3; field <= 17 && fields; ++field) {
        if (field < 14) {
            fields >> skipped;
        } else {
            unsigned long long ticks = 0;
            fields >> ticks;
            sum += ticks;
        }
    }
    return sum;
}

class Programme {
public:
    explicit Programme(Settings settings) : m_settings(std::move(settings)) {
        for (const Attack* attack : kAttacks) {
            if (!m_settings.only.empty() && m_settings.only != attack->name) {
                continue;
            }
            m_progress.push_back({attack, {}, 0, 0, 0, 0, {}});
        }
        std::string form = (fs::temp_directory_path() / "quillmarch-torture-XXXXXX").string();
        if (::mkdtemp(form.data()) == nullptr) {
            throw std::runtime_error("cannot make a temporary folder");
        }
        m_root = form;
        // Cases go on as other users.
        fs::permissions(m_root, fs::perms(0755));
    }
    ~Programme() {
        std::error_code ignored;
        fs::remove_all(m_root, ignored);
    }
    Programme(const Programme&) = delete;
    Programme& operator=(const Programme&) = delete;

    [[nodiscard]] bool hasAttacks() const { return !m_progress.empty(); }

    /// True if nothing was found.
    bool run() {
        ::setenv("TMPDIR", m_root.c_str(), 1);
        Workplace::prepare();
        for (Progress& progress : m_progress) {
            if (progress.attack->cases != nullptr && m_settings.number == 0) {
                progress.order = progress.attack->cases();
                std::mt19937_64 random(m_settings.seed);
                std::shuffle(progress.order.begin(), progress.order.end(), random);
            }
        }
        const auto end = Clock::now() + std::chrono::duration_cast<Clock::duration>(
                                            std::chrono::duration<double>(m_settings.minutes * 60));
        auto nextWord = Clock::now() + std::chrono::seconds(15);
        while (stopAsked == 0) {
            const bool more = Clock::now() < end && startWhatFits();
            if (m_running.empty() && !more) {
                break;
            }
            collect();
            if (Clock::now() >= nextWord) {
                nextWord += std::chrono::seconds(15);
                tellProgress(std::chrono::duration<double>(end - Clock::now()).count());
            }
            ::usleep(500);
        }
        for (const Running& running : m_running) {
            ::kill(-running.process, SIGKILL);
            ::waitpid(running.process, nullptr, 0);
        }
        return tellAll();
    }

private:
    /// Starts cases while there are jobs free. False if there is nothing left to start.
    bool startWhatFits() {
        while (m_running.size() < m_settings.jobs) {
            Progress* next = nullptr;
            for (Progress& progress : m_progress) {
                if (!progress.exhausted(m_settings) &&
                    (next == nullptr || timeOf(progress) < timeOf(*next))) {
                    next = &progress;
                }
            }
            if (next == nullptr) {
                return false;
            }
            start(*next);
        }
        return true;
    }

    [[nodiscard]] double timeOf(const Progress& progress) const {
        double seconds = progress.seconds;
        for (const Running& running : m_running) {
            if (running.progress == &progress) {
                seconds += 0.001 + std::chrono::duration<double>(Clock::now() - running.began).count();
            }
        }
        return seconds / progress.attack->parts;
    }

    void start(Progress& progress) {
        const size_t at = progress.next++;
        Running running;
        running.progress = &progress;
        running.number = m_settings.number != 0              ? m_settings.number
                         : progress.attack->cases != nullptr ? progress.order[at]
                                                             : at + 1;
        running.folder = m_root + "/" + std::to_string(++m_started);
        fs::create_directories(running.folder + "/work");
        running.began = running.lastBusy = Clock::now();
        std::fflush(nullptr);
        running.process = ::fork();
        if (running.process == 0) {
            runHere(*progress.attack, running);
        }
        if (running.process > 0) {
            m_running.push_back(running);
        }
    }

    [[noreturn]] void runHere(const Attack& attack, const Running& running) const {
        ::setpgid(0, 0);
        ::prctl(PR_SET_PDEATHSIG, SIGKILL);
        std::signal(SIGINT, SIG_DFL);
        std::signal(SIGTERM, SIG_DFL);
        const int report =
            ::open((running.folder + "/report").c_str(), O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC, 0666);
        const int words = ::open((running.folder + "/words").c_str(), O_WRONLY | O_CREAT | O_APPEND, 0666);
        ::dup2(words, STDOUT_FILENO);
        ::dup2(words, STDERR_FILENO);
        ::setenv("TMPDIR", (running.folder + "/work").c_str(), 1);
        Case its(m_settings.seed, running.number, running.folder + "/work", report);
        try {
            attack.run(its);
        } catch (const std::exception& error) {
            its.found("an exception came out", error.what());
        }
        ::_exit(0);
    }

    void collect() {
        for (size_t i = 0; i < m_running.size();) {
            Running& running = m_running[i];
            int status = 0;
            const bool ended = ::waitpid(running.process, &status, WNOHANG) == running.process;
            const bool stuck = !ended && isStuck(running);
            if (!ended && !stuck) {
                ++i;
                continue;
            }
            if (stuck) {
                note(running, "it never ends", "no processor time was used any more");
                ::kill(-running.process, SIGKILL);
                ::waitpid(running.process, &status, 0);
            } else if (WIFSIGNALED(status)) {
                note(running, String("it crashes: ") + ::strsignal(WTERMSIG(status)), lastWords(running));
            }
            ::kill(-running.process, SIGKILL); // what it may have left
            finish(running);
            m_running.erase(m_running.begin() + static_cast<std::ptrdiff_t>(i));
        }
    }

    /// A case that waits for what never comes uses no processor time. How long it takes in all decides
    /// nothing.
    static bool isStuck(Running& running) {
        const auto now = Clock::now();
        if (now - running.lastBusy < std::chrono::seconds(running.progress->attack->patience)) {
            return false;
        }
        const auto used = processorTime(running.process);
        const bool busy = used != running.used;
        running.used = used;
        running.lastBusy = now;
        return !busy;
    }

    static String lastWords(const Running& running) {
        std::ifstream file(running.folder + "/words");
        const std::string words((std::istreambuf_iterator<char>(file)), {});
        return words.size() > 600 ? words.substr(words.size() - 600) : words;
    }

    void note(const Running& running, const String& kind, const String& seen) {
        Finding& finding = running.progress->findings[kind];
        if (finding.times++ == 0) {
            finding.number = running.number;
            finding.seen = seen;
            std::fprintf(stderr, "%s: %s (case %zu): %s\n", running.progress->attack->name, kind.c_str(),
                         running.number, seen.substr(0, 300).c_str());
            // What the first of each kind left on the disk is kept.
            fs::create_directories(m_settings.foundFolder);
            std::error_code ignored;
            fs::copy(running.folder,
                     m_settings.foundFolder + "/" + running.progress->attack->name + "-" +
                         std::to_string(running.number),
                     fs::copy_options::recursive | fs::copy_options::copy_symlinks |
                         fs::copy_options::overwrite_existing,
                     ignored);
        }
    }

    void finish(const Running& running) {
        Progress& progress = *running.progress;
        progress.seconds += std::chrono::duration<double>(Clock::now() - running.began).count();
        ++progress.cases;
        ++progress.tried;
        std::ifstream report(running.folder + "/report");
        for (std::string line; std::getline(report, line);) {
            if (line.starts_with("+")) {
                progress.tried += std::strtoull(line.c_str() + 1, nullptr, 10);
                continue;
            }
            const size_t tab = std::min(line.find('\t'), line.size() - 1);
            note(running, line.substr(0, tab), line.substr(tab + 1));
        }
        std::error_code ignored;
        fs::remove_all(running.folder, ignored);
    }

    void tellProgress(double left) const {
        std::string text;
        for (const Progress& progress : m_progress) {
            text += String::format("  %s %zu", progress.attack->name, progress.tried);
            if (!progress.findings.empty()) {
                text += String::format(" (%zu!)", progress.findings.size());
            }
        }
        std::fprintf(stderr, "%4.0f s left:%s\n", std::max(left, 0.0), text.c_str());
    }

    /// The table, the findings with the command for each, and the same in a file. True if nothing was found.
    [[nodiscard]] bool tellAll() const {
        std::ostringstream text;
        size_t all = 0;
        text << "seed " << m_settings.seed << "\n\n"
             << String::format("%-12s %9s %9s %7s  %s\n", "attack", "cases", "tried", "found",
                               "what it does");
        for (const Progress& progress : m_progress) {
            all += progress.findings.size();
            text << String::format(
                "%-12s %9zu %9zu %7zu  %s%s\n", progress.attack->name, progress.cases, progress.tried,
                progress.findings.size(), progress.attack->about,
                progress.attack->cases != nullptr && m_settings.number == 0
                    ? String::format(" (%zu of %zu)", progress.next, progress.order.size()).c_str()
                    : "");
        }
        for (const Progress& progress : m_progress) {
            for (const auto& [kind, finding] : progress.findings) {
                text << "\n"
                     << progress.attack->name << ": " << kind << ", " << finding.times << " times\n    "
                     << finding.seen << "\n    scripts/torture.sh --only " << progress.attack->name
                     << " --case " << finding.number << " --seed " << m_settings.seed << "\n";
            }
        }
        text << (all == 0 ? "\nNothing was found.\n"
                          : String::format("\n%zu kinds of fault were found.\n", all).c_str());
        std::cout << text.str() << std::flush;
        if (all != 0) {
            std::ofstream(m_settings.foundFolder + "/findings.txt") << text.str();
        }
        return all == 0;
    }

    Settings m_settings;
    std::string m_root;
    std::vector<Progress> m_progress;
    std::vector<Running> m_running;
    size_t m_started = 0;
};

int usage() {
    std::cerr
        << "torture [MINUTES] [--only ATTACK] [--case NUMBER] [--seed SEED] [--jobs N] [--found FOLDER]\n";
    for (const Attack* attack : kAttacks) {
        std::cerr << String::format("  %-12s %s\n", attack->name, attack->about);
    }
    return 2;
}

int main(int count, char** arguments) {
    Settings settings;
    for (int i = 1; i < count; ++i) {
        const std::string_view name = arguments[i];
        if (!name.starts_with("--")) {
            settings.minutes = std::atof(arguments[i]);
            if (settings.minutes <= 0) {
                return usage();
            }
            continue;
        }
        if (i + 1 == count) {
            return usage();
        }
        const char* const value = arguments[++i];
        const unsigned long long number = std::strtoull(value, nullptr, 10);
        if (name == "--only") {
            settings.only = value;
        } else if (name == "--case") {
            settings.number = static_cast<size_t>(number);
        } else if (name == "--seed") {
            settings.seed = number;
        } else if (name == "--jobs" && number > 0) {
            settings.jobs = static_cast<size_t>(number);
        } else if (name == "--found") {
            settings.foundFolder = value;
        } else {
            return usage();
        }
    }
    const auto stop = [](int) { stopAsked = 1; };
    std::signal(SIGINT, stop);
    std::signal(SIGTERM, stop);
    Programme programme(settings);
    if (!programme.hasAttacks() || (settings.number != 0 && settings.only.empty())) {
        return usage();
    }
    return programme.run() ? 0 : 1;
}

} // namespace

} // namespace torture

int main(int count, char** arguments) {
    return torture::main(count, arguments);
}
