#pragma once

#include "platform/base/attrib_value_pair.h"
#include "platform/store/streamable_layer.h"
#include "platform/store/taggable.h"

#include <map>

/// Named texts that stand beside a graph, in the order of their names; the details of an effect template. Not
/// thread-safe.
class QM_API AttribValuePairList : public StreamableLayer, public Taggable {
public:
    AttribValuePairList() : StreamableLayer(kForm) {}
    AttribValuePairList(const AttribValuePairList&) = default;
    AttribValuePairList& operator=(const AttribValuePairList&) = default;
    ~AttribValuePairList() override;

    /// Sets the value of the pair's name; a pair that is not valid is passed over.
    void add(const Qx::AttribValuePair& pair);
    /// Empty for a name that is not there.
    [[nodiscard]] String getValue(const String& key) const;
    [[nodiscard]] size_t size() const { return m_pairs.size(); }

    [[nodiscard]] const TagTypeId& tagTypeId() const override;
    /// Packed: a count, then each pair as the text of `Qx::AttribValuePair`.
    void pack(PStream& stream) const override;
    /// A count below 1 reads nothing. On a bad stream the list is as it was.
    void unpack(PStream& stream) override;
    [[nodiscard]] std::unique_ptr<Streamable> clone(BuilderType type = BuilderType::Copy) const override;

    static const Form kForm;

private:
    std::map<String, String> m_pairs;
};
