#include "edit/model/edit_ptr.h"

#include "edit/model/edit.h"
#include "edit/model/edit_registry.h"
#include "platform/store/configb.h"

#include <utility>

EditPtr::EditPtr(Edit* edit) {
    take(edit);
}

EditPtr::EditPtr(const EditPtr& other) {
    take(other.m_edit);
}

EditPtr::EditPtr(const cookie& item, eEditOpenBehaviour behaviour) {
    if (EditRegistry* registry = EditRegistry::forOpening()) {
        EditPtr opened = registry->open(item, behaviour);
        std::swap(m_edit, opened.m_edit);
    }
}

EditPtr::~EditPtr() {
    invalidate();
}

EditPtr& EditPtr::open(const cookie& item, eEditOpenBehaviour behaviour) {
    const cookie wanted = item; // `item` may live in the edit that is released here
    invalidate();
    if (EditRegistry* registry = EditRegistry::forOpening()) {
        *this = registry->open(wanted, behaviour);
    }
    return *this;
}

// NOLINTNEXTLINE(bugprone-unhandled-self-assignment): the assignment of the pointer handles it
EditPtr& EditPtr::operator=(const EditPtr& other) {
    return *this = other.m_edit;
}

EditPtr& EditPtr::operator=(EditPtr&& other) noexcept {
    if (this != &other) {
        Edit* const taken = std::exchange(other.m_edit, nullptr);
        invalidate();
        m_edit = taken;
    }
    return *this;
}

EditPtr& EditPtr::operator=(Edit* edit) {
    if (edit != m_edit) {
        invalidate();
        take(edit);
    }
    return *this;
}

EditPtr& EditPtr::operator=(cookie& item) {
    return open(item, eOpenExisting);
}

void EditPtr::invalidate() {
    Edit* const released = std::exchange(m_edit, nullptr);
    if (released != nullptr && released->decRefCount() == 0) {
        delete released;
    }
}

configb& EditPtr::Opts() const {
    return m_edit->Opts();
}

void EditPtr::take(Edit* edit) {
    m_edit = edit;
    if (m_edit != nullptr) {
        m_edit->incRefCount();
    }
}
