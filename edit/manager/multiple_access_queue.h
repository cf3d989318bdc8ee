#pragma once

#include "platform/base/exception.h"
#include "platform/base/ptr.h"

#include <condition_variable>
#include <map>
#include <memory>
#include <mutex>
#include <queue>

namespace Qx {

/// Grants one thread at a time access to a key, in the order of asking, while other keys go on in parallel.
///
/// A key is in the map exactly while some thread holds access to it; its record's queue holds the threads
/// that asked after it, in order. Access is handed from holder to first waiter directly, so no third thread
/// slips in between. The queue's own mutex guards the map and every record; it is never held while a thread
/// waits for access. Access is not recursive: a thread that asks again for a key it holds waits for itself.
template <typename Key>
class MultipleAccessQueue {
public:
    MultipleAccessQueue() = default;
    MultipleAccessQueue(const MultipleAccessQueue&) = delete;
    MultipleAccessQueue& operator=(const MultipleAccessQueue&) = delete;

    /// Returns when the calling thread holds access to `key`.
    void beginAccess(const Key& key) {
        std::unique_lock<std::mutex> hold(m_mutex);
        const auto [place, isFree] = m_accessed.try_emplace(key);
        if (isFree) {
            try {
                place->second = std::make_shared<AccessedObjectInfo>(key);
            } catch (...) {
                m_accessed.erase(place);
                throw;
            }
            return;
        }
        Waiter self;
        place->second->waiters.push(&self);
        self.signal.wait(hold, [&self] { return self.signalled; });
    }

    /// Gives up access to `key`; the first waiter gets it.
    ///
    /// \throws Qx::Exception::RuntimeError "Uncontrolled object passed to endAccess" if no thread holds
    /// access to the key; the queue is then unchanged.
    void endAccess(const Key& key) {
        const std::lock_guard<std::mutex> hold(m_mutex);
        const auto place = m_accessed.find(key);
        if (place == m_accessed.end()) {
            throw Exception::RuntimeError("Uncontrolled object passed to endAccess", "MultipleAccessQueue",
                                          136);
        }
        std::queue<Waiter*>& waiters = place->second->waiters;
        if (waiters.empty()) {
            m_accessed.erase(place);
            return;
        }
        Waiter* const first = waiters.front();
        waiters.pop();
        first->signalled = true;
        // Under the mutex: the waiter's event lives on its stack and goes as soon as it can run.
        first->signal.notify_one();
    }

    /// How many keys are held; for diagnosis.
    [[nodiscard]] size_t numAccessed() const {
        const std::lock_guard<std::mutex> hold(m_mutex);
        return m_accessed.size();
    }

    /// How many threads wait for `key`; for diagnosis.
    [[nodiscard]] size_t numWaiting(const Key& key) const {
        const std::lock_guard<std::mutex> hold(m_mutex);
        const auto place = m_accessed.find(key);
        return place == m_accessed.end() ? 0 : place->second->waiters.size();
    }

private:
    struct Waiter {
        std::condition_variable signal;
        bool signalled = false;
    };
    struct AccessedObjectInfo {
        explicit AccessedObjectInfo(const Key& accessed) : key(accessed) {}
        Key key; ///< what access is held to
        std::queue<Waiter*> waiters;
    };

    mutable std::mutex m_mutex;
    std::map<Key, Ptr<AccessedObjectInfo>> m_accessed;
};

/// Holds access to a key for a scope.
template <typename Key>
class AccessScope {
public:
    AccessScope(MultipleAccessQueue<Key>& queue, const Key& key) : m_queue(queue), m_key(key) {
        m_queue.beginAccess(m_key);
    }
    // NOLINTNEXTLINE(bugprone-exception-escape): only a key that nobody holds makes endAccess throw
    ~AccessScope() { m_queue.endAccess(m_key); }
    AccessScope(const AccessScope&) = delete;
    AccessScope& operator=(const AccessScope&) = delete;

private:
    MultipleAccessQueue<Key>& m_queue;
    Key m_key;
};

} // namespace Qx
