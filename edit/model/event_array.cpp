#include "edit/model/event_array.h"

#include "platform/base/num_range.h"

#include <algorithm>
#include <atomic>
#include <cmath>
#include <cstring>
#include <type_traits>
#include <utility>

static_assert(std::is_trivially_copyable_v<channel_event>, "events are moved as bytes");

namespace {

/// The room that an array gets which must move anyway: some beyond what it needs, so that a row of insertions
/// does not move it each time, but not the double.
size_t withSlack(size_t size) {
    return size + size / 16 + 16;
}

void addTo(channel_event& event, double shift) {
    event.editTime += shift;
}

void addTo(double& time, double shift) {
    time += shift;
}

/// Moves items within an array and adds `shift` to their times: block by block, so that each block is still
/// in the cache nearest to the processor when its times are changed.
template <typename Item>
void moveShifted(Item* from, Item* to, size_t count, double shift) {
    constexpr size_t kBlock = 4096 / sizeof(Item);
    const auto moveBlock = [&](size_t first, size_t size) {
        std::memmove(static_cast<void*>(to + first), from + first, size * sizeof(Item));
        for (size_t i = first; i < first + size; ++i) {
            addTo(to[i], shift);
        }
    };
    if (to > from) {
        for (size_t left = count; left > 0;) {
            const size_t size = std::min(left, kBlock);
            left -= size;
            moveBlock(left, size);
        }
    } else {
        for (size_t done = 0; done < count; done += kBlock) {
            moveBlock(done, std::min(count - done, kBlock));
        }
    }
}

/// Moves the items from `last` on so that they begin at `to`, adding `shift` to their times. There is room.
template <typename Item>
void moveTail(std::vector<Item>& items, size_t last, size_t to, double shift) {
    const size_t tail = items.size() - last;
    if (to > last) {
        items.resize(to + tail);
    }
    Item* const all = items.data();
    if (shift != 0) {
        moveShifted(all + last, all + to, tail, shift);
    } else if (to != last) {
        std::memmove(static_cast<void*>(all + to), all + last, tail * sizeof(Item));
    }
    if (to < last) {
        items.resize(to + tail);
    }
}

/// The times of the in points among some events.
void takeStarts(std::span<const channel_event> events, std::vector<double>& starts) {
    starts.resize((events.size() + 1) / 2);
    for (size_t pair = 0; pair < starts.size(); ++pair) {
        starts[pair] = events[2 * pair].editTime;
    }
}

/// The shortest time above 0 from an event to the next one, if it is below `least`, or else `least`.
double shortestStep(std::span<const channel_event> events, double least = Qx::kNoTime) {
    for (size_t i = 1; i < events.size(); ++i) {
        const double step = events[i].editTime - events[i - 1].editTime;
        least = step > 0 && step < least ? step : least;
    }
    return least;
}

} // namespace

/// What arrays share. The events lie in `events`, or, with a lender, in its memory.
struct EventArray::Body {
    std::atomic<size_t> users{1};
    Events events;
    std::vector<double> starts;
    std::shared_ptr<const void> lender;
    /// No two events that follow one another and differ in time are nearer than this; 0 if that is not known.
    /// It spares a shift asking whether rounding brought any two too close: nearly always none can have been.
    double leastStep = Qx::kNoTime;
};

void EventArray::swap(EventArray& other) noexcept {
    std::swap(m_body, other.m_body);
    std::swap(m_events, other.m_events);
    std::swap(m_starts, other.m_starts);
    std::swap(m_size, other.m_size);
}

void EventArray::share() const noexcept {
    if (m_body != nullptr) {
        m_body->users.fetch_add(1, std::memory_order_relaxed);
    }
}

void EventArray::release() noexcept {
    if (m_body != nullptr && m_body->users.fetch_sub(1, std::memory_order_acq_rel) == 1) {
        delete m_body;
    }
}

void EventArray::adopt(Body* body) noexcept {
    release();
    m_body = body;
}

/// Points at what the body holds.
void EventArray::refer() noexcept {
    m_events = m_body->events.data();
    m_starts = m_body->starts.data();
    m_size = m_body->events.size();
}

bool EventArray::isOwn() const noexcept {
    // What the last other user read is read before anything is changed here.
    return m_body != nullptr && m_body->users.load(std::memory_order_acquire) == 1 &&
           m_body->lender == nullptr;
}

