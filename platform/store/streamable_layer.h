#pragma once

#include "platform/store/streamable.h"

/// A `Streamable` of one layer: it has the layer's names and the revision of what was last unpacked, so that
/// a class of its own only packs and unpacks.
class QM_API StreamableLayer : public Streamable {
public:
    [[nodiscard]] const char* layerName() const override { return m_form->name; }
    [[nodiscard]] const char* shortLayerName() const override { return m_form->shortName; }
    [[nodiscard]] uint8_t revisionMajor() const override { return m_major; }
    [[nodiscard]] uint8_t revisionMinor() const override { return m_minor; }
    void revisionMajor(uint8_t major) override { m_major = major; }
    void revisionMinor(uint8_t minor) override { m_minor = minor; }

protected:
    /// `form` lives as long as the program.
    explicit StreamableLayer(const Form& form) : m_form(&form), m_major(form.major), m_minor(form.minor) {}
    StreamableLayer(const StreamableLayer&) = default;
    StreamableLayer& operator=(const StreamableLayer&) = default;

    /// True if what is to be unpacked was written by a later form.
    [[nodiscard]] bool isFromTheFuture() const { return m_major > m_form->major; }
    /// The object is of the present form whatever was unpacked.
    void setCurrentRevision() {
        m_major = m_form->major;
        m_minor = m_form->minor;
    }

private:
    const Form* m_form;
    uint8_t m_major;
    uint8_t m_minor;
};
