#include "edit/manager/detail/project_records.h"

#include "platform/services/current_project.h"
#include "platform/services/log.h"

namespace {

/// Under which the rate is kept that the timecodes of the records are counted with.
constexpr const char* kTimecodeRate = "TIMECODE_RATE";

} // namespace

std::shared_ptr<projdb> ProjectRecords::database() {
    const std::lock_guard hold(m_openMutex);
    if (m_database == nullptr && !m_tried && !m_folder.empty()) {
        m_tried = true;
        auto opened = std::make_shared<projdb>();
        if (const Qx::Status status = opened->open(m_folder); !status) {
            herc_printf("edit_manager: the project's records cannot be used: %s\n", status.reason().c_str());
            return nullptr;
        }
        m_database = std::move(opened);
        dropRecordsOfOtherRate();
    }
    return m_database;
}

/// Timecodes of another rate or drop-frame setting would be read as other times.
void ProjectRecords::dropRecordsOfOtherRate() {
    const Qx::CurrentProject project = Qx::currentProject();
    const String rate = String::format("%d %d", project.frameRateCode, project.dropFrame ? 1 : 0);
    String before;
    if (m_database->getValue(kTimecodeRate, before) && before == rate) {
        return;
    }
    Qx::Status status = m_database->removeAll();
    if (status) {
        status = m_database->setValue(kTimecodeRate, rate);
    }
    if (!status) {
        herc_printf("edit_manager: the project's records cannot be brought up to date: %s\n",
                    status.reason().c_str());
        m_database.reset();
    }
}

void ProjectRecords::use(const String& folder) {
    const std::lock_guard hold(m_openMutex);
    m_folder = folder;
    m_database.reset();
    m_tried = false;
    const std::lock_guard holdGathered(m_mutex);
    m_stale.clear();
    m_gathered.clear();
}

bool ProjectRecords::isOpen() const {
    const std::lock_guard hold(m_openMutex);
    return m_database != nullptr;
}

void ProjectRecords::markStale(const cookie& item) {
    if (item.isStorable() && item.type() != Cookie_Type::Transient) {
        const std::lock_guard hold(m_mutex);
        m_stale.insert(item);
    }
}

void ProjectRecords::put(const cookie& item, projdb::Record record) {
    const std::lock_guard hold(m_mutex);
    m_gathered[item] = std::move(record);
}

void ProjectRecords::remove(const cookie& item) {
    const std::lock_guard hold(m_mutex);
    m_stale.erase(item);
    m_gathered[item] = std::nullopt;
}

std::set<cookie> ProjectRecords::takeStale() {
    const std::lock_guard hold(m_mutex);
    return std::move(m_stale);
}

bool ProjectRecords::takeStale(const cookie& item) {
    const std::lock_guard hold(m_mutex);
    return m_stale.erase(item) != 0;
}

void ProjectRecords::store() {
    {
        const std::lock_guard hold(m_mutex);
        if (m_gathered.empty()) {
            return;
        }
    }
    const std::shared_ptr<projdb> records = database();
    if (records == nullptr) {
        return;
    }
    projdb::Transaction together(*records);
    // Taken when the records are locked, so that of two threads the later one stores the later state.
    std::map<cookie, std::optional<projdb::Record>> gathered;
    {
        const std::lock_guard hold(m_mutex);
        gathered.swap(m_gathered);
    }
    Qx::Status status;
    for (const auto& [item, record] : gathered) {
        if (status) {
            status = record ? records->put(item, *record) : records->remove(item);
        }
    }
    if (status) {
        status = together.commit();
    }
    if (!status) {
        // Not kept for later: a record that does not fit its file is noticed and made again.
        herc_printf("edit_manager: the project's records were not brought up to date: %s\n",
                    status.reason().c_str());
    }
}
