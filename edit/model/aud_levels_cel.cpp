#include "edit/model/aud_levels_cel.h"

#include "edit/model/detail/cel_events.h"
#include "platform/base/ole_splat.h"
#include "platform/media/frame_rate.h"
#include "platform/store/streamable_layer.h"

#include <cmath>

namespace {

constexpr const char* kLevelsLayer = "AudLevels";
constexpr uint8_t kMajor = 1;
using Store = Aud::DynamicLevelControl::Store;
using cel_detail::isUsableRange;
using cel_detail::isUsableTime;

} // namespace

/// The shared part: what is kept in the object store.
class AudLevelsCel::Contents : public StreamableLayer {
public:
    Contents() : StreamableLayer(kForm) {}
    void pack(PStream& stream) const override { nodes.pack(stream); }
    void unpack(PStream& stream) override {
        if (isFromTheFuture()) {
            stream.fail();
            return;
        }
        nodes.unpack(stream);
        changed = false;
    }
    std::unique_ptr<Streamable> clone(BuilderType) const override {
        return std::make_unique<Contents>(*this);
    }

    Store nodes;
    bool changed = false;

private:
    static const bool registered;
    static constexpr Form kForm{kLevelsLayer, kLevelsLayer, kMajor};
};

const bool AudLevelsCel::Contents::registered = [] {
    Streamable::registerBuilder(kLevelsLayer,
                                [] { return std::unique_ptr<Streamable>(std::make_unique<Contents>()); });
    return true;
}();

AudLevelsCel::~AudLevelsCel() = default;

AudLevelsCel AudLevelsCel::create() {
    AudLevelsCel made;
    made.m_contents = std::make_shared<Contents>();
    made.m_contents->changed = true;
    made.m_id = IdStamp::fresh(IdStampMagic::Channel);
    return made;
}

bool AudLevelsCel::is_dummy() const {
    return !valid() || m_contents->nodes.empty();
}

AudLevelsCel AudLevelsCel::clone() const {
    AudLevelsCel made;
    made.m_contents = valid() ? std::make_shared<Contents>(*m_contents) : nullptr;
    made.m_id = m_id;
    return made;
}

const AudLevelsCel::Store& AudLevelsCel::getNodeStore() const {
    // Never destroyed: what is open is written while the process ends.
    static const Store& none = *new Store;
    const Contents* const contents = m_contents.get();
    return contents != nullptr ? contents->nodes : none;
}

AudLevelsCel::Store& AudLevelsCel::changeNodeStore() {
    if (!valid()) {
        ole_splat("AudLevelsCel::changeNodeStore() : levels that are invalid have no nodes to change");
        m_contents = std::make_shared<Contents>();
    }
    m_contents->changed = true;
    return m_contents->nodes;
}

bool AudLevelsCel::insertNode(double time, float level) {
    if (!valid() || !(std::abs(time) <= Store::kGreatestTime) || !std::isfinite(level)) {
        return false;
    }
    changeNodeStore().insertNode(time, level);
    return true;
}

AudLevelsCel::Range AudLevelsCel::getExtents(Editable::ExtentType type, bool fromZero) const {
    const auto& nodes = getNodeStore().nodes();
    size_t first = 0;
    size_t last = nodes.size();
    if (type == Editable::MaterialOnly) {
        while (first < last && nodes[first].level == 1.0f) {
            ++first;
        }
        while (first < last && nodes[last - 1].level == 1.0f) {
            --last;
        }
    }
    if (first == last) {
        return Editable::invalidRange();
    }
    return {fromZero ? std::min(0.0, nodes[first].time) : nodes[first].time, nodes[last - 1].time};
}

bool AudLevelsCel::insert(const AudLevelsCel& source, const Range& sourceRange, double at) {
    const auto& nodes = getNodeStore().nodes();
    const double last = nodes.empty() ? at : std::max(at, nodes.back().time);
    if (!valid() || !isUsableRange(sourceRange) || !isUsableTime(at) ||
        !isUsableTime(last + sourceRange.length())) {
        return false;
    }
    changeNodeStore().insert(source.getNodeStore(), sourceRange, at);
    return true;
}

bool AudLevelsCel::remove(const Range& range) {
    if (!valid() || !isUsableRange(range)) {
        return false;
    }
    changeNodeStore().remove(range);
    return true;
}

bool AudLevelsCel::replace(const AudLevelsCel& source, const Range& sourceRange, double at) {
    if (!valid() || !isUsableRange(sourceRange) || !isUsableTime(at) ||
        !isUsableTime(at + sourceRange.length())) {
        return false;
    }
    changeNodeStore().replace(source.getNodeStore(), sourceRange, at);
    return true;
}

bool AudLevelsCel::simplify() {
    if (!valid()) {
        return false;
    }
    const size_t before = m_contents->nodes.size();
    m_contents->nodes.simplify();
    if (m_contents->nodes.size() == before) {
        return false;
    }
    m_contents->changed = true;
    return true;
}

bool AudLevelsCel::changed() const {
    return valid() && m_contents->changed;
}

void AudLevelsCel::setChanged(bool changed) {
    if (valid()) {
        m_contents->changed = changed;
    }
}

bool AudLevelsCel::checkNodesRevision(const AudCel& audio) {
    if (!valid() || m_contents->revisionMajor() >= kMajor) {
        return false;
    }
    static_cast<void>(replaceClipNodes(audio));
    m_contents->revisionMajor(kMajor);
    m_contents->revisionMinor(0);
    m_contents->changed = true;
    return true;
}

bool AudLevelsCel::replaceClipNodes(const AudCel& audio) {
    if (!valid() || !audio.valid()) {
        return false;
    }
    const cel& clips = *audio.getCel();
    Store built = m_contents->nodes;
    bool found = false;
    for (int i = 0; i + 1 < clips.numEvents(); i += 2) {
        const channel_event in = clips.get_event(i);
        const channel_event out = clips.get_event(i + 1);
        const double length = out.editTime - in.editTime;
        const bool ownLevels = in.level != 1.0f || out.level != 1.0f;
        if (in.strip.isBlack() || !ownLevels || !(length > Store::kStep)) {
            continue;
        }
        Store clip;
        clip.insertNode(0, in.level);
        clip.insertNode(length, out.level);
        built.replace(clip, {0, length}, in.editTime);
        found = true;
    }
    if (!found || built == m_contents->nodes) {
        return false;
    }
    changeNodeStore() = std::move(built);
    return true;
}

void AudLevelsCel::writeToStore(TagBag& store) const {
    if (valid()) {
        store.lendObject(m_id.asString(), *m_contents, m_contents->changed);
    }
}

AudLevelsCel AudLevelsCel::createFromStore(const IdStamp& id, TagBag& store) {
    AudLevelsCel made;
    auto contents = std::make_shared<Contents>();
    if (id.valid() && store.readObject(id.asString(), *contents)) {
        made.m_contents = std::move(contents);
        made.m_id = id;
    }
    return made;
}

void AudLevelsCel::extractFromStore(TagBag& store) const {
    if (valid()) {
        static_cast<void>(store.extractObject(m_id.asString()));
    }
}
