#include "platform/media/level_store.h"

#include "platform/store/pstream.h"

#include <algorithm>
#include <cmath>

namespace Aud::DynamicLevelControl {

namespace {

constexpr double kTolerance = Qx::kTimeTolerance;
using Nodes = std::vector<Node>;
using Range = NumRange<double, Ordered>;
constexpr double kLevelTolerance = 1e-6;
constexpr size_t kNodeSize = 16;

bool isUsable(double time) {
    return std::abs(time) <= Store::kGreatestTime;
}

bool isUsable(const Range& range) {
    return isUsable(range.start()) && isUsable(range.end()) && range.length() > kTolerance;
}

/// Position of the first node at or after a time.
size_t positionOf(const Nodes& nodes, double time) {
    const auto found = std::lower_bound(nodes.begin(), nodes.end(), time,
                                        [](const Node& node, double limit) { return node.time < limit; });
    return static_cast<size_t>(found - nodes.begin());
}

double levelOn(const Nodes& nodes, double time) {
    if (nodes.empty()) {
        return 1;
    }
    const size_t after = positionOf(nodes, time);
    if (after == 0) {
        return double{nodes.front().level};
    }
    if (after == nodes.size()) {
        return double{nodes.back().level};
    }
    const Node& a = nodes[after - 1];
    const Node& b = nodes[after];
    return double{a.level} + (double{b.level} - double{a.level}) * (time - a.time) / (b.time - a.time);
}

/// An envelope that is put together from parts of others, in order of time. Where one part ends at another
/// level than the next begins with, a step of `Store::kStep` seconds leads over.
class Assembly {
public:
    explicit Assembly(size_t nodes) { m_nodes.reserve(nodes); }

    /// What lies before a time.
    void begin(const Nodes& nodes, double end) {
        copy(nodes, 0, end, 0);
        ended(nodes, end);
    }

    /// The part [from, to] of an envelope, laid at `at`, where the part before it ends.
    void part(const Nodes& nodes, double from, double to, double at) {
        join(nodes, from, at);
        copy(nodes, positionOf(nodes, from), to, at - from);
        ended(nodes, to);
    }

    /// What lies after a time.
    void rest(const Nodes& nodes, double from, double at) {
        join(nodes, from, at);
        copy(nodes, positionOf(nodes, from), Qx::kNoTime, at - from);
    }

    [[nodiscard]] Nodes take() { return std::move(m_nodes); }

private:
    void ended(const Nodes& nodes, double end) {
        m_endLevel = levelOn(nodes, end);
        m_levelBefore = levelOn(nodes, end - Store::kStep);
    }

    void join(const Nodes& nodes, double from, double at) {
        const double level = levelOn(nodes, from);
        if (std::abs(level - m_endLevel) > kLevelTolerance) {
            while (!m_nodes.empty() && m_nodes.back().time >= at - Store::kStep - kTolerance) {
                m_nodes.pop_back();
            }
            add(at - Store::kStep, m_levelBefore);
        }
        add(at, level);
    }

    void copy(const Nodes& nodes, size_t first, double end, double shift) {
        for (size_t i = first; i < nodes.size() && nodes[i].time < end - kTolerance; ++i) {
            add(nodes[i].time + shift, double{nodes[i].level});
        }
    }

    void add(double time, double level) {
        const Node node{time, static_cast<float>(level)};
        if (!m_nodes.empty() && time <= m_nodes.back().time + kTolerance) {
            m_nodes.back().level = node.level;
        } else {
            m_nodes.push_back(node);
        }
    }

