// Random operations on cels with marks on, beside and near cuts, and with times that are huge or tiny.

#include "edit/model/cel.h"
#include "torture.h"

#include <cmath>
#include <limits>
#include <set>

namespace torture {

namespace {

constexpr double kTolerance = Qx::kTimeTolerance;

class CelSteps {
public:
    explicit CelSteps(Case& its) : m_case(its), m_cel(fresh()) {}

    void run(size_t steps) {
        for (size_t i = 0; i < steps; ++i) {
            if (!step(i) || m_cel->numPairs() > 40) {
                m_cel = fresh();
            }
        }
        m_case.tried(steps - 1);
    }

private:
    std::unique_ptr<cel> fresh() {
        auto its = std::make_unique<cel>();
        double time = m_case.chance(3) ? 0 : static_cast<double>(m_case.below(3));
        for (size_t pairs = m_case.below(7); pairs > 0; --pairs) {
            // Lengths down to none at all: a cel may have been read from a file.
            static constexpr double kLengths[] = {1, 2, 5, 1, 2, 0.04, 3 * kTolerance, 1.5 * kTolerance, 0};
            const double length = m_case.oneOf(kLengths);
            const cookie strip =
                m_case.chance(4) ? black_cookie
                                 : cookie(Cookie_Type::Material, static_cast<int>(1 + m_case.below(3)), 0);
            its->appendEventPair(strip, static_cast<double>(m_case.below(100)), time, length);
            time += length + (m_case.chance(4) ? m_case.oneOf(kLengths) : 0);
        }
        return its;
    }

    /// A mark: at or near a cut, or anywhere, or past what a time may be.
    double mark(const cel& of) {
        static constexpr double kNear[] = {0,    0, 0.5, -0.5,     1,        -1,  1.5,
                                           -1.5, 2, -2,  0.999999, 1.000001, 1e-4};
        static constexpr double kOdd[] = {0,    -1,   1e-9, -1e-9, 1e8,   1e9,
                                          -1e9, 1e12, 1e99, 2e81,  1e300, 1e-300};
        if (m_case.chance(40)) {
            return m_case.chance(8) ? std::numeric_limits<double>::quiet_NaN() : m_case.oneOf(kOdd);
        }
        if (of.numEvents() > 0 && !m_case.chance(4)) {
            const auto event = static_cast<int>(m_case.below(static_cast<size_t>(of.numEvents())));
            return of.get_event(event).editTime + m_case.oneOf(kNear) * kTolerance;
        }
        return static_cast<double>(m_case.below(1000)) / 50;
    }

    /// False if something was found.
    bool step(size_t number) {
        const auto before = m_cel->copy();
        const auto other = fresh();
        const bool own = m_case.chance(4);
        const cel* const source = own ? before.get() : other.get();
        const cel::Range range(mark(*source), mark(*source));
        const double at = mark(*m_cel);
        const double to = mark(*m_cel);
        cel::IdMap ids;
        bool done = true;
        std::unique_ptr<cel> made;
        String what;
        switch (m_case.below(9)) {
        case 0:
            what = "insert";
            done = m_cel->insert(own ? m_cel.get() : source, range, at, ids);
            break;
        case 1:
            what = "remove";
            done = m_cel->remove({at, to});
            break;
        case 2:
            what = "replace";
            done = m_cel->replace(own ? m_cel.get() : source, range, at, ids);
            break;
        case 3:
            what = "replace of material";
            done = m_cel->replace(own ? m_cel.get() : source, range, at, ids, true);
            break;
        case 4:
            what = "extract";
            made = m_cel->extract(at, to, m_case.chance(2) ? cel::KeepTimes : 0);
            break;
        case 5:
            what = "rescale";
            made =
                m_cel->rescale(at, to, range.start(), range.end(), 1, 1, static_cast<int>(m_case.below(2)));
            break;
        case 6: {
            what = "quantise";
            static constexpr double kResolutions[] = {0.04, 1, 1e-6, 1e-9, 5e-7, 1e-300, 1e6};
            const auto copied = m_cel->copy();
            copied->set_resolution(m_case.oneOf(kResolutions));
            made = copied->quantise();
            break;
        }
        case 7:
            what = "weld";
            done = m_cel->weld(source, at);
            break;
        default:
            what = "fill";
            done = m_cel->fillToTime(at);
            if (m_case.chance(2)) {
                what = "simplify";
                done = m_cel->simplify(m_case.chance(2) ? Simplification::MergeBlack
                                                        : Simplification::MergeThrough) ||
                       done;
            }
        }
        const String seen =
            String::format("step %zu, marks %s %s, range %s %s: ", number, Qx::doubleToText(at).c_str(),
                           Qx::doubleToText(to).c_str(), Qx::doubleToText(range.start()).c_str(),
                           Qx::doubleToText(range.end()).c_str()) +
            drawn(*before) + " (" + drawn(*source) + ") -> " + drawn(made ? *made : *m_cel);
        const bool unchanged =
            done || check(isSame(*m_cel, *before), what + " answers false and has changed the cel", seen);
        const cel& result = made ? *made : *m_cel;
        const double grain =
            grainOf({at, to, range.start(), range.end(), before->get_start_time(), before->get_end_time(),
                     source->get_start_time(), source->get_end_time(), result.get_start_time(),
                     result.get_end_time()});
        return unchanged &&
               check(result.is_good_cel() != 0, what + " makes a cel that is not consistent", seen) &&
               check(isFine(result, grain) || !isFine(*before, grain) || !isFine(*source, grain),
                     what + " leaves a piece or a gap shorter than the tolerance", seen);
    }

    /// What was found is told once a case.
    bool check(bool holds, const String& kind, const String& seen) {
        if (!holds && m_told.insert(kind).second) {
            m_case.found(kind, seen);
        }
        return holds;
    }

    /// True if no piece and no gap that has a length is shorter than the tolerance, as far as rounding lets
    /// one say.
    static bool isFine(const cel& its, double grain) {
        for (int i = 1; i < its.numEvents(); ++i) {
            const double length = its.get_event(i).editTime - its.get_event(i - 1).editTime;
            if (length > grain && length < kTolerance - grain) {
                return false;
            }
        }
        return true;
    }

    /// What rounding makes of times as great as these.
    static double grainOf(std::initializer_list<double> times) {
        double greatest = 0;
        for (const double time : times) {
            greatest = std::max(greatest, std::isfinite(time) && std::abs(time) < 1e13 ? std::abs(time) : 0);
        }
        return 32 * greatest * std::numeric_limits<double>::epsilon();
    }

    static bool isSame(const cel& a, const cel& b) {
        bool same = a.numEvents() == b.numEvents();
        for (int i = 0; same && i < a.numEvents(); ++i) {
            same = a.get_event(i) == b.get_event(i);
        }
        return same;
    }

    static String drawn(const cel& its) {
        String text;
        for (int i = 0; i < its.numEvents() && i < 24; ++i) {
            text += (i % 2 == 0 ? "[" : "-") + Qx::doubleToText(its.get_event(i).editTime) +
                    (i % 2 == 0 ? "" : "]");
        }
        return text;
    }

    Case& m_case;
    std::unique_ptr<cel> m_cel;
    std::set<String> m_told;
};

} // namespace

const Attack kCels{"cels", "random operations on cels with marks near cuts",
                   [](Case& its) { CelSteps(its).run(20000); }, nullptr};

} // namespace torture