EventArray::Events& EventArray::own(size_t more) {
    if (!isOwn()) {
        auto body = std::make_unique<Body>();
        const size_t room = more == 0 ? m_size : withSlack(m_size + more);
        body->events.reserve(room);
        body->events.assign(begin(), end());
        body->starts.reserve((room + 1) / 2);
        body->starts.assign(m_starts, m_starts + (m_size + 1) / 2);
        body->leastStep = m_body != nullptr ? m_body->leastStep : Qx::kNoTime;
        adopt(body.release());
        refer();
    }
    return m_body->events;
}

void EventArray::settle() {
    takeStarts(m_body->events, m_body->starts);
    m_body->leastStep = 0;
    refer();
}

void EventArray::reserve(size_t events) {
    // By half as much again at least, so that asking for a little more each time does not move all each time.
    Events& all = own();
    const size_t room = events <= all.capacity() ? events : std::max(events, all.capacity() * 3 / 2);
    all.reserve(room);
    m_body->starts.reserve((room + 1) / 2);
    refer();
}

void EventArray::clear() {
    *this = EventArray();
}

void EventArray::append(const channel_event& event) {
    const channel_event added = event; // it may lie in the memory that moves
    Events& events = own(1);
    if (events.size() % 2 == 0) {
        m_body->starts.push_back(added.editTime);
    }
    events.push_back(added);
    refer();
    noteSteps(m_size - 1);
}

void EventArray::assign(Events&& events) {
    auto body = std::make_unique<Body>();
    body->events = std::move(events);
    adopt(body.release());
    settle();
}

void EventArray::borrow(std::shared_ptr<const void> lender, std::span<const channel_event> events) {
    auto body = std::make_unique<Body>();
    body->lender = std::move(lender);
    takeStarts(events, body->starts);
    body->leastStep = 0;
    adopt(body.release());
    m_events = events.data();
    m_starts = m_body->starts.data();
    m_size = events.size();
}

bool EventArray::splice(size_t first, size_t last, std::span<const channel_event> block, double shift) {
    double least = m_body != nullptr ? m_body->leastStep : Qx::kNoTime;
    if (least == 0 && shift != 0) {
        least = shortestStep({begin(), end()});
    }
    if (!isOwn() || m_body->events.capacity() < m_size - (last - first) + block.size()) {
        spliceAnew(first, last, block, shift);
    } else {
        moveTail(m_body->events, last, first + block.size(), shift);
        moveTail(m_body->starts, last / 2, (first + block.size()) / 2, shift);
        std::copy(block.begin(), block.end(), m_body->events.begin() + static_cast<std::ptrdiff_t>(first));
        for (size_t i = 0; i < block.size(); i += 2) {
            m_body->starts[(first + i) / 2] = block[i].editTime;
        }
        refer();
    }
    const size_t tail = first + block.size();
    bool apart = true;
    if (shift != 0 && tail < m_size) {
        // Both ends of a step were rounded, each by no more than half of what lies between two numbers there.
        const double greatest = std::max(std::abs(m_events[tail].editTime), std::abs(back().editTime));
        least -= std::nextafter(greatest, Qx::kNoTime) - greatest;
        if (!(least > Qx::kTimeTolerance)) {
            apart = shortestStep({m_events + tail, end()}) > Qx::kTimeTolerance;
            least = 0;
        }
    }
    const size_t ahead = first > 0 ? first - 1 : 0;
    m_body->leastStep = shortestStep({m_events + ahead, m_events + std::min(tail + 1, m_size)}, least);
    return apart;
}

/// The same into fresh memory: nothing is copied that does not stay.
void EventArray::spliceAnew(size_t first, size_t last, std::span<const channel_event> block, double shift) {
    auto body = std::make_unique<Body>();
    Events& events = body->events;
    events.reserve(withSlack(m_size - (last - first) + block.size()));
    events.assign(begin(), begin() + first);
    events.insert(events.end(), block.begin(), block.end());
    const size_t tail = events.size();
    events.insert(events.end(), begin() + last, end());
    for (size_t i = tail; i < events.size(); ++i) {
        events[i].editTime += shift;
    }
    body->starts.reserve(events.capacity() / 2);
    adopt(body.release());
    settle();
}

void EventArray::noteSteps(size_t index) {
    const size_t from = index > 0 ? index - 1 : 0;
    m_body->leastStep =
        shortestStep({m_events + from, m_events + std::min(index + 2, m_size)}, m_body->leastStep);
}

void EventArray::setTime(size_t index, double time) {
    own()[index].editTime = time;
    if (index % 2 == 0) {
        m_body->starts[index / 2] = time;
    }
    noteSteps(index);
}
