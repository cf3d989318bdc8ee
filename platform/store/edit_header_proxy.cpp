#include "platform/store/edit_header_proxy.h"

namespace {

// These names live in files: do not change them.
constexpr const char* kLayerName = "EditHeaderProxy";
constexpr const char* kShortLayerName = "H";

[[maybe_unused]] const bool registered = [] {
    Streamable::registerBuilder(
        kLayerName, []() -> std::unique_ptr<Streamable> { return std::make_unique<EditHeaderProxy>(); });
    return true;
}();

} // namespace

EditHeaderProxy::EditHeaderProxy() : m_own("EDIT", "END_EDIT_HEADER") {}

EditHeaderProxy::EditHeaderProxy(const configb& header) : m_refers(&header) {}

EditHeaderProxy::~EditHeaderProxy() = default;

const char* EditHeaderProxy::layerName() const {
    return kLayerName;
}

const char* EditHeaderProxy::shortLayerName() const {
    return kShortLayerName;
}

void EditHeaderProxy::pack(PStream& stream) const {
    header().pack(stream);
}

void EditHeaderProxy::unpack(PStream& stream) {
    configb read("EDIT", "END_EDIT_HEADER");
    read.unpack(stream);
    if (stream.good()) {
        m_own = read;
        m_refers = nullptr;
    }
}

std::unique_ptr<Streamable> EditHeaderProxy::clone(BuilderType type) const {
    std::unique_ptr<EditHeaderProxy> copy;
    if (type == BuilderType::Stream) {
        copy = std::make_unique<EditHeaderProxy>(header());
    } else {
        copy = std::make_unique<EditHeaderProxy>();
        copy->m_own = header();
    }
    copy->m_major = m_major;
    copy->m_minor = m_minor;
    return copy;
}
