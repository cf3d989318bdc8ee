#pragma once

#include "edit/model/edit_ptr.h"
#include "platform/base/cookie.h"
#include "platform/base/open_behaviour.h"

/// What the model asks of whoever manages open edits. The manager installs itself, at the latest when the
/// first edit is opened; without one, opening yields a null handle and the rest does nothing. Implementations
/// are thread-safe and never throw.
class QM_API EditRegistry {
public:
    virtual ~EditRegistry();
    [[nodiscard]] virtual EditPtr open(const cookie& item, eEditOpenBehaviour behaviour) = 0;
    virtual void addToDirtyList(const cookie& item) = 0;
    virtual void updateProjdbRec(const cookie& item, bool create) = 0;

    /// The registry in place; null if none.
    [[nodiscard]] static EditRegistry* current();
    /// The registry in place, made by the maker if there is none and it can be had.
    [[nodiscard]] static EditRegistry* forOpening();
    /// Installs a registry (not owned) and returns the one before.
    static EditRegistry* install(EditRegistry* registry);
    /// What is called when an edit is opened and no registry is in place; it answers with one or null.
    using Maker = EditRegistry* (*)();
    static void setMaker(Maker maker);
};
