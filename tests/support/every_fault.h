#pragma once

#include "support/child_process.h"
#include "support/faulty_file_system.h"

#include <functional>
#include <gtest/gtest.h>

namespace test {

/// What meets an action at one of its calls on the file system.
struct Fault {
    enum Kind {
        Fails,      ///< the call fails with `code`
        Unanswered, ///< a question about a name does
        Killed      ///< the process dies at a call that can change something
    };
    Kind kind = Fails;
    int code = EIO;
};

/// How the action ended.
struct Met {
    size_t at = 0;     ///< the number of the call, from 1
    bool isMet = true; ///< false if the action ended before it came so far
    bool done = false; ///< what the action answered; false if it was killed
    String operation;  ///< the call that failed, as `FaultyFileSystem` lists it
};

/// Performs an action again and again, with a fault at its first call on the file system, its second, and so
/// on, until the action ends before the fault comes.
///
/// `setUp()` makes what the action works on and returns it. `act(place, arm)` answers whether all was done;
/// faults come after it has called `arm`. With `Fault::Killed` it runs in a child process.
/// `check(place, met)` looks at what is left, with the faults gone. Returns how many calls were met.
template <typename SetUp, typename Act, typename Check>
size_t everyFault(const Fault& fault, const SetUp& setUp, const Act& act, const Check& check) {
    Met met;
    for (met.at = 1; met.isMet && met.at < 1000 && !testing::Test::HasFatalFailure(); ++met.at) {
        auto place = setUp();
        if (fault.kind == Fault::Killed) {
            const ChildEnd end = runInChild([&] {
                std::optional<FaultyFileSystem> disk;
                return bool(act(place, [&] { disk.emplace().killAtWrite(met.at); }));
            });
            EXPECT_NE(end, ChildEnd::Failed);
            met.done = end == ChildEnd::Succeeded;
            met.isMet = end == ChildEnd::Killed;
        } else {
            std::optional<FaultyFileSystem> disk;
            met.done = bool(act(place, [&] {
                disk.emplace();
                fault.kind == Fault::Fails ? disk->failAt(met.at, fault.code)
                                           : disk->failQuestion(met.at, fault.code);
            }));
            const std::vector<String> operations = disk->operations();
            met.isMet = (fault.kind == Fault::Fails ? operations.size() : disk->numQuestions()) >= met.at;
            met.operation =
                met.isMet && fault.kind == Fault::Fails ? operations[met.at - 1] : String("a call");
        }
        SCOPED_TRACE(testing::Message()
                     << met.operation << ", number " << met.at
                     << (fault.kind == Fault::Killed ? ", kills" : ", fails with ") << fault.code);
        EXPECT_TRUE(met.isMet || met.done) << "nothing was in its way";
        check(place, met);
    }
    EXPECT_FALSE(met.isMet) << "the action has no end";
    return met.at - 2;
}

} // namespace test
