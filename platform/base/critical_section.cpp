#include "platform/base/critical_section.h"

#include <mutex>

/// A thread that waits for a section, on its own stack.
struct criticalSection::Waiter {
    criticalSection* section;
    std::thread::id thread = std::this_thread::get_id();
    bool givesWay;
    bool isRefused = false;
    Waiter* next = nullptr;

    Waiter(criticalSection* waitsFor, bool mayGiveWay);
    ~Waiter();
    Waiter(const Waiter&) = delete;
    Waiter& operator=(const Waiter&) = delete;

    [[nodiscard]] static Waiter* of(std::thread::id thread);
    /// The waiter of the ring that this one is part of which is to give way, itself if it may; null without a
    /// ring, or when nobody in it may.
    [[nodiscard]] Waiter* whoGivesWay();
};

/// All threads that wait for any section. One mutex for all: only who has to wait comes here.
struct criticalSection::Waiters {
    std::mutex mutex;
    Waiter* first = nullptr;

    static Waiters& all() {
        static auto& waiters = *new Waiters;
        return waiters;
    }
};

criticalSection::Waiter::Waiter(criticalSection* waitsFor, bool mayGiveWay)
    : section(waitsFor), givesWay(mayGiveWay), next(Waiters::all().first) {
    Waiters::all().first = this;
    ++section->m_numWaiting;
}

criticalSection::Waiter::~Waiter() {
    --section->m_numWaiting;
    Waiter** place = &Waiters::all().first;
    while (*place != this) {
        place = &(*place)->next;
    }
    *place = next;
}

criticalSection::Waiter* criticalSection::Waiter::of(std::thread::id thread) {
    Waiter* found = Waiters::all().first;
    while (found != nullptr && found->thread != thread) {
        found = found->next;
    }
    return found;
}

criticalSection::Waiter* criticalSection::Waiter::whoGivesWay() {
    // Who waits keeps what it holds until it has got what it waits for, so a ring stands while it is looked
    // at. A ring that this waiter is no part of ends the walk as well: no thread waits twice.
    Waiter* chosen = givesWay ? this : nullptr;
    const Waiter* at = this;
    for (const Waiter* step = Waiters::all().first; step != nullptr; step = step->next) {
        const std::thread::id holder = at->section->m_owner.load();
        if (holder == thread) {
            return chosen;
        }
        Waiter* const behind = holder == std::thread::id() ? nullptr : of(holder);
        if (behind == nullptr) {
            return nullptr;
        }
        if (chosen == nullptr && behind->givesWay) {
            chosen = behind;
        }
        at = behind;
    }
    return nullptr;
}

bool criticalSection::wait(bool givesWay) {
    std::unique_lock<std::mutex> hold(Waiters::all().mutex);
    Waiter self(this, givesWay);
    // Counted among those who wait, so that a thread that frees the section from here on wakes this one.
    while (!try_lock()) {
        if (self.isRefused) {
            return false;
        }
        Waiter* const refused = self.whoGivesWay();
        if (refused == &self) {
            return false;
        }
        if (refused != nullptr) {
            refused->isRefused = true;
            refused->section->m_freed.notify_all();
        }
        m_freed.wait(hold);
    }
    return true;
}

void criticalSection::wake() {
    const std::lock_guard<std::mutex> hold(Waiters::all().mutex);
    m_freed.notify_all();
}
