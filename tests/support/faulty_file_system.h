#pragma once

#include "platform/services/atomic_file.h"
#include "platform/services/files.h"

#include <algorithm>
#include <cerrno>
#include <csignal>
#include <functional>
#include <map>
#include <mutex>
#include <optional>
#include <unistd.h>

namespace test {

/// The machine's file system with faults at will, installed while it lives. Every call of the seam is an
/// operation; operations are numbered from 1 since the last `reset`, and listed as text with names instead of
/// paths and "*.tmp" for temporary names: "open new *.tmp", "write *.tmp 5", "rename *.tmp a.qme".
class FaultyFileSystem : public Qx::FileSystem {
public:
    FaultyFileSystem() : m_before(Qx::setFileSystem(this)) {}
    ~FaultyFileSystem() override { Qx::setFileSystem(m_before); }
    FaultyFileSystem(const FaultyFileSystem&) = delete;
    FaultyFileSystem& operator=(const FaultyFileSystem&) = delete;

    /// Takes all faults away and starts counting afresh.
    void reset() {
        const std::lock_guard hold(m_mutex);
        m_plan = {};
        m_operations.clear();
        m_numWrites = 0;
        m_numQuestions = 0;
    }
    /// Operation `n` fails with an error of the system, without doing anything. EINTR makes an interruption.
    void failAt(size_t n, int code) {
        plan([&](Plan& p) { p.failAt = n, p.failCode = code; });
    }
    /// Operation `n` and all that follow fail: the disk is gone.
    void failFrom(size_t n, int code) {
        plan([&](Plan& p) { p.failFrom = n, p.failCode = code; });
    }
    /// Every operation whose text holds `part` fails.
    void failWhere(String part, int code) {
        plan([&](Plan& p) { p.failWhere = std::move(part), p.failCode = code; });
    }
    /// Question `n` about a name (`info`) fails, counted from 1 among questions: the system cannot tell what
    /// is there (EIO, ESTALE, EACCES).
    void failQuestion(size_t n, int code) {
        plan([&](Plan& p) { p.failQuestion = n, p.failCode = code; });
    }
    /// Each read and write moves at most this many bytes.
    void shortTransfers(size_t bytes) {
        plan([&](Plan& p) { p.transfer = bytes; });
    }
    /// The process gets a signal when it comes to operation `n`, which then takes place.
    void signalAt(size_t n, int signal) {
        plan([&](Plan& p) { p.signalAt = n, p.signal = signal; });
    }
    /// The disk takes this many more bytes, and what is removed again; then writes fail with ENOSPC.
    void fullAfter(size_t bytes) {
        plan([&](Plan& p) { p.room = bytes; });
    }
    /// The process is killed when it comes to write operation `n`, counted from 1 among those that can change
    /// something (making, writing, setting permissions, syncing, renaming, removing, touching). A write has
    /// done half of its bytes by then.
    void killAtWrite(size_t n) {
        plan([&](Plan& p) { p.killAt = n; });
    }

    [[nodiscard]] std::vector<String> operations() const {
        const std::lock_guard hold(m_mutex);
        return m_operations;
    }
    [[nodiscard]] size_t numOperations() const { return operations().size(); }
    [[nodiscard]] size_t numWrites() const {
        const std::lock_guard hold(m_mutex);
        return m_numWrites;
    }
    [[nodiscard]] size_t numQuestions() const {
        const std::lock_guard hold(m_mutex);
        return m_numQuestions;
    }
    /// How many operations so far begin with `start`.
    [[nodiscard]] size_t count(std::string_view start) const {
        const auto all = operations();
        return static_cast<size_t>(std::count_if(
            all.begin(), all.end(), [&](const String& text) { return text.starts_with(start); }));
    }

    Qx::FileError open(const String& path, Qx::OpenMode mode, std::unique_ptr<Qx::OpenFile>& file) override {
        static constexpr const char* kModes[] = {"read", "new", "both", "append"};
        const bool makes = mode == Qx::OpenMode::CreateNew || mode == Qx::OpenMode::Append;
        const String text = String("open ") + kModes[static_cast<size_t>(mode)] + " " + nameFor(path);
        if (auto error = step(text, makes, path)) {
            return error;
        }
        std::unique_ptr<Qx::OpenFile> real;
        auto error = machine().open(path, mode, real);
        if (!error) {
            file = std::make_unique<File>(*this, std::move(real), path);
        }
        return error;
    }
    Qx::FileError info(const String& path, Qx::FileInfo& info) override {
        auto error = step("info " + nameFor(path), false, path);
        return error ? error : machine().info(path, info);
    }
    Qx::FileError rename(const String& from, const String& to) override {
        auto error = step("rename " + nameFor(from) + " " + nameFor(to), true, to);
        freeRoom(from, false);
        return error ? error : machine().rename(from, to);
    }
    Qx::FileError remove(const String& path) override {
        auto error = step("remove " + nameFor(path), true, path);
        freeRoom(path, !error);
        return error ? error : machine().remove(path);
    }
    Qx::FileError makeFolder(const String& path) override {
        auto error = step("make folder " + nameFor(path), true, path);
        return error ? error : machine().makeFolder(path);
    }
    Qx::FileError removeFolder(const String& path) override {
        auto error = step("remove folder " + nameFor(path), true, path);
        return error ? error : machine().removeFolder(path);
    }
    Qx::FileError list(const String& path, std::vector<String>& names) override {
        auto error = step("list " + nameFor(path), false, path);
        return error ? error : machine().list(path, names);
    }
    Qx::FileError syncFolder(const String& path) override {
        auto error = step("sync folder", true, path);
        return error ? error : machine().syncFolder(path);
    }
    Qx::FileError syncAll(const String& folder) override {
        auto error = step("sync all", true, folder);
        return error ? error : machine().syncAll(folder);
    }
    Qx::FileError touch(const String& path, bool accessOnly) override {
        auto error = step("touch " + nameFor(path), true, path);
        return error ? error : machine().touch(path, accessOnly);
    }

private:
    struct Plan {
        size_t failAt = 0;
        size_t failFrom = 0;
        size_t failQuestion = 0;
        String failWhere;
        int failCode = EIO;
        size_t transfer = SIZE_MAX;
        std::optional<size_t> room;
        size_t signalAt = 0;
        int signal = 0;
        size_t killAt = 0;
    };

