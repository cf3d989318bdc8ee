#include "platform/notify/notify_msg.h"

#include <deque>
#include <map>
#include <mutex>

namespace {

/// The process-wide dictionary of message types. Never destroyed: statics hold types of their own.
struct Dictionary {
    std::mutex mutex;
    std::deque<String> names; ///< the name of type n at n - 1; a name never moves
    std::map<std::string_view, uint32_t> numbers;
};

Dictionary& dictionary() {
    static auto& shared = *new Dictionary;
    return shared;
}

} // namespace

NotifyMsgType::NotifyMsgType(std::string_view name) {
    if (name.empty()) {
        return;
    }
    Dictionary& known = dictionary();
    const std::lock_guard hold(known.mutex);
    const auto found = known.numbers.find(name);
    if (found != known.numbers.end()) {
        m_number = found->second;
        return;
    }
    known.names.emplace_back(name);
    m_number = static_cast<uint32_t>(known.names.size());
    known.numbers.emplace(known.names.back(), m_number);
}

String NotifyMsgType::name() const {
    if (!valid()) {
        return {};
    }
    Dictionary& known = dictionary();
    const std::lock_guard hold(known.mutex);
    return known.names[m_number - 1];
}
