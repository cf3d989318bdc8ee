#pragma once

#include "edit/model/cel_event_pair.h"
#include "support/cel_layout.h"

#include <limits>
#include <random>

namespace test {

inline std::vector<channel_event> eventsOf(const cel& its) {
    std::vector<channel_event> events(static_cast<size_t>(its.numEvents()));
    for (size_t i = 0; i < events.size(); ++i) {
        events[i] = its.get_event(static_cast<int>(i));
    }
    return events;
}

inline int numWithoutLength(const cel& its) {
    int count = 0;
    for (int i = 0; i + 1 < its.numEvents(); i += 2) {
        count += its.getChanEventPtr(i)->editTime == its.getChanEventPtr(i + 1)->editTime ? 1 : 0;
    }
    return count;
}

/// Every operation of a cel with marks at, beside and around its cuts, at times of every magnitude.
class MarksNearCuts {
public:
    explicit MarksNearCuts(unsigned seed) : m_random(seed) { startAgain(); }

    /// One random operation; what is wrong with the result, or nothing.
    std::string step() {
        if (m_its->numPairs() > 20 || pick(100) == 0) {
            startAgain();
        }
        const std::vector<channel_event> before = eventsOf(*m_its);
        const auto source = pick(3) == 0 ? m_its->copy() : freshCel();
        const int allowed = numWithoutLength(*m_its) + numWithoutLength(*source);
        const int operation = pick(16);
        m_makesEmptyPairs = false;
        const bool done = operation < 8 ? onRegion(operation, *source) : onEvents(operation - 8, *source);
        const std::string what =
            "operation " + std::to_string(operation) + (done ? " leaves " : " refuses and leaves ");
        if (!done && eventsOf(*m_its) != before) {
            return what + "another cel";
        }
        if (!m_makesEmptyPairs && numWithoutLength(*m_its) > allowed) {
            return what + "a pair of no length";
        }
        const std::string problem = check(*m_its);
        return problem.empty() ? "" : what + problem;
    }

private:
    static std::string check(const cel& its) {
        for (int i = 1; i < its.numEvents(); ++i) {
            const double step = its.getChanEventPtr(i)->editTime - its.getChanEventPtr(i - 1)->editTime;
            if (step != 0 && !(step > Qx::kTimeTolerance)) {
                return "a step of " + std::to_string(step * 1e6) + " us to event " + std::to_string(i);
            }
        }
        return its.is_good_cel() != 0 ? "" : "an inconsistent cel";
    }

    int pick(int below) { return static_cast<int>(m_random() % static_cast<unsigned>(below)); }
    template <size_t N>
    double oneOf(const double (&values)[N]) {
        return values[static_cast<size_t>(pick(N))];
    }
    double length() {
        return oneOf({0.04, 1, 5, 3600, 1e-5, 3e-6, 1.5e-6, 1.01e-6, std::nextafter(1e-6, 1)});
    }
    double offset() {
        const double times =
            oneOf({0, 0, 1, -1, 2, -2, 0.5, -0.5, 0.9, -0.9, 1.1, -1.1, 1.5, -1.5, 1e-9, -1e-9});
        const double off = times * Qx::kTimeTolerance;
        return pick(3) == 0 ? std::nextafter(off, pick(2) == 0 ? -1 : 1) : off;
    }
    double mark() {
        const int kind = pick(40);
        if (kind == 0) {
            return oneOf({0, std::numeric_limits<double>::denorm_min(), -std::numeric_limits<double>::min(),
                          1e9, -1e9, 1e9 - 1e-6, 1e99, -1e99});
        }
        if (kind < 6) {
            return m_lastMark;
        }
        double at = m_base + pick(20);
        if (kind < 34 && m_its->numEvents() > 0) {
            at = m_its->get_event(pick(m_its->numEvents())).editTime;
        }
        const double exact = at + offset();
        return m_lastMark = pick(3) == 0 ? std::nextafter(exact, pick(2) == 0 ? -2e9 : 2e9) : exact;
    }

    std::unique_ptr<cel> freshCel() {
        auto made = std::make_unique<cel>();
        double at = m_base;
        for (int pairs = 1 + pick(5); pairs > 0; --pairs) {
            const double long_ = length();
            made->appendEventPair(layout::sourceOf(pick(4) == 0 ? '.' : 'A'), pick(100), at, long_);
            at = made->get_end_time() + (pick(3) == 0 ? length() : 0);
        }
        return made;
    }
    void startAgain() {
        m_base = oneOf({0, 0, 1, -7, 3600, 86400, 1e6, -1e6, 5e8, 9.99e8, -9.99e8, 1e-300});
        m_its = freshCel();
        m_lastMark = m_base;
    }
    bool take(std::unique_ptr<cel> made) {
        if (made == nullptr) {
            return false;
        }
        m_its = std::move(made);
        return true;
    }

    bool onRegion(int operation, const cel& source) {
        cel::IdMap ids;
        cel::Splits splits;
        const double from = mark();
        const double to = pick(4) == 0 ? from + length() : mark();
        const double at = mark();
        switch (operation) {
        case 0:
        case 1:
            return m_its->insert(&source, {from, to}, at, ids, &splits);
        case 2:
            return m_its->remove({from, to}, &splits);
        case 3:
        case 4:
            return m_its->replace(&source, {from, to}, at, ids, false, &splits);
        case 5:
            return m_its->replace(&source, {from, to}, at, ids, true, &splits);
        case 6:
            return take(m_its->extract(from, to, static_cast<unsigned>(pick(2))));
        default:
            return take(m_its->rescale(at, pick(2) == 0 ? at + length() : mark(), from, to, 1, 0.5, pick(2)));
        }
    }

    bool onEvents(int operation, const cel& source) {
        const int event = pick(m_its->numEvents() + 1);
        switch (operation) {
        case 0:
            return m_its->weld(&source, m_its->get_end_time() - source.get_start_time() + offset());
        case 1:
            m_its->set_resolution(
                oneOf({0, 5e-324, 1e-300, 1e-7, 1e-6, 1.000001e-6, 3e-6, 0.04, 1e9, 1e300}));
            return take(m_its->quantise());
        case 2:
            return take(m_its->add_black_to_ends(pick(3), oneOf({0, 1}) == 0 ? 'S' : 'B'));
        case 3:
            return m_its->fillToTime(mark()) ||
                   m_its->simplify(Simplification::MergeBlack | Simplification::MergeThrough);
        case 4: {
            cel* parts[8] = {};
            int count = 0;
            m_its->chequerboard(parts, count, 8, std::abs(offset()), pick(4), SoftCuts::Keep);
            const int chosen = pick(8);
            for (int i = 0; i < 8; ++i) {
                std::unique_ptr<cel> part(parts[i]);
                if (i == chosen && part != nullptr) {
                    take(std::move(part));
                    count = -1;
                }
            }
            return count < 0;
        }
        default:
            m_makesEmptyPairs = true;
            break;
        }
        if (operation == 5) {
            return m_its->set_edit_time({m_its.get(), event}, mark(), pick(2) == 0);
        }
        if (operation == 6) {
            return m_its->insertEventPair(event / 2, black_cookie, 0, mark(), std::abs(offset())).valid() !=
                   0;
        }
        channel_event changed = m_its->get_event(event);
        changed.editTime = mark();
        return m_its->setEvent(event, changed);
    }

    std::mt19937 m_random;
    std::unique_ptr<cel> m_its;
    double m_base = 0;
    double m_lastMark = 0;
    bool m_makesEmptyPairs = false;
};

} // namespace test
