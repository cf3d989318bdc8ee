#pragma once

#include <array>
#include <cstdint>
#include <string_view>

/// What is measured, against which physical limit, and the goals: the one place where they stand.
namespace report {

/// What a user feels; the tables are in this order.
enum class Group { File, Project, Editing, LookingUp, MemoryAndGrowth };

constexpr std::array<std::string_view, 5> kGroupNames = {"File", "Project of 10 000 edits", "Editing",
                                                         "Looking up", "Memory and growth"};

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
constexpr std::string_view kWriteDurably = "write, sync and rename";
constexpr std::string_view kMoveHalf = "move half of a channel";
constexpr std::string_view kMoveHalfOfEach = "move half, each channel";

/// Of both goals that are set against a block move.
constexpr std::string_view kWhyMoved =
    "A channel's events are one block, and all that follows a change moves: its bytes, then its times. It "
    "would "
    "take a block in pieces, which makes every search and every walk dearer.";

constexpr SpeedRow kSpeedRows[] = {
    {.group = Group::File,
     .measure = "load",
     .what = "open an edit file",
     .limits = {"read_cached", "xxh3"},
     .limitWords = "read it and checksum it",
     .goal = 4,
     .whyMissed =
         "What is above reading, checksums and one check of every event is memory that the system has to "
         "clear. "
         "Where it gives no big pages (/sys/kernel/mm/transparent_hugepage/enabled says never) that is more "
         "than all the rest; to be rid of it, big pages must be allowed (madvise)."},
    {.group = Group::File,
     .measure = "save_fast",
     .what = "save, left to the system",
     .limits = {"write"},
     .limitWords = "write as many bytes",
     .goal = 3,
     .whyMissed =
         "The file gets a fresh name and takes the old one's place, so the system frees the old file and "
         "begins "
         "to write the new one; the rest is one copy and one checksum of the bytes. It would take writing "
         "events from where they lie, which saves the copy."},
    {.group = Group::File,
     .measure = "save_durable",
     .what = "save for good",
     .limits = {"write_fsync_rename"},
     .limitWords = kWriteDurably,
     .goal = 1.3,
     .whyMissed =
         "Nearly all of this is the disk, whose answers vary from one moment to the next, and the name in "
         "its folder "
         "is made durable too. Measure again when the disk is idle; if it stays, that second sync is the "
         "difference, and it cannot be left out."},
    {.group = Group::File,
     .measure = "cached_open",
     .what = "open by cookie, already open",
     .limits = {"lock_map_find"},
     .limitWords = "lock and find in a map",
     .goal = 2,
     .whyMissed = "Beside the lookup a handle is counted up and down again, two atomic operations; on a "
                  "processor where "
                  "these are dear, handles would have to be lent without counting."},
    {.group = Group::File,
     .measure = "cached_open_8",
     .what = "the same in 8 threads at once",
     .limits = {"lock_map_find_8"},
     .limitWords = "the same in 8 threads"},
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

    {.group = Group::Project, .measure = "enter_project", .what = "make the project current"},
    {.group = Group::Project,
     .measure = "open_first",
     .what = "first opening after a start",
     .limits = {"read_small"},
     .limitWords = "read and checksum it"},
    {.group = Group::Project,
     .measure = "open_many",
     .what = "open 1 000 edits",
     .limits = {"read_small_many"},
     .limitWords = "read and checksum them"},
    {.group = Group::Project,
     .measure = "flush_many",
     .what = "save 100 changed edits",
     .limits = {"write_small_many"},
     .limitWords = kWriteDurably},
    {.group = Group::Project,
     .measure = "update_records",
     .what = "check the project's records",
     .limits = {"list_and_stat"},
     .limitWords = "list and stat all files"},
    {.group = Group::Project,
     .measure = "list_project",
     .what = "the command qmedit list",
     .limits = {"list_and_stat"},
     .limitWords = "list and stat all files"},
    {.group = Group::Project, .measure = "show_one", .what = "the command qmedit show"},

    {.group = Group::Editing,
     .measure = "build",
     .what = "build an edit, clip after clip",
     .limits = {"memcpy"},
     .limitWords = "copy its bytes"},
    {.group = Group::Editing,
     .measure = "bare_replace_one",
     .what = "replace 5 s on one channel",
     .limits = {"move_half"},
     .limitWords = kMoveHalf,
     .goal = 3,
     .whyMissed = kWhyMoved},
    {.group = Group::Editing,
     .measure = "bare_insert_one",
     .what = "insert 5 s on one channel",
     .limits = {"move_half"},
     .limitWords = kMoveHalf,
     .goal = 3,
     .whyMissed = kWhyMoved},
    {.group = Group::Editing,
     .measure = "bare_remove_one",
     .what = "remove 5 s on one channel",
     .limits = {"move_half"},
     .limitWords = kMoveHalf},
    {.group = Group::Editing,
     .measure = "bare_replace_all",
     .what = "replace 5 s on all twelve",
     .limits = {"move_half_all"},
     .limitWords = kMoveHalfOfEach},
    {.group = Group::Editing,
     .measure = "bare_insert_all",
     .what = "insert 5 s on all twelve",
     .limits = {"move_half_all"},
     .limitWords = kMoveHalfOfEach},
    {.group = Group::Editing,
     .measure = "bare_remove_all",
     .what = "remove 5 s on all twelve",
     .limits = {"move_half_all"},
     .limitWords = kMoveHalfOfEach},
    {.group = Group::Editing,
     .measure = "apply_replace",
     .what = "replace, with its undo backup",
     .limits = {"write_fsync_rename"},
     .limitWords = kWriteDurably},
    {.group = Group::Editing,
     .measure = "apply_insert",
     .what = "insert, with its undo backup",
     .limits = {"write_fsync_rename"},
     .limitWords = kWriteDurably},
    {.group = Group::Editing,
     .measure = "apply_remove",
     .what = "remove, with its undo backup",
     .limits = {"write_fsync_rename"},
     .limitWords = kWriteDurably},
    {.group = Group::Editing,
     .measure = "apply_replace_no_backup",
     .what = "replace, without the backup",
     .limits = {"move_half_all"},
     .limitWords = kMoveHalfOfEach},
    {.group = Group::Editing,
     .measure = "apply_insert_no_backup",
     .what = "insert, without the backup",
     .limits = {"move_half_all"},
     .limitWords = kMoveHalfOfEach},
    {.group = Group::Editing,
     .measure = "apply_remove_no_backup",
     .what = "remove, without the backup",
     .limits = {"move_half_all"},
     .limitWords = kMoveHalfOfEach},
    {.group = Group::Editing,
     .measure = "backup",
     .what = "make an undo backup",
     .limits = {"write_fsync_rename"},
     .limitWords = kWriteDurably},
    {.group = Group::Editing,
     .measure = "undo",
     .what = "undo",
     .limits = {"read_write_fsync"},
     .limitWords = "read, write and sync",
     .goal = 2,
     .whyMissed =
         "An undo keeps the present state for redo, which is a save for good, and opens the state before; "
         "what is "
         "left is the disk, whose answers vary. It would take writing the state for redo in the background, "
         "and a power cut could then lose it."},
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
     .whyMissed =
         "A copy shares the events until it is changed, so this is the cost of the edit's other parts."},
    {.group = Group::Editing,
     .measure = "copy_and_change",
     .what = "copy it and change each channel",
     .limits = {"memcpy"},
     .limitWords = "copy its bytes"},

