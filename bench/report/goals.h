#pragma once

#include <array>
#include <cstdint>
#include <string_view>

/// What is measured, against which physical limit, and the goals: the one place where they stand.
namespace report {

/// What a user feels; the tables are in this order.
enum class Group { File, Editing, LookingUp, MemoryAndGrowth };

constexpr std::array<std::string_view, 4> kGroupNames = {"File", "Editing", "Looking up",
                                                         "Memory and growth"};

/// The size that the goals are set for, in clips, and the sizes that are shown beside each other.
constexpr uint64_t kGoalClips = 10000;
constexpr std::array<uint64_t, 3> kSizes = {100, 1000, 10000};

/// A time against the least that the machine could do it in.
struct SpeedRow {
    Group group;
    std::string_view measure; ///< its name in the results
    std::string_view what;    ///< for people, at most 30 characters
    /// The measures, without "limit/", whose sum is the limit; empty for none.
    std::array<std::string_view, 2> limits = {};
    std::string_view limitWords = {}; ///< the limit for people, at most 23 characters
    double goal = 0;                  ///< the greatest ratio; 0 for a measure without a goal
    /// For a goal that is missed: what stands in the way and what it would take, in sentences.
    std::string_view whyMissed = {};
};

constexpr std::string_view kReadCached = "read it from the cache";
constexpr std::string_view kMoveHalf = "move half of a channel";
constexpr std::string_view kMoveHalfOfEach = "move half, each channel";

constexpr SpeedRow kSpeedRows[] = {
    {.group = Group::File,
     .measure = "load",
     .what = "open an edit file",
     .limits = {"read_cached", "xxh3"},
     .limitWords = "read it and checksum it",
     .goal = 4,
     .whyMissed = ""},
    {.group = Group::File,
     .measure = "save_fast",
     .what = "save, left to the system",
     .limits = {"write"},
     .limitWords = "write as many bytes",
     .goal = 3,
     .whyMissed = ""},
    {.group = Group::File,
     .measure = "save_durable",
     .what = "save for good",
     .limits = {"write_fsync_rename"},
     .limitWords = "write, sync and rename",
     .goal = 1.3,
     .whyMissed = ""},
    {.group = Group::File, .measure = "open_first", .what = "open by cookie, not yet open"},
    {.group = Group::File,
     .measure = "cached_open",
     .what = "open by cookie, already open",
     .limits = {"lock_map_find"},
     .limitWords = "lock and find in a map",
     .goal = 2,
     .whyMissed = ""},
    {.group = Group::File,
     .measure = "cached_open_8",
     .what = "the same in 8 threads at once",
     .limits = {"lock_map_find_8"},
     .limitWords = "the same in 8 threads"},
    {.group = Group::File, .measure = "list_project", .what = "list the edits of a project"},
    {.group = Group::File,
     .measure = "legacy_export",
     .what = "write the legacy text form",
     .limits = {"write"},
     .limitWords = "write an edit's bytes"},
    {.group = Group::File,
     .measure = "legacy_import",
     .what = "read the legacy text form",
     .limits = {"read_cached"},
     .limitWords = kReadCached},

    {.group = Group::Editing, .measure = "build", .what = "build an edit, clip after clip"},
    {.group = Group::Editing,
     .measure = "bare_replace_one",
     .what = "replace a clip of a cel",
     .limits = {"move_half"},
     .limitWords = kMoveHalf,
     .goal = 3,
     .whyMissed = ""},
    {.group = Group::Editing,
     .measure = "bare_insert_one",
     .what = "insert a clip into a cel",
     .limits = {"move_half"},
     .limitWords = kMoveHalf,
     .goal = 3,
     .whyMissed = ""},
    {.group = Group::Editing,
     .measure = "bare_remove_one",
     .what = "remove a clip from a cel",
     .limits = {"move_half"},
     .limitWords = kMoveHalf},
    {.group = Group::Editing,
     .measure = "bare_replace_all",
     .what = "replace on every channel, bare",
     .limits = {"move_half_all"},
     .limitWords = kMoveHalfOfEach},
    {.group = Group::Editing,
     .measure = "bare_insert_all",
     .what = "insert on every channel, bare",
     .limits = {"move_half_all"},
     .limitWords = kMoveHalfOfEach},
    {.group = Group::Editing,
     .measure = "bare_remove_all",
     .what = "remove on every channel, bare",
     .limits = {"move_half_all"},
     .limitWords = kMoveHalfOfEach},
    {.group = Group::Editing,
     .measure = "apply_replace",
     .what = "overwrite, whole operation",
     .limits = {"move_half_all"},
     .limitWords = kMoveHalfOfEach},
    {.group = Group::Editing,
     .measure = "apply_insert",
     .what = "splice in, whole operation",
     .limits = {"move_half_all"},
     .limitWords = kMoveHalfOfEach},
    {.group = Group::Editing,
     .measure = "apply_remove",
     .what = "extract, whole operation",
     .limits = {"move_half_all"},
     .limitWords = kMoveHalfOfEach},
    {.group = Group::Editing,
     .measure = "apply_replace_no_backup",
     .what = "overwrite, without its backup",
     .limits = {"move_half_all"},
     .limitWords = kMoveHalfOfEach},
    {.group = Group::Editing,
     .measure = "apply_insert_no_backup",
     .what = "splice in, without its backup",
     .limits = {"move_half_all"},
     .limitWords = kMoveHalfOfEach},
    {.group = Group::Editing,
     .measure = "apply_remove_no_backup",
     .what = "extract, without its backup",
     .limits = {"move_half_all"},
     .limitWords = kMoveHalfOfEach},
    {.group = Group::Editing, .measure = "backup", .what = "make an undo backup"},
    {.group = Group::Editing,
     .measure = "undo",
     .what = "undo",
     .limits = {"read_write_fsync"},
     .limitWords = "read, write and sync",
     .goal = 2,
     .whyMissed = ""},
    {.group = Group::Editing,
     .measure = "redo",
     .what = "redo",
     .limits = {"read_write_fsync"},
     .limitWords = "read, write and sync"},
    {.group = Group::Editing,
     .measure = "deep_copy",
     .what = "copy an edit in memory",
     .limits = {"memcpy"},
     .limitWords = "copy its bytes",
     .goal = 5,
     .whyMissed = ""},

    {.group = Group::LookingUp,
     .measure = "find",
     .what = "find the pair at a time",
     .limits = {"lower_bound"},
     .limitWords = "binary search",
     .goal = 1.2,
     .whyMissed = ""},
    {.group = Group::LookingUp,
     .measure = "walk",
     .what = "walk over all pairs",
     .limits = {"linear_read"},
     .limitWords = "read the bytes in order",
     .goal = 3,
     .whyMissed = ""},
    {.group = Group::LookingUp,
     .measure = "walk_handles",
     .what = "the same by handles",
     .limits = {"linear_read"},
     .limitWords = "read the bytes in order"},
};

/// What an event takes in memory, all told, against its own size.
struct MemoryRow {
    std::string_view measure;
    std::string_view counter; ///< of that measure, in bytes
    std::string_view what;
    double limit; ///< bytes
    std::string_view limitWords;
    double goal; ///< the most bytes
    std::string_view whyMissed;
};

constexpr MemoryRow kMemoryRow = {.measure = "memory",
                                  .counter = "bytes_per_event",
                                  .what = "memory of an event",
                                  .limit = 64,
                                  .limitWords = "an event itself",
                                  .goal = 72,
                                  .whyMissed = ""};

/// How a measure grows with the edit: its time at `toClips` over its time at `fromClips`.
struct GrowthRow {
    std::string_view measure;
    std::string_view what;
    uint64_t fromClips;
    uint64_t toClips;
    double goal;
    bool under; ///< the ratio must stay under the goal rather than at most reach it
    std::string_view whyMissed;
};

/// Linear means that ten times the clips take at most ten times the time. What is measured of a linear
/// operation scatters around that, so a quarter is allowed for the noise.
constexpr double kLinear = 10 * 1.25;

constexpr GrowthRow kGrowthRows[] = {
    {.measure = "find",
     .what = "find, 100 to 10 000 clips",
     .fromClips = 100,
     .toClips = 10000,
     .goal = 4,
     .under = true,
     .whyMissed = ""},
    {.measure = "load",
     .what = "open, 1 000 to 10 000 clips",
     .fromClips = 1000,
     .toClips = 10000,
     .goal = kLinear,
     .under = false,
     .whyMissed = ""},
    {.measure = "save_fast",
     .what = "save, 1 000 to 10 000 clips",
     .fromClips = 1000,
     .toClips = 10000,
     .goal = kLinear,
     .under = false,
     .whyMissed = ""},
    {.measure = "save_durable",
     .what = "save for good, 1 000 to 10 000",
     .fromClips = 1000,
     .toClips = 10000,
     .goal = kLinear,
     .under = false,
     .whyMissed = ""},
};

} // namespace report
