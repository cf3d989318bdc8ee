#include "platform/services/process_origin.h"

#include <array>
#include <cerrno>
#include <csignal>
#include <fcntl.h>
#include <string>
#include <string_view>
#include <sys/stat.h>
#include <unistd.h>

namespace Qx {

namespace {

/// What the system tells of itself in a small file of its own, which is no file of the library's.
std::string systemText(const char* path) {
    std::array<char, 128> text{};
    const int descriptor = ::open(path, O_RDONLY | O_CLOEXEC);
    if (descriptor < 0) {
        return {};
    }
    const ssize_t got = ::read(descriptor, text.data(), text.size());
    ::close(descriptor);
    return {text.data(), got > 0 ? static_cast<size_t>(got) : 0};
}

/// FNV-1a. The numbers are in file names that other processes read: do not change them.
uint32_t hashOf(std::string_view text) {
    uint32_t hash = 2166136261u;
    for (const char c : text) {
        hash = (hash ^ static_cast<unsigned char>(c)) * 16777619u;
    }
    return hash;
}

std::optional<ProcessOrigin> findOrigin() {
    struct stat space {};
    const std::string run = systemText("/proc/sys/kernel/random/boot_id");
    if (run.empty() || ::stat("/proc/self/ns/pid", &space) != 0) {
        return {};
    }
    std::array<char, 256> host{};
    static_cast<void>(::gethostname(host.data(), host.size() - 1));
    const std::string machine =
        host.data() + systemText("/etc/machine-id") + std::to_string(static_cast<uint64_t>(space.st_ino));
    return ProcessOrigin{hashOf(machine), hashOf(run)};
}

} // namespace

const std::optional<ProcessOrigin>& ProcessOrigin::current() {
    static const std::optional<ProcessOrigin> origin = findOrigin();
    return origin;
}

bool ProcessOrigin::hasEnded(long process) const {
    const std::optional<ProcessOrigin>& here = current();
    if (!here || here->machine != machine || process <= 0 || process != static_cast<pid_t>(process)) {
        return false;
    }
    if (here->run != run) {
        return true;
    }
    if (::kill(static_cast<pid_t>(process), 0) != 0) {
        return errno == ESRCH;
    }
    // One that was killed keeps its number until its parent has asked for its end, which may be long. The
    // state stands behind the program's name, which may hold anything.
    const std::string status = systemText(("/proc/" + std::to_string(process) + "/stat").c_str());
    const size_t name = status.rfind(") ");
    return name != std::string::npos && name + 2 < status.size() && status[name + 2] == 'Z';
}

} // namespace Qx
