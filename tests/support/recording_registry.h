#pragma once

#include "edit/model/edit.h"
#include "edit/model/edit_registry.h"

#include <map>
#include <utility>
#include <vector>

namespace test {

/// Stands in for the manager while it lives: opens the edits it was given and records what it is asked.
class RecordingRegistry : public EditRegistry {
public:
    RecordingRegistry() : m_before(EditRegistry::install(this)) {}
    ~RecordingRegistry() override { EditRegistry::install(m_before); }
    RecordingRegistry(const RecordingRegistry&) = delete;
    RecordingRegistry& operator=(const RecordingRegistry&) = delete;

    void add(const EditPtr& edit) { m_edits[edit->get_cookie()] = edit; }
    /// What was asked since the last call, such as "open E0001000 0", "dirty E0001000", "record E0001000".
    [[nodiscard]] std::vector<String> take() { return std::exchange(m_calls, {}); }

    EditPtr open(const cookie& item, eEditOpenBehaviour behaviour) override {
        m_calls.push_back("open " + item.asString() + " " + std::to_string(static_cast<int>(behaviour)));
        const auto found = m_edits.find(item);
        return found != m_edits.end() ? found->second : EditPtr();
    }
    void addToDirtyList(const cookie& item) override { m_calls.push_back("dirty " + item.asString()); }
    void updateProjdbRec(const cookie& item, bool create) override {
        m_calls.push_back("record " + item.asString() + (create ? " new" : ""));
    }

private:
    EditRegistry* m_before;
    std::map<cookie, EditPtr> m_edits;
    std::vector<String> m_calls;
};

} // namespace test
