#pragma once

#include "platform/base/export.h"

#include <algorithm>
#include <atomic>
#include <condition_variable>
#include <functional>
#include <memory>
#include <mutex>
#include <thread>
#include <utility>
#include <vector>

namespace Qx {

/// One subscription: whether it is ended, and which threads are inside its function.
///
/// Invariants: once `m_ended` is set no thread enters; `m_inside` holds a thread once for each call that it
/// is in the middle of. Guarded by `m_mutex`, which is never held while the function runs.
class QM_API Subscription {
public:
    Subscription() = default;
    virtual ~Subscription();
    Subscription(const Subscription&) = delete;
    Subscription& operator=(const Subscription&) = delete;

    /// True if the calling thread may call the function; it must call `leave` afterwards.
    [[nodiscard]] bool enter();
    void leave();
    /// Lets nobody in any more and waits until no other thread is inside. Threads that would wait for each
    /// other, each inside a function whose subscription another one ends, do not all wait: the one that
    /// closes the circle goes on at once.
    void end();

protected:
    /// Lets go of the function. Called once, without a lock, when no thread will call it again.
    virtual void dropFunction() = 0;

private:
    struct Waits;
    static Waits& waits();
    [[nodiscard]] bool othersInside() const;
    /// True if nobody is inside any more, so that the caller drops the function.
    [[nodiscard]] bool waitForOthers();
    [[nodiscard]] std::vector<std::thread::id> threadsInside();
    [[nodiscard]] static bool leadsBackToThisThread(Subscription* awaited);

    std::mutex m_mutex;
    std::condition_variable m_left;
    std::vector<std::thread::id> m_inside;
    bool m_ended = false;
    bool m_awaited = false; ///< whoever ended it waits, and drops the function
};

/// A list of functions that are told something, with the promises of `Notifier`: they are called on the
/// teller's thread in the order of their addition; they may tell, add, end (themselves or others) and destroy
/// the list meanwhile; no lock is held while one runs. Thread-safe. Telling allocates nothing but room for
/// the threads that are inside one function at the same time.
template <typename... Arguments>
class SubscriberList {
public:
    using Function = std::function<void(Arguments...)>;

    SubscriberList() : m_state(std::make_shared<State>()) {}
    /// Calls no further function; those that are running on other threads are not waited for.
    ~SubscriberList() { m_state->close(); }
    SubscriberList(const SubscriberList&) = delete;
    SubscriberList& operator=(const SubscriberList&) = delete;

    /// The function is called until the returned object is destroyed. Its destructor waits for the function
    /// where that runs on another thread, and may outlive the list.
    [[nodiscard]] std::shared_ptr<void> add(Function function) {
        auto entry = std::make_shared<Entry>(std::move(function));
        m_state->add(entry);
        return std::make_shared<Handle>(m_state, std::move(entry));
    }

    void tell(Arguments... arguments) {
        // From here on `this` is not used: a function may destroy the list.
        const std::shared_ptr<State> state = m_state;
        const std::shared_ptr<const Entries> told = state->entries();
        for (const std::shared_ptr<Entry>& entry : *told) {
            const Inside inside(*entry);
            if (inside.entered && state->isOpen() && entry->function) {
                entry->function(arguments...);
            }
        }
    }

    [[nodiscard]] size_t size() const { return m_state->entries()->size(); }

private:
    struct Entry : Subscription {
        explicit Entry(Function f) : function(std::move(f)) {}
        void dropFunction() override { Function dropped = std::exchange(function, nullptr); }
        Function function;
    };
    using Entries = std::vector<std::shared_ptr<Entry>>;

    /// The entries, replaced as a whole at each change so that a teller's copy stays as it is.
    class State {
    public:
        void add(const std::shared_ptr<Entry>& entry) {
            const std::lock_guard hold(m_mutex);
            auto changed = std::make_shared<Entries>(*m_entries);
            changed->push_back(entry);
            m_entries = std::move(changed);
        }
        void remove(const std::shared_ptr<Entry>& entry) {
            const std::lock_guard hold(m_mutex);
            auto changed = std::make_shared<Entries>(*m_entries);
            std::erase(*changed, entry);
            m_entries = std::move(changed);
        }
        void close() { m_open.store(false); }
        [[nodiscard]] bool isOpen() const { return m_open.load(); }
        [[nodiscard]] std::shared_ptr<const Entries> entries() const {
            const std::lock_guard hold(m_mutex);
            return m_entries;
        }

    private:
        mutable std::mutex m_mutex;
        std::shared_ptr<const Entries> m_entries = std::make_shared<Entries>();
        std::atomic<bool> m_open{true};
    };

    struct Inside {
        explicit Inside(Subscription& s) : subscription(s), entered(s.enter()) {}
        ~Inside() {
            if (entered) {
                subscription.leave();
            }
        }
        Inside(const Inside&) = delete;
        Inside& operator=(const Inside&) = delete;
        Subscription& subscription;
        const bool entered;
    };

    struct Handle {
        Handle(std::shared_ptr<State> s, std::shared_ptr<Entry> e)
            : state(std::move(s)), entry(std::move(e)) {}
        ~Handle() {
            state->remove(entry);
            entry->end();
        }
        Handle(const Handle&) = delete;
        Handle& operator=(const Handle&) = delete;
        std::shared_ptr<State> state;
        std::shared_ptr<Entry> entry;
    };

    std::shared_ptr<State> m_state;
};

} // namespace Qx
