#pragma once

#include "platform/base/export.h"

#include <atomic>
#include <condition_variable>
#include <thread>

/// A recursive mutual exclusion: the thread that holds it may take it again. Works with `std::lock_guard` and
/// `std::unique_lock`.
///
/// Threads that hold a section each and wait for one another's wait in a ring, for ever. `lockUnlessRing` is
/// for a service that is called under sections it knows nothing of and needs another one: it gives way when
/// its waiting is part of a ring, whoever closed it.
class QM_API criticalSection {
public:
    criticalSection() = default;
    criticalSection(const criticalSection&) = delete;
    criticalSection& operator=(const criticalSection&) = delete;

    void lock() {
        if (!try_lock()) {
            static_cast<void>(wait(false));
        }
    }
    bool try_lock() {
        const std::thread::id self = std::this_thread::get_id();
        std::thread::id nobody;
        if (m_owner.load(std::memory_order_relaxed) != self &&
            !m_owner.compare_exchange_strong(nobody, self)) {
            return false;
        }
        ++m_depth;
        return true;
    }
    /// As `lock`, but false, with nothing taken, when the thread that holds the section waits, directly or
    /// through others, for one that the caller holds.
    [[nodiscard]] bool lockUnlessRing() { return try_lock() || wait(true); }
    void unlock() {
        if (--m_depth == 0) {
            m_owner.store(std::thread::id());
            if (m_numWaiting.load() != 0) {
                wake();
            }
        }
    }

private:
    struct Waiter;
    struct Waiters;

    bool wait(bool givesWay);
    void wake();

    std::atomic<std::thread::id> m_owner{};
    unsigned m_depth = 0; ///< the owner's
    std::atomic<unsigned> m_numWaiting{0};
    std::condition_variable m_freed;
};
