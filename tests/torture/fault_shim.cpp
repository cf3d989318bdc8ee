// Stands between qmedit and the system's library and lets the n-th call on a file of the project fail, or has
// a signal come just before it. What to do stands in the environment:
//
//     TORTURE_UNDER   the folder whose files count
//     TORTURE_AT      the number of the call, from 1; 0 to count only
//     TORTURE_ERROR   the error that the call fails with
//     TORTURE_SIGNAL  the signal that comes before the call instead
//     TORTURE_MODE    "one" call fails, that one and all that follow ("rest"),
//                     or from that one on every call that takes room ("full")
//     TORTURE_REPORT  a file that gets the call's name and path, and at the end the number of calls
//
// No header that declares the calls is included, so that each is declared once, here, by what it takes at the
// machine's level: `open` has three arguments, a structure is an address.

#include <array>
#include <atomic>
#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <cstring>
#include <dlfcn.h>
#include <sys/syscall.h>

extern "C" long syscall(long number, ...);
extern "C" int dirfd(void* folder);

namespace {

constexpr int kCreate = 0100;     // O_CREAT
constexpr int kAppendNew = 02101; // O_APPEND | O_CREAT | O_WRONLY
constexpr int kCurrent = -100;    // AT_FDCWD
constexpr size_t kDescriptors = 4096;

std::array<std::atomic<bool>, kDescriptors> counted;
std::atomic<long> calls{0};

struct Plan {
    const char* under = std::getenv("TORTURE_UNDER");
    const char* report = std::getenv("TORTURE_REPORT");
    long at = number("TORTURE_AT");
    int error = static_cast<int>(number("TORTURE_ERROR"));
    int signal = static_cast<int>(number("TORTURE_SIGNAL"));
    char mode = letter("TORTURE_MODE");

    static long number(const char* name) {
        const char* const text = std::getenv(name);
        return text != nullptr ? std::atol(text) : 0;
    }
    static char letter(const char* name) {
        const char* const text = std::getenv(name);
        return text != nullptr ? text[0] : 'o';
    }
};

const Plan& plan() {
    static const Plan its;
    return its;
}

bool isUnder(const char* path) {
    const char* const under = plan().under;
    return under != nullptr && path != nullptr && std::strncmp(path, under, std::strlen(under)) == 0;
}

bool isCounted(int descriptor) {
    return descriptor >= 0 && static_cast<size_t>(descriptor) < kDescriptors &&
           counted[static_cast<size_t>(descriptor)];
}

void mark(int descriptor, bool counts) {
    if (descriptor >= 0 && static_cast<size_t>(descriptor) < kDescriptors) {
        counted[static_cast<size_t>(descriptor)] = counts;
    }
}

/// Appends to the report without going through the calls below.
void tell(const char* name, const char* path) {
    if (plan().report == nullptr) {
        return;
    }
    const long file = syscall(SYS_openat, kCurrent, plan().report, kAppendNew, 0666);
    for (const char* text : {name, " ", path, "\n"}) {
        syscall(SYS_write, file, text, std::strlen(text));
    }
    syscall(SYS_close, file);
}

struct CountAtEnd {
    CountAtEnd() = default;
    ~CountAtEnd() {
        char digits[24] = {};
        char* at = digits + sizeof digits - 1;
        for (long left = calls; left > 0; left /= 10) {
            *--at = static_cast<char>('0' + left % 10);
        }
        tell("calls", at);
    }
    CountAtEnd(const CountAtEnd&) = delete;
    CountAtEnd& operator=(const CountAtEnd&) = delete;
} countAtEnd;

/// Counts a call on a file of the project. True, with `errno` set, if it is to fail.
bool fails(const char* name, bool counts, const char* path, bool takesRoom) {
    if (!counts) {
        return false;
    }
    const int before = errno;
    const long n = ++calls;
    const long at = plan().at;
    if (at == 0 || n < at) {
        return false;
    }
    if (plan().signal != 0) {
        if (n == at) {
            tell(name, path);
            std::raise(plan().signal);
        }
        errno = before;
        return false;
    }
    const bool chosen = plan().mode == 'o' ? n == at : plan().mode == 'r' || takesRoom;
    if (!chosen) {
        return false;
    }
    static std::atomic<bool> told{false};
    if (!told.exchange(true)) {
        tell(name, path);
    }
    errno = plan().error;
    return true;
}

template <typename Function>
Function* next(Function* /*same*/, const char* name) {
    return reinterpret_cast<Function*>(::dlsym(RTLD_NEXT, name));
}

} // namespace

