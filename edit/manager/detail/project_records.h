#pragma once

#include "edit/project/projdb.h"

#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <optional>
#include <set>

/// The manager's access to the records of the current project. Changes are gathered, as they come while
/// locks are held and a table may keep its writers waiting; `store` takes them there. Two mutexes of its own,
/// the inner of which may be asked for under any lock.
class ProjectRecords {
public:
    /// The records of another project are meant from now on; those before are let go.
    void use(const String& folder);
    /// The records, opened on first use; null when they cannot be (which is logged once). Not to be called
    /// under the manager's lock.
    std::shared_ptr<projdb> database();
    /// Lets the records go; nothing is kept until others are meant. What was gathered and not stored is
    /// forgotten: it can be made again.
    void close() { use(String()); }
    /// True if they are open.
    [[nodiscard]] bool isOpen() const;

    /// \name Gathering
    /// @{
    /// The record of an item is not what its edit in memory says.
    void markStale(const cookie& item);
    void put(const cookie& item, projdb::Record record);
    void remove(const cookie& item);
    /// @}

    /// The items that are marked as stale, which they are not any more afterwards.
    [[nodiscard]] std::set<cookie> takeStale();
    [[nodiscard]] bool takeStale(const cookie& item);
    /// Puts what was gathered into the records.
    void store();

private:
    void dropRecordsOfOtherRate();

    mutable std::mutex m_openMutex; ///< guards what follows; taken before the other one
    String m_folder;
    std::shared_ptr<projdb> m_database;
    bool m_tried = false;

    mutable std::mutex m_mutex; ///< guards what follows; nothing is called under it
    std::set<cookie> m_stale;
    std::map<cookie, std::optional<projdb::Record>> m_gathered; ///< none: to be removed
};
