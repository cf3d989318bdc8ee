#include "edit/model/cel.h"

#include "edit/model/detail/cel_events.h"

#include <bit>
#include <cstring>
#include <type_traits>

using namespace cel_detail;

static_assert(std::endian::native == std::endian::little, "events are packed as they lie in memory");
static_assert(std::is_trivially_copyable_v<channel_event>);

namespace {

constexpr const char* kCelLayer = "cel";
/// Fewer events are copied: what keeps them would cost more than they do.
constexpr size_t kLeastBorrowed = 1024;

[[maybe_unused]] const bool registered = [] {
    Streamable::registerBuilder(kCelLayer,
                                [] { return std::unique_ptr<Streamable>(std::make_unique<cel>()); });
    return true;
}();

/// The events that some bytes hold, where they lie or as a copy. False if no cel may hold them.
bool takeEvents(std::span<const std::byte> bytes, const std::shared_ptr<const void>& keeper,
                EventArray& events) {
    const size_t count = bytes.size() / sizeof(channel_event);
    if (keeper != nullptr && count >= kLeastBorrowed &&
        reinterpret_cast<uintptr_t>(bytes.data()) % alignof(channel_event) == 0) {
        const std::span<const channel_event> lying(reinterpret_cast<const channel_event*>(bytes.data()),
                                                   count);
        if (isGood(lying)) {
            events.borrow(keeper, lying);
            return true;
        }
    }
    Events copied(count);
    if (count > 0) {
        std::memcpy(static_cast<void*>(copied.data()), bytes.data(), bytes.size());
    }
    if (!checkAndSettle(copied)) {
        return false;
    }
    events.assign(std::move(copied));
    return true;
}

} // namespace

constinit const StreamableLayer::Form cel::kForm{kCelLayer, kCelLayer, 2};

std::unique_ptr<Streamable> cel::clone(BuilderType) const {
    return copy();
}

void cel::pack(PStream& stream) const {
    const size_t count = m_events.size() / 2 * 2;
    stream.setString(m_name);
    m_id.pack(stream);
    stream.setString(m_subType);
    stream.setString(m_materialInfo);
    stream.setDouble(m_resolution);
    stream.setUnsignedLong(static_cast<uint32_t>(count));
    stream.setAlignment(alignof(channel_event));
    stream.setLasting(m_events.data(), count * sizeof(channel_event));
}

void cel::unpack(PStream& stream) {
    if (isFromTheFuture()) {
        stream.fail();
        return;
    }
    String name = stream.getString();
    IdStamp id;
    id.unpack(stream);
    String subType = stream.getString();
    String materialInfo = stream.getString();
    const double resolution = stream.getDouble();
    const size_t count = stream.getCount(sizeof(channel_event));
    if (revisionMajor() > 1) {
        stream.passAlignment();
    }
    const std::span<const std::byte> bytes = stream.getSpan(count * sizeof(channel_event));
    EventArray events;
    if (!stream.good() || !std::isfinite(resolution) || resolution < 0 ||
        !takeEvents(bytes, stream.keeper(), events)) {
        stream.fail();
        return;
    }
    m_events.swap(events);
    m_name = std::move(name);
    m_id = id;
    m_subType = std::move(subType);
    m_materialInfo = std::move(materialInfo);
    m_resolution = resolution;
    ++m_changeCount;
    m_changed = false;
}
