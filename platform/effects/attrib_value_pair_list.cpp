#include "platform/effects/attrib_value_pair_list.h"

namespace {

const bool kPairsRegistered = [] {
    Streamable::registerBuilder(AttribValuePairList::kForm.name, []() -> std::unique_ptr<Streamable> {
        return std::make_unique<AttribValuePairList>();
    });
    return true;
}();

} // namespace

// In files: do not change it.
constinit const StreamableLayer::Form AttribValuePairList::kForm{"AttribValuePairList", "2"};

AttribValuePairList::~AttribValuePairList() = default;

void AttribValuePairList::add(const Qx::AttribValuePair& pair) {
    if (pair.valid()) {
        m_pairs[pair.attrib()] = pair.value();
        setTagChanged(true);
    }
}

String AttribValuePairList::getValue(const String& key) const {
    const auto found = m_pairs.find(key);
    return found != m_pairs.end() ? found->second : String();
}

const TagTypeId& AttribValuePairList::tagTypeId() const {
    static const TagTypeId id(kForm.name);
    return id;
}

void AttribValuePairList::pack(PStream& stream) const {
    stream.setUnsignedLong(static_cast<uint32_t>(m_pairs.size()));
    for (const auto& [key, value] : m_pairs) {
        stream.setString(Qx::AttribValuePair(key, value).asString());
    }
}

void AttribValuePairList::unpack(PStream& stream) {
    constexpr size_t kLeastText = 4;
    if (isFromTheFuture()) {
        stream.fail();
        return;
    }
    std::map<String, String> pairs;
    const int32_t count = stream.getLong();
    if (count > 0 && static_cast<size_t>(count) > stream.remaining() / kLeastText) {
        stream.fail();
    }
    for (int32_t i = 0; i < count && stream.good(); ++i) {
        const Qx::AttribValuePair pair(std::string_view(stream.getString()));
        if (!pair.valid()) {
            stream.fail();
        }
        pairs[pair.attrib()] = pair.value();
    }
    if (stream.good()) {
        m_pairs = std::move(pairs);
        setCurrentRevision();
    }
}

std::unique_ptr<Streamable> AttribValuePairList::clone(BuilderType) const {
    return std::make_unique<AttribValuePairList>(*this);
}
