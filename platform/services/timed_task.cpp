#include "platform/services/timed_task.h"

#include <map>
#include <mutex>

namespace Qx {

/// Nodes of a map never move, so that a counter may be used without the mutex.
struct TimedTask::Sections {
    mutable std::mutex mutex;
    std::map<std::string, Counter, std::less<>> counters;
};

TimedTask::TimedTask() : m_sections(new Sections) {}

TimedTask::~TimedTask() {
    delete m_sections;
}

TimedTask& TimedTask::named(const char* name) {
    static auto& mutex = *new std::mutex;
    static auto& tasks = *new std::map<std::string, TimedTask*, std::less<>>;
    const std::lock_guard hold(mutex);
    auto place = tasks.find(std::string_view(name));
    if (place == tasks.end()) {
        place = tasks.emplace(name, new TimedTask).first;
    }
    return *place->second;
}

TimedTask::Counter& TimedTask::section(const char* name) {
    const std::lock_guard hold(m_sections->mutex);
    const auto place = m_sections->counters.find(std::string_view(name));
    return place != m_sections->counters.end() ? place->second : m_sections->counters[name];
}

std::vector<TimedTask::Times> TimedTask::times() const {
    const std::lock_guard hold(m_sections->mutex);
    std::vector<Times> all;
    for (const auto& [name, counter] : m_sections->counters) {
        all.push_back({name, counter.calls(), counter.time()});
    }
    return all;
}

} // namespace Qx