    class File : public Qx::OpenFile {
    public:
        File(FaultyFileSystem& system, std::unique_ptr<Qx::OpenFile> real, String path)
            : m_system(system), m_real(std::move(real)), m_path(std::move(path)), m_name(nameFor(m_path)) {}
        Qx::FileError read(void* to, size_t size, size_t& got) override {
            got = 0;
            auto error = m_system.step("read " + m_name, false, m_path);
            return error ? error : m_real->read(to, std::min(size, m_system.transfer()), got);
        }
        Qx::FileError write(const void* from, size_t size, size_t& put) override {
            put = 0;
            const auto half = [&] {
                size_t ignored = 0;
                static_cast<void>(m_real->write(from, size / 2, ignored));
            };
            if (auto error =
                    m_system.step(String::format("write %s %zu", m_name.c_str(), size), true, m_path, half)) {
                return error;
            }
            size = m_system.takeRoom(m_path, size);
            return size == 0 ? Qx::FileError{ENOSPC, "write", m_path} : m_real->write(from, size, put);
        }
        Qx::FileError seek(uint64_t offset) override {
            auto error = m_system.step("seek " + m_name, false, m_path);
            return error ? error : m_real->seek(offset);
        }
        Qx::FileError sync() override {
            auto error = m_system.step("sync " + m_name, true, m_path);
            return error ? error : m_real->sync();
        }
        Qx::FileError info(Qx::FileInfo& info) override {
            auto error = m_system.step("file info " + m_name, false, m_path);
            return error ? error : m_real->info(info);
        }
        Qx::FileError setPermissions(uint32_t permissions) override {
            auto error = m_system.step("set permissions " + m_name, true, m_path);
            return error ? error : m_real->setPermissions(permissions);
        }
        Qx::FileError lock(bool wait, bool& taken) override {
            taken = false;
            auto error = m_system.step("lock " + m_name, false, m_path);
            return error ? error : m_real->lock(wait, taken);
        }
        Qx::FileError close() override {
            auto error = m_system.step("close " + m_name, false, m_path);
            const auto closed = m_real->close();
            return error ? error : closed;
        }

    private:
        FaultyFileSystem& m_system;
        std::unique_ptr<Qx::OpenFile> m_real;
        String m_path;
        String m_name;
    };

    static Qx::FileSystem& machine() { return Qx::machineFileSystem(); }
    static String nameFor(const String& path) {
        const String name = Qx::fileNameOf(path);
        return Qx::isTemporaryName(name) ? String("*.tmp") : name;
    }

    void plan(const std::function<void(Plan&)>& change) {
        const std::lock_guard hold(m_mutex);
        change(m_plan);
    }
    [[nodiscard]] size_t transfer() const {
        const std::lock_guard hold(m_mutex);
        return m_plan.transfer;
    }
    size_t takeRoom(const String& path, size_t size) {
        const std::lock_guard hold(m_mutex);
        size = std::min(size, m_plan.transfer);
        if (m_plan.room) {
            size = std::min(size, *m_plan.room);
            *m_plan.room -= size;
            m_taken[path] += size;
        }
        return size;
    }
    /// A name goes: what was written to it is free again if its file goes with it.
    void freeRoom(const String& path, bool isRemoved) {
        const std::lock_guard hold(m_mutex);
        const auto taken = m_taken.extract(path);
        if (isRemoved && m_plan.room && !taken.empty()) {
            *m_plan.room += taken.mapped();
        }
    }

    /// Counts an operation, and kills or fails as planned.
    Qx::FileError step(
        const String& text, bool writes, const String& path,
        const std::function<void()>& beforeKill = [] {}) {
        const std::lock_guard hold(m_mutex);
        m_operations.push_back(text);
        m_numWrites += writes ? 1 : 0;
        const bool asks = text.starts_with("info ");
        m_numQuestions += asks ? 1 : 0;
        if (writes && m_numWrites == m_plan.killAt) {
            beforeKill();
            ::kill(::getpid(), SIGKILL);
        }
        const size_t n = m_operations.size();
        if (n == m_plan.signalAt) {
            ::raise(m_plan.signal);
        }
        const bool fails = n == m_plan.failAt || (m_plan.failFrom != 0 && n >= m_plan.failFrom) ||
                           (asks && m_numQuestions == m_plan.failQuestion) ||
                           (!m_plan.failWhere.empty() && text.find(m_plan.failWhere) != String::npos);
        return fails ? Qx::FileError{m_plan.failCode, text, path} : Qx::FileError{};
    }

    Qx::FileSystem* m_before;
    mutable std::mutex m_mutex;
    Plan m_plan;
    std::vector<String> m_operations;
    size_t m_numWrites = 0;
    std::map<String, size_t> m_taken; ///< bytes of the files written on a disk that fills up
    size_t m_numQuestions = 0;
};

} // namespace test
