#pragma once

#include "platform/base/cookie.h"
#include "platform/base/export.h"
#include "platform/base/open_behaviour.h"

#include <cstddef>

class Edit;
class configb;

/// A counted handle to an open edit, or null. The count lives in the edit and changes atomically, so handles
/// may be copied and dropped on any thread; one handle must not be assigned on one thread while another reads
/// it. The last handle to go destroys the edit.
class QM_API EditPtr {
public:
    EditPtr() = default;
    EditPtr(Edit* edit);
    EditPtr(const EditPtr& other);
    EditPtr(EditPtr&& other) noexcept : m_edit(other.m_edit) { other.m_edit = nullptr; }
    /// Asks the edit registry for the edit; null when it cannot be opened.
    EditPtr(const cookie& item, eEditOpenBehaviour behaviour);
    ~EditPtr();

    /// Releases, then opens as the constructor does.
    EditPtr& open(const cookie& item, eEditOpenBehaviour behaviour);
    /// Releases first, then holds the other; for the edit that is held already nothing happens.
    EditPtr& operator=(const EditPtr& other);
    EditPtr& operator=(EditPtr&& other) noexcept;
    EditPtr& operator=(Edit* edit);
    /// Releases, then opens the item with behaviour 0.
    EditPtr& operator=(cookie& item);

    [[nodiscard]] bool valid() const { return m_edit != nullptr; }
    void invalidate();

    bool operator==(const EditPtr& other) const { return m_edit == other.m_edit; }
    /// The overloads keep a plain pointer and `nullptr` from being ambiguous with the conversion below.
    bool operator==(const Edit* edit) const { return m_edit == edit; }
    bool operator==(Edit* edit) const { return m_edit == edit; }
    bool operator==(std::nullptr_t) const { return m_edit == nullptr; }
    Edit* operator->() const { return m_edit; }
    operator Edit*() const { return m_edit; }
    /// The edit's header store. The handle must be valid.
    [[nodiscard]] configb& Opts() const;

private:
    void take(Edit* edit);

    Edit* m_edit = nullptr;
};
