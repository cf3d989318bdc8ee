#pragma once

#include "platform/store/configb.h"
#include "platform/store/streamable_layer.h"

/// The object that carries a header store into the object store. It refers to a `configb` that it does not
/// own and that must outlive it, or owns one that was read. A copy made for a stream refers to the header of
/// its original; any other copy owns one.
class QM_API EditHeaderProxy : public StreamableLayer {
public:
    /// The tag of the header object.
    static constexpr const char* EditHeaderId = "EditHeader";

    EditHeaderProxy();
    explicit EditHeaderProxy(const configb& header);
    ~EditHeaderProxy() override;

    [[nodiscard]] const configb& header() const { return m_refers != nullptr ? *m_refers : m_own; }

    void pack(PStream& stream) const override;
    void unpack(PStream& stream) override;
    [[nodiscard]] std::unique_ptr<Streamable> clone(BuilderType type) const override;

private:
    static const Form kForm;
    const configb* m_refers = nullptr;
    configb m_own;
};
