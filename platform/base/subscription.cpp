#include "platform/base/subscriber_list.h"

#include <map>

namespace Qx {

/// Which thread waits for which subscription to be left. Its lock is taken before a subscription's, never
/// while one is held. Every subscription in it is ended, so that the threads inside can only become fewer,
/// and a circle is complete when its last thread comes in here.
struct Subscription::Waits {
    std::mutex mutex;
    std::map<std::thread::id, Subscription*> awaited;
};

Subscription::Waits& Subscription::waits() {
    static auto& shared = *new Waits;
    return shared;
}

Subscription::~Subscription() = default;

bool Subscription::enter() {
    const std::lock_guard hold(m_mutex);
    if (m_ended) {
        return false;
    }
    m_inside.push_back(std::this_thread::get_id());
    return true;
}

void Subscription::leave() {
    bool drops = false;
    {
        const std::lock_guard hold(m_mutex);
        m_inside.erase(std::find(m_inside.begin(), m_inside.end(), std::this_thread::get_id()));
        drops = m_ended && m_inside.empty() && !m_awaited;
        m_left.notify_all();
    }
    if (drops) {
        dropFunction();
    }
}

bool Subscription::othersInside() const {
    return std::any_of(m_inside.begin(), m_inside.end(),
                       [](std::thread::id thread) { return thread != std::this_thread::get_id(); });
}

std::vector<std::thread::id> Subscription::threadsInside() {
    const std::lock_guard hold(m_mutex);
    return m_inside;
}

bool Subscription::leadsBackToThisThread(Subscription* awaited) {
    const std::thread::id self = std::this_thread::get_id();
    std::vector<Subscription*> seen{awaited};
    for (size_t i = 0; i < seen.size(); ++i) {
        for (const std::thread::id thread : seen[i]->threadsInside()) {
            if (thread == self) {
                // Inside the one that it ends itself, this thread waits for the others only.
                if (i > 0) {
                    return true;
                }
                continue;
            }
            const auto found = waits().awaited.find(thread);
            if (found != waits().awaited.end() &&
                std::find(seen.begin(), seen.end(), found->second) == seen.end()) {
                seen.push_back(found->second);
            }
        }
    }
    return false;
}

void Subscription::end() {
    bool waitsForOthers = false;
    {
        const std::lock_guard hold(m_mutex);
        m_ended = true;
        waitsForOthers = othersInside();
        m_awaited = waitsForOthers;
        if (!waitsForOthers && !m_inside.empty()) {
            return; // ended from inside: leaving drops the function
        }
    }
    if (waitsForOthers && !waitForOthers()) {
        return;
    }
    dropFunction();
}

bool Subscription::waitForOthers() {
    const std::thread::id self = std::this_thread::get_id();
    bool circle = false;
    {
        const std::lock_guard hold(waits().mutex);
        // A thread that waits is inside this call and nowhere else, so it has one entry at most.
        waits().awaited[self] = this;
        circle = leadsBackToThisThread(this);
    }
    bool empty = false;
    {
        std::unique_lock hold(m_mutex);
        if (!circle) {
            m_left.wait(hold, [this] { return !othersInside(); });
        }
        m_awaited = false;
        empty = m_inside.empty();
    }
    const std::lock_guard hold(waits().mutex);
    waits().awaited.erase(self);
    return empty;
}

} // namespace Qx
