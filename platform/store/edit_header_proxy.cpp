#include "platform/store/edit_header_proxy.h"

namespace {

constexpr const char* kLayerName = "EditHeaderProxy";

[[maybe_unused]] const bool registered = [] {
    Streamable::registerBuilder(
        kLayerName, []() -> std::unique_ptr<Streamable> { return std::make_unique<EditHeaderProxy>(); });
    return true;
}();

} // namespace

constinit const StreamableLayer::Form EditHeaderProxy::kForm{kLayerName, "H"};

EditHeaderProxy::EditHeaderProxy() : StreamableLayer(kForm), m_own("EDIT", "END_EDIT_HEADER") {}

EditHeaderProxy::EditHeaderProxy(const configb& header) : StreamableLayer(kForm), m_refers(&header) {}

EditHeaderProxy::~EditHeaderProxy() = default;

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
    copy->revisionMajor(revisionMajor());
    copy->revisionMinor(revisionMinor());
    return copy;
}
