#pragma once

#include <atomic>
#include <thread>

/// A mutual exclusion for a few instructions that call nothing which may wait: taking it costs one atomic
/// operation, and who finds it taken tries again, giving way to other threads after some tries. Not
/// recursive. Works with `std::lock_guard`.
class SpinLock {
public:
    void lock() {
        while (m_taken.exchange(true, std::memory_order_acquire)) {
            for (int tries = 0; m_taken.load(std::memory_order_relaxed); ++tries) {
                if (tries > kTries) {
                    std::this_thread::yield();
                }
            }
        }
    }
    void unlock() { m_taken.store(false, std::memory_order_release); }

private:
    static constexpr int kTries = 100;
    std::atomic<bool> m_taken{false};
};