    {.group = Group::LookingUp,
     .measure = "find",
     .what = "find the pair at a time",
     .limits = {"lower_bound"},
     .limitWords = "binary search",
     .goal = 1.2,
     .whyMissed =
         "It is a binary search over packed times without a branch that guesses; a compiler that makes "
         "branches of it again is the likely cause (see EventArray)."},
    {.group = Group::LookingUp,
     .measure = "walk",
     .what = "walk over all pairs",
     .limits = {"linear_read"},
     .limitWords = "read the bytes in order",
     .goal = 3,
     .whyMissed = "Both ends of each pair are read through their handles, with a check that each is there; "
                  "it would take "
                  "a walk over the bare events."},
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
                                  .whyMissed = "An event is 64 bytes and its pair\'s packed time 4 more; the "
                                               "rest is the room that a page or an array has left."};

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

constexpr std::string_view kWhyNotLinear =
    "The work is the same for each clip; what is not is the memory and the disk behind it: bytes that no "
    "longer fit "
    "the caches, and a disk that is busy with those before. The limits beside it grow likewise.";

constexpr GrowthRow kGrowthRows[] = {
    {.measure = "find",
     .what = "find, 100 to 10 000 clips",
     .fromClips = 100,
     .toClips = 10000,
     .goal = 4,
     .under = true,
     .whyMissed = "A search takes one step more for each doubling; what grows faster is that the times of 10 "
                  "000 clips on twelve channels no longer fit the cache nearest to the processor."},
    {.measure = "load",
     .what = "open, 1 000 to 10 000 clips",
     .fromClips = 1000,
     .toClips = 10000,
     .goal = kLinear,
     .under = false,
     .whyMissed = kWhyNotLinear},
    {.measure = "save_fast",
     .what = "save, 1 000 to 10 000 clips",
     .fromClips = 1000,
     .toClips = 10000,
     .goal = kLinear,
     .under = false,
     .whyMissed = kWhyNotLinear},
    {.measure = "save_durable",
     .what = "save for good, 1 000 to 10 000",
     .fromClips = 1000,
     .toClips = 10000,
     .goal = kLinear,
     .under = false,
     .whyMissed = kWhyNotLinear},
};

} // namespace report
