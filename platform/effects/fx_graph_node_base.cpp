#include "platform/effects/fx_graph_node_base.h"

#include <algorithm>
#include <set>

namespace {

constexpr size_t kLongestTypeId = 1024;
constexpr size_t kLongestNodeName = 1024;
constexpr size_t kPackedStamp = 12;
/// The bits of the byte that tells about a node, and of that before each input. They live in files.
constexpr uint8_t kExplicitInputs = 1;
constexpr uint8_t kAutomatic = 1;

bool isReserved(const IdStamp& id) {
    return id == previousInputId || id == nextInputId;
}

bool isPlainText(std::string_view text, size_t longest) {
    return text.size() <= longest && Qx::isUtf8(text) && std::none_of(text.begin(), text.end(), [](char c) {
               return static_cast<unsigned char>(c) < 0x20 || c == 0x7F;
           });
}

bool hasTwins(std::span<const IdStamp> stamps) {
    return std::set<IdStamp>(stamps.begin(), stamps.end()).size() != stamps.size();
}

IdStamp renamedStamp(const StampMap& renamed, const IdStamp& id) {
    const auto found = isReserved(id) ? renamed.end() : renamed.find(id);
    return found == renamed.end() ? id : found->second;
}

} // namespace

constinit const Streamable::Form FXGraphNodeBase::kNodeForm{"FXGraphNodeBase", "fxnode"};

FXGraphNodeBase::FXGraphNodeBase(std::span<const Form* const> forms)
    : m_forms(forms), m_major(forms.back()->major), m_minor(forms.back()->minor) {}

FXGraphNodeBase::~FXGraphNodeBase() = default;

std::string_view FXGraphNodeBase::kindName() const {
    return {};
}

String FXGraphNodeBase::getName() const {
    if (!m_name.empty()) {
        return m_name;
    }
    const std::string_view kind = kindName();
    return kind.empty() ? m_type.id() : String(kind);
}

bool FXGraphNodeBase::setName(std::string_view name) {
    if (!isPlainText(name, kLongestNodeName)) {
        return false;
    }
    m_name = String(name);
    touch();
    return true;
}

IdStamp FXGraphNodeBase::getInputTrackId(unsigned input) const {
    return input < m_inputs.size() ? m_inputs[input].track : IdStamp();
}

bool FXGraphNodeBase::setInputTrackId(unsigned input, const IdStamp& track, bool automatic) {
    if (input >= m_inputs.size() || (track.valid() && track == tagId())) {
        return false;
    }
    m_inputs[input] = {track, automatic};
    touch();
    return true;
}

bool FXGraphNodeBase::isInputAutomatic(unsigned input) const {
    return input < m_inputs.size() && m_inputs[input].automatic;
}

unsigned FXGraphNodeBase::getNumAutomaticInputs() const {
    return static_cast<unsigned>(
        std::count_if(m_inputs.begin(), m_inputs.end(), [](const Input& input) { return input.automatic; }));
}

bool FXGraphNodeBase::setCompoundMembers(std::span<const IdStamp> members) {
    const auto isNone = [&](const IdStamp& id) { return !id.valid() || id == tagId(); };
    if (members.size() > kMostMembers || hasTwins(members) ||
        std::any_of(members.begin(), members.end(), isNone)) {
        return false;
    }
    m_members.assign(members.begin(), members.end());
    touch();
    return true;
}

void FXGraphNodeBase::keepSpan(double, double, double) {}

void FXGraphNodeBase::setKind(const TagTypeId& type, unsigned numInputs, unsigned numAutomatic,
                              bool explicitInputs) {
    m_type = type;
    m_inputs.assign(numInputs, {});
    for (unsigned i = 0; i < numAutomatic && i < numInputs; ++i) {
        m_inputs[i].automatic = true;
    }
    m_explicitInputs = explicitInputs;
    touch();
}

void FXGraphNodeBase::pack(PStream& stream) const {
    STRM_layerPack(m_forms.size() - 1, stream);
}

void FXGraphNodeBase::unpack(PStream& stream) {
    STRM_layerUnpack(m_forms.size() - 1, m_major, m_minor, stream);
}

/// Lives in files: do not change it.
void FXGraphNodeBase::STRM_layerPack(size_t layer, PStream& stream) const {
    if (layer != 0) {
        return;
    }
    stream.setString(m_type.id());
    stream.setString(m_name);
    stream.setCookedChar(m_explicitInputs ? kExplicitInputs : 0);
    stream.setUnsignedLong(static_cast<uint32_t>(m_inputs.size()));
    for (const Input& input : m_inputs) {
        stream.setCookedChar(input.automatic ? kAutomatic : 0);
        input.track.pack(stream);
    }
    stream.setUnsignedLong(static_cast<uint32_t>(m_members.size()));
    for (const IdStamp& member : m_members) {
        member.pack(stream);
    }
}

void FXGraphNodeBase::STRM_layerUnpack(size_t layer, uint8_t, uint8_t, PStream& stream) {
    if (layer != 0) {
        return;
    }
    const String type = stream.getString();
    String name = stream.getString();
    const uint8_t flags = stream.getCookedChar();
    std::vector<Input> inputs(stream.getCount(1 + kPackedStamp));
    if (inputs.size() > kMostInputs) {
        stream.fail();
        return;
    }
    for (Input& input : inputs) {
        const uint8_t automatic = stream.getCookedChar();
        input.track.unpack(stream);
        input.automatic = automatic == kAutomatic;
        if (automatic > kAutomatic) {
            stream.fail();
        }
    }
    std::vector<IdStamp> members(stream.getCount(kPackedStamp));
    for (IdStamp& member : members) {
        member.unpack(stream);
    }
    if (type.empty() || !isPlainText(type, kLongestTypeId) || !isPlainText(name, kLongestNodeName) ||
        flags > kExplicitInputs || members.size() > kMostMembers || hasTwins(members) ||
        std::find(members.begin(), members.end(), IdStamp()) != members.end()) {
        stream.fail();
    }
    if (!stream.good()) {
        return;
    }
    m_type = TagTypeId(type);
    m_name = std::move(name);
    m_inputs = std::move(inputs);
    m_members = std::move(members);
    m_explicitInputs = flags == kExplicitInputs;
}

void FXGraphNodeBase::listReferences(Vector<IdStamp>& stamps) const {
    for (const Input& input : m_inputs) {
        if (input.track.valid() && !isReserved(input.track)) {
            stamps.push_back(input.track);
        }
    }
    stamps.insert(stamps.end(), m_members.begin(), m_members.end());
}

void FXGraphNodeBase::renameReferences(const StampMap& renamed) {
    std::vector<Input> inputs = m_inputs;
    std::vector<IdStamp> members = m_members;
    for (Input& input : inputs) {
        input.track = renamedStamp(renamed, input.track);
    }
    for (IdStamp& member : members) {
        member = renamedStamp(renamed, member);
    }
    // What a map makes two members of is one; what it takes away is none.
    std::set<IdStamp> seen{IdStamp()};
    std::erase_if(members, [&](const IdStamp& member) { return !seen.insert(member).second; });
    if (inputs != m_inputs || members != m_members) {
        m_inputs = std::move(inputs);
        m_members = std::move(members);
        touch();
    }
}
