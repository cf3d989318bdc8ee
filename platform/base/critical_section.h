#pragma once

#include <mutex>

/// A recursive mutual exclusion: the thread that holds it may take it again. Works with `std::lock_guard`.
class criticalSection {
public:
    void lock() { m_mutex.lock(); }
    void unlock() { m_mutex.unlock(); }
    bool try_lock() { return m_mutex.try_lock(); }

private:
    std::recursive_mutex m_mutex;
};