    Nodes m_nodes;
    double m_endLevel = 1;
    double m_levelBefore = 1;
};

} // namespace

size_t Store::insertNode(double time, float level) {
    if (!isUsable(time) || !std::isfinite(level)) {
        return m_nodes.size();
    }
    const size_t at = positionOf(m_nodes, time - kTolerance);
    if (at < m_nodes.size() && m_nodes[at].time <= time + kTolerance) {
        m_nodes[at].level = level;
        return at;
    }
    m_nodes.insert(m_nodes.begin() + static_cast<std::ptrdiff_t>(at), Node{time, level});
    return at;
}

bool Store::removeNode(size_t i) {
    if (i >= m_nodes.size()) {
        return false;
    }
    m_nodes.erase(m_nodes.begin() + static_cast<std::ptrdiff_t>(i));
    return true;
}

bool Store::moveNode(size_t i, double time) {
    if (i >= m_nodes.size() || !isUsable(time) || (i > 0 && time <= m_nodes[i - 1].time + kTolerance) ||
        (i + 1 < m_nodes.size() && time >= m_nodes[i + 1].time - kTolerance)) {
        return false;
    }
    m_nodes[i].time = time;
    return true;
}

bool Store::setLevel(size_t i, float level) {
    if (i >= m_nodes.size() || !std::isfinite(level)) {
        return false;
    }
    m_nodes[i].level = level;
    return true;
}

double Store::levelAt(double time) const {
    return levelOn(m_nodes, time);
}

void Store::remove(const Range& range) {
    if (!isUsable(range) || m_nodes.empty()) {
        return;
    }
    Assembly built(m_nodes.size() + 2);
    built.begin(m_nodes, range.start());
    built.rest(m_nodes, range.end(), range.start());
    m_nodes = built.take();
}

void Store::insert(const Store& source, const Range& sourceRange, double at) {
    const double last = m_nodes.empty() ? at : std::max(at, m_nodes.back().time);
    if (!isUsable(sourceRange) || !isUsable(at) || !isUsable(last + sourceRange.length()) ||
        (m_nodes.empty() && source.empty())) {
        return;
    }
    Assembly built(m_nodes.size() + source.size() + 4);
    built.begin(m_nodes, at);
    built.part(source.m_nodes, sourceRange.start(), sourceRange.end(), at);
    built.rest(m_nodes, at, at + sourceRange.length());
    m_nodes = built.take();
}

void Store::replace(const Store& source, const Range& sourceRange, double at) {
    const double end = at + sourceRange.length();
    if (!isUsable(sourceRange) || !isUsable(at) || !isUsable(end) || (m_nodes.empty() && source.empty())) {
        return;
    }
    Assembly built(m_nodes.size() + source.size() + 4);
    built.begin(m_nodes, at);
    built.part(source.m_nodes, sourceRange.start(), sourceRange.end(), at);
    built.rest(m_nodes, end, end);
    m_nodes = built.take();
}

void Store::simplify() {
    if (m_nodes.size() < 3) {
        return;
    }
    // Slopes from the last kept node that pass every node dropped since within the tolerance.
    double least = -INFINITY;
    double most = INFINITY;
    size_t kept = 0;
    for (size_t i = 1; i + 1 < m_nodes.size(); ++i) {
        const Node& from = m_nodes[kept];
        const double time = m_nodes[i].time - from.time;
        const double rise = double{m_nodes[i].level} - double{from.level};
        const double nextRise = double{m_nodes[i + 1].level} - double{from.level};
        const double slope = nextRise / (m_nodes[i + 1].time - from.time);
        const double low = std::max(least, (rise - kLevelTolerance) / time);
        const double high = std::min(most, (rise + kLevelTolerance) / time);
        if (slope >= low && slope <= high) {
            least = low;
            most = high;
            continue;
        }
        m_nodes[++kept] = m_nodes[i];
        least = -INFINITY;
        most = INFINITY;
    }
    m_nodes[++kept] = m_nodes.back();
    m_nodes.resize(kept + 1);
}

void Store::pack(PStream& stream) const {
    stream.reserve(m_nodes.size() * kNodeSize + 4);
    stream.setUnsignedLong(static_cast<uint32_t>(m_nodes.size()));
    for (const Node& node : m_nodes) {
        stream.setDouble(node.time);
        stream.setFloat(node.level);
        stream.setUnsignedLong(0);
    }
}

void Store::unpack(PStream& stream) {
    const size_t count = stream.getCount(kNodeSize);
    Nodes nodes;
    nodes.reserve(count);
    for (size_t i = 0; i < count && stream.good(); ++i) {
        Node node;
        node.time = stream.getDouble();
        node.level = stream.getFloat();
        const bool inOrder = nodes.empty() || node.time > nodes.back().time;
        if (stream.getUnsignedLong() != 0 || !isUsable(node.time) || !std::isfinite(node.level) || !inOrder) {
            stream.fail();
        }
        nodes.push_back(node);
    }
    if (stream.good()) {
        m_nodes = std::move(nodes);
    }
}

} // namespace Aud::DynamicLevelControl