// The last two: what the call is on, a descriptor or a path, and whether it takes room on the disk.
#define ON_DESCRIPTOR(result, failure, name, parameters, arguments, descriptor, room)                        \
    extern "C" result name parameters {                                                                      \
        static auto* const real = next(&name, #name);                                                        \
        return fails(#name, isCounted(descriptor), "", room) ? failure : real arguments;                     \
    }
#define ON_PATH(result, failure, name, parameters, arguments, path, room)                                    \
    extern "C" result name parameters {                                                                      \
        static auto* const real = next(&name, #name);                                                        \
        return fails(#name, isUnder(path), path, room) ? failure : real arguments;                           \
    }
#define OPENS(name)                                                                                          \
    extern "C" int name(const char* path, int flags, unsigned mode) {                                        \
        static auto* const real = next(&name, #name);                                                        \
        if (fails(#name, isUnder(path), path, (flags & kCreate) != 0)) {                                     \
            return -1;                                                                                       \
        }                                                                                                    \
        const int opened = real(path, flags, mode);                                                          \
        mark(opened, isUnder(path));                                                                         \
        return opened;                                                                                       \
    }
#define OPENS_AT(name)                                                                                       \
    extern "C" int name(int folder, const char* path, int flags, unsigned mode) {                            \
        static auto* const real = next(&name, #name);                                                        \
        const bool counts = isUnder(path) || isCounted(folder);                                              \
        if (fails(#name, counts, path, (flags & kCreate) != 0)) {                                            \
            return -1;                                                                                       \
        }                                                                                                    \
        const int opened = real(folder, path, flags, mode);                                                  \
        mark(opened, counts);                                                                                \
        return opened;                                                                                       \
    }

OPENS(open)
OPENS(open64)
OPENS_AT(openat)
OPENS_AT(openat64)

ON_DESCRIPTOR(long, -1, read, (int file, void* to, size_t size), (file, to, size), file, false)
ON_DESCRIPTOR(long, -1, pread, (int file, void* to, size_t size, long at), (file, to, size, at), file, false)
ON_DESCRIPTOR(long, -1, pread64, (int file, void* to, size_t size, long at), (file, to, size, at), file,
              false)
ON_DESCRIPTOR(long, -1, write, (int file, const void* from, size_t size), (file, from, size), file, true)
ON_DESCRIPTOR(long, -1, pwrite, (int file, const void* from, size_t size, long at), (file, from, size, at),
              file, true)
ON_DESCRIPTOR(long, -1, pwrite64, (int file, const void* from, size_t size, long at), (file, from, size, at),
              file, true)
ON_DESCRIPTOR(int, -1, ftruncate, (int file, long size), (file, size), file, true)
ON_DESCRIPTOR(int, -1, ftruncate64, (int file, long size), (file, size), file, true)
ON_DESCRIPTOR(int, -1, fsync, (int file), (file), file, false)
ON_DESCRIPTOR(int, -1, fdatasync, (int file), (file), file, false)
ON_DESCRIPTOR(int, -1, sync_file_range, (int file, long from, long size, unsigned how),
              (file, from, size, how), file, false)
ON_DESCRIPTOR(int, -1, syncfs, (int file), (file), file, false)
ON_DESCRIPTOR(int, -1, flock, (int file, int how), (file, how), file, false)
ON_DESCRIPTOR(int, -1, fchmod, (int file, unsigned mode), (file, mode), file, false)
ON_DESCRIPTOR(int, -1, fstat, (int file, void* status), (file, status), file, false)
ON_DESCRIPTOR(int, -1, fstat64, (int file, void* status), (file, status), file, false)

ON_PATH(int, -1, rename, (const char* from, const char* to), (from, to), from, false)
ON_PATH(int, -1, renameat2, (int folder, const char* from, int toFolder, const char* to, unsigned how),
        (folder, from, toFolder, to, how), from, false)
ON_PATH(int, -1, unlink, (const char* path), (path), path, false)
ON_PATH(int, -1, rmdir, (const char* path), (path), path, false)
ON_PATH(int, -1, mkdir, (const char* path, unsigned mode), (path, mode), path, true)
ON_PATH(int, -1, stat, (const char* path, void* status), (path, status), path, false)
ON_PATH(int, -1, stat64, (const char* path, void* status), (path, status), path, false)
ON_PATH(int, -1, lstat, (const char* path, void* status), (path, status), path, false)
ON_PATH(int, -1, lstat64, (const char* path, void* status), (path, status), path, false)
ON_PATH(int, -1, access, (const char* path, int how), (path, how), path, false)
ON_PATH(int, -1, fstatat, (int folder, const char* path, void* status, int how), (folder, path, status, how),
        path, false)
ON_PATH(int, -1, statx, (int folder, const char* path, int how, unsigned mask, void* status),
        (folder, path, how, mask, status), path, false)
ON_PATH(int, -1, utimensat, (int folder, const char* path, const void* times, int how),
        (folder, path, times, how), path, false)

extern "C" int close(int file) {
    static auto* const real = next(&close, "close");
    const bool failing = fails("close", isCounted(file), "", false);
    const int error = errno;
    mark(file, false);
    const int closed = real(file);
    if (failing) {
        errno = error;
        return -1;
    }
    return closed;
}

extern "C" void* opendir(const char* path) {
    static auto* const real = next(&opendir, "opendir");
    if (fails("opendir", isUnder(path), path, false)) {
        return nullptr;
    }
    void* const folder = real(path);
    mark(folder != nullptr ? dirfd(folder) : -1, isUnder(path));
    return folder;
}

extern "C" void* readdir(void* folder) {
    static auto* const real = next(&readdir, "readdir");
    return fails("readdir", isCounted(dirfd(folder)), "", false) ? nullptr : real(folder);
}

extern "C" void* readdir64(void* folder) {
    static auto* const real = next(&readdir64, "readdir64");
    return fails("readdir64", isCounted(dirfd(folder)), "", false) ? nullptr : real(folder);
}

extern "C" int closedir(void* folder) {
    static auto* const real = next(&closedir, "closedir");
    mark(dirfd(folder), false);
    return real(folder);
}
