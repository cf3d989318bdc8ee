#include "platform/store/configb.h"

#include "platform/store/detail/header_values.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <limits>
#include <optional>

namespace {

unsigned char lowerAscii(char c) {
    return static_cast<unsigned char>(c >= 'A' && c <= 'Z' ? c - 'A' + 'a' : c);
}

bool sameValue(const configb::Value& a, const configb::Value& b) {
    const double* x = std::get_if<double>(&a);
    const double* y = std::get_if<double>(&b);
    if (x != nullptr && y != nullptr) {
        return std::bit_cast<uint64_t>(*x) == std::bit_cast<uint64_t>(*y);
    }
    return a == b;
}

/// The value as a whole number; none when that would lose something or it is no number.
std::optional<int64_t> asWhole(const configb::Value& value) {
    if (const auto* small = std::get_if<int32_t>(&value)) {
        return *small;
    }
    if (const auto* large = std::get_if<int64_t>(&value)) {
        return *large;
    }
    if (const auto* flag = std::get_if<bool>(&value)) {
        return *flag ? 1 : 0;
    }
    const auto* real = std::get_if<double>(&value);
    // The ends of the range of int64 as doubles; the upper one lies just outside it.
    if (real == nullptr || !(*real >= -0x1p63 && *real < 0x1p63) || std::trunc(*real) != *real) {
        return std::nullopt;
    }
    return static_cast<int64_t>(*real);
}

std::optional<double> asReal(const configb::Value& value) {
    if (const auto* real = std::get_if<double>(&value)) {
        return *real;
    }
    const std::optional<int64_t> whole = asWhole(value);
    if (!whole) {
        return std::nullopt;
    }
    const auto real = static_cast<double>(*whole);
    const std::optional<int64_t> back = asWhole(configb::Value(real));
    return back == whole ? std::optional<double>(real) : std::nullopt;
}

} // namespace

Dirtiable::~Dirtiable() = default;

bool configb::NoCaseLess::operator()(std::string_view a, std::string_view b) const {
    return std::lexicographical_compare(a.begin(), a.end(), b.begin(), b.end(),
                                        [](char x, char y) { return lowerAscii(x) < lowerAscii(y); });
}

configb::configb(String name, String endMarker, Dirtiable* observer)
    : m_name(std::move(name)), m_endMarker(std::move(endMarker)), m_observer(observer) {}

configb::configb(const configb& other)
    : m_name(other.m_name), m_endMarker(other.m_endMarker), m_order(other.m_order), m_index(other.m_index) {}

configb& configb::operator=(const configb& other) {
    if (this != &other) {
        takeValues(other);
    }
    return *this;
}

void configb::takeValues(const configb& other) {
    if (*this == other) {
        return;
    }
    m_order = other.m_order;
    m_index = other.m_index;
    changed();
}

const configb::Entry* configb::entry(std::string_view key) const {
    const auto found = m_index.find(key);
    return found == m_index.end() ? nullptr : &m_order[found->second];
}

const configb::Value* configb::find(std::string_view key) const {
    const Entry* found = entry(key);
    return found == nullptr ? nullptr : &found->value;
}

bool configb::contains(std::string_view key) const {
    return entry(key) != nullptr;
}

int configb::getInt(std::string_view key, int defaultValue) const {
    const Value* value = find(key);
    const std::optional<int64_t> whole = value != nullptr ? asWhole(*value) : std::nullopt;
    const bool fits =
        whole && *whole >= std::numeric_limits<int>::min() && *whole <= std::numeric_limits<int>::max();
    return fits ? static_cast<int>(*whole) : defaultValue;
}

int64_t configb::getInt64(std::string_view key, int64_t defaultValue) const {
    const Value* value = find(key);
    return value != nullptr ? asWhole(*value).value_or(defaultValue) : defaultValue;
}

double configb::getDouble(std::string_view key, double defaultValue) const {
    const Value* value = find(key);
    return value != nullptr ? asReal(*value).value_or(defaultValue) : defaultValue;
}

