#pragma once

#include "platform/base/qx_string.h"

#include <cstdint>
#include <random>
#include <string>
#include <vector>

/// The torture programme: attacks on the library and on qmedit, case by case, for a given time.
///
/// An attack is made of cases, each of which is told by its number and the seed of the run alone: it can be
/// run again without the others. Every case is a process with a folder of its own, so that a crash, a
/// deadlock and what a case leaves behind are seen and concern no other case.
namespace torture {

/// What a case works with.
class Case {
public:
    Case(uint64_t seed, size_t number, std::string folder, int reportTo);

    [[nodiscard]] size_t number() const { return m_number; }
    /// A folder of the case's own, also the place of its temporary folders.
    [[nodiscard]] const std::string& folder() const { return m_folder; }

    /// Tells of a fault: its kind, a text that is the same for every case that shows it, and what was seen.
    void found(const String& kind, const String& seen);
    /// The same unless something holds.
    void expect(bool holds, const String& kind, const String& seen = {}) {
        if (!holds) {
            found(kind, seen);
        }
    }
    /// Tells how many things were tried in the case beyond one.
    void tried(size_t more);

    /// \name Choices, the same whenever the case is run again
    /// @{
    [[nodiscard]] size_t below(size_t limit) { return limit == 0 ? 0 : m_random() % limit; }
    [[nodiscard]] bool chance(size_t in) { return below(in) == 0; }
    template <typename Container>
    const auto& oneOf(const Container& all) {
        return all[below(std::size(all))];
    }
    /// @}

private:
    size_t m_number;
    std::string m_folder;
    int m_reportTo;
    std::mt19937_64 m_random;
};

struct Attack {
    const char* name;
    const char* about; ///< for the table, a few words
    void (*run)(Case&);
    /// The numbers of all cases, in a process of its own; null for an attack that has ever more of them.
    std::vector<size_t> (*cases)();
    /// A case that has used no processor time for so many seconds is stuck.
    int patience = 20;
    /// How much of the time it gets, beside one part for most.
    int parts = 1;
};

/// The attacks, each defined in the file of its name.
extern const Attack kCrashStates, kReorderedCrashStates, kFaults, kDisk, kAllocations, kInterrupts,
    kProcesses, kThreads, kProjects, kCels, kDamage;

} // namespace torture
