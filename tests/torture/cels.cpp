// Random operations on cels with marks on, beside and near cuts, and with times that are huge or tiny.

#include "support/cel_marks.h"
#include "torture.h"

#include <set>

namespace torture {

namespace {

void run(Case& its) {
    constexpr size_t kSteps = 20000;
    const auto seed = static_cast<unsigned>(its.below(UINT32_MAX));
    test::MarksNearCuts marks(seed);
    std::set<String> told; // what was found is told once a case
    for (size_t i = 0; i < kSteps; ++i) {
        const String problem = marks.step();
        const String kind = problem.substr(0, problem.find(" leaves "));
        if (!problem.empty() && told.insert(kind).second) {
            its.found(kind, String::format("seed %u, step %zu: ", seed, i) + problem);
        }
    }
    its.tried(kSteps - 1);
}

} // namespace

const Attack kCels{"cels", "random operations on cels with marks near cuts", run, nullptr};

} // namespace torture
