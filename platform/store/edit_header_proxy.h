#pragma once

#include "platform/store/configb.h"
#include "platform/store/streamable.h"

/// The object that carries a header store into the object store. It refers to a `configb` that it does not
/// own and that must outlive it, or owns one that was read. A copy made for a stream refers to the header of
/// its original; any other copy owns one.
class QM_API EditHeaderProxy : public Streamable {
public:
    /// The tag of the header object.
    static constexpr const char* EditHeaderId = "EditHeader";

    EditHeaderProxy();
    explicit EditHeaderProxy(const configb& header);
    ~EditHeaderProxy() override;

    [[nodiscard]] const configb& header() const { return m_refers != nullptr ? *m_refers : m_own; }

    [[nodiscard]] const char* layerName() const override;
    [[nodiscard]] const char* shortLayerName() const override;
    [[nodiscard]] uint8_t revisionMajor() const override { return m_major; }
    [[nodiscard]] uint8_t revisionMinor() const override { return m_minor; }
    void revisionMajor(uint8_t major) override { m_major = major; }
    void revisionMinor(uint8_t minor) override { m_minor = minor; }
    void pack(PStream& stream) const override;
    void unpack(PStream& stream) override;
    [[nodiscard]] std::unique_ptr<Streamable> clone(BuilderType type) const override;

private:
    const configb* m_refers = nullptr;
    configb m_own;
    uint8_t m_major = 1;
    uint8_t m_minor = 0;
};