String configb::getString(std::string_view key, const String& defaultValue) const {
    const Value* value = find(key);
    const String* text = value != nullptr ? std::get_if<String>(value) : nullptr;
    return text != nullptr ? *text : defaultValue;
}

cookie configb::getCookie(std::string_view key, const cookie& defaultValue) const {
    const Value* value = find(key);
    const cookie* item = value != nullptr ? std::get_if<cookie>(value) : nullptr;
    return item != nullptr ? *item : defaultValue;
}

bool configb::getBool(std::string_view key, bool defaultValue) const {
    const Value* value = find(key);
    const std::optional<int64_t> whole = value != nullptr ? asWhole(*value) : std::nullopt;
    return whole && (*whole == 0 || *whole == 1) ? *whole == 1 : defaultValue;
}

bool configb::setInt(std::string_view key, int value) {
    return set(key, Value(std::in_place_type<int32_t>, value));
}

bool configb::setInt64(std::string_view key, int64_t value) {
    return set(key, Value(std::in_place_type<int64_t>, value));
}

bool configb::setDouble(std::string_view key, double value) {
    return set(key, Value(value));
}

bool configb::setString(std::string_view key, String value) {
    return set(key, Value(std::move(value)));
}

bool configb::setCookie(std::string_view key, const cookie& value) {
    return set(key, Value(value));
}

bool configb::setBool(std::string_view key, bool value) {
    return set(key, Value(value));
}

bool configb::set(std::string_view key, Value value) {
    return put(key, std::move(value), String());
}

bool configb::put(std::string_view key, Value value, String foreignType) {
    if (!Qx::detail::isHeaderKey(key)) {
        return false;
    }
    if (cookie* item = std::get_if<cookie>(&value); item != nullptr && !item->is_valid()) {
        // Neither form keeps the words of a cookie that is none.
        *item = invalid_cookie;
    }
    const auto found = m_index.find(key);
    if (found == m_index.end()) {
        m_order.push_back(Entry{String(key), std::move(value), std::move(foreignType)});
        try {
            m_index.emplace(String(key), m_order.size() - 1);
        } catch (...) {
            m_order.pop_back();
            throw;
        }
        changed();
        return true;
    }
    Entry& there = m_order[found->second];
    if (there.foreignType != foreignType || !sameValue(there.value, value)) {
        there.value = std::move(value);
        there.foreignType = std::move(foreignType);
        changed();
    }
    return true;
}

bool configb::remove(std::string_view key) {
    const auto found = m_index.find(key);
    if (found == m_index.end()) {
        return false;
    }
    m_order[found->second] = Entry{};
    m_index.erase(found);
    compact();
    changed();
    return true;
}

void configb::compact() {
    // Closing up only once half of the entries are gone keeps the removal of many keys linear.
    if (m_order.size() <= m_index.size() * 2) {
        return;
    }
    std::erase_if(m_order, [](const Entry& gone) { return gone.key.empty(); });
    for (size_t i = 0; i < m_order.size(); ++i) {
        m_index.find(m_order[i].key)->second = i;
    }
}

void configb::clear() {
    if (m_index.empty()) {
        return;
    }
    m_index.clear();
    m_order.clear();
    changed();
}

std::vector<String> configb::keys() const {
    std::vector<String> list;
    list.reserve(size());
    for (const Entry& there : m_order) {
        if (!there.key.empty()) {
            list.push_back(there.key);
        }
    }
    return list;
}

void configb::changed() {
    m_dirty = true;
    if (m_observer != nullptr) {
        m_observer->onConfigbDirty();
    }
}

bool configb::sameEntry(const Entry& a, const Entry& b) {
    return a.key == b.key && a.foreignType == b.foreignType && sameValue(a.value, b.value);
}

bool configb::operator==(const configb& other) const {
    if (size() != other.size()) {
        return false;
    }
    size_t j = 0;
    for (const Entry& mine : m_order) {
        if (mine.key.empty()) {
            continue;
        }
        while (other.m_order[j].key.empty()) {
            ++j;
        }
        if (!sameEntry(mine, other.m_order[j])) {
            return false;
        }
        ++j;
    }
    return true;
}
