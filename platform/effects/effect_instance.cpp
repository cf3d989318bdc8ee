#include "platform/effects/effect_instance.h"

#include <algorithm>
#include <cmath>
#include <set>

namespace {

constexpr std::string_view kProgress = "progress";
constexpr std::string_view kOpacity = "opacity";
/// Name, kind, count and a switch.
constexpr size_t kLeastParameter = 4 + 1 + 4 + 1;

bool isNumber(Fx::ParameterKind kind) {
    return kind == Fx::ParameterKind::Number || kind == Fx::ParameterKind::Switch ||
           kind == Fx::ParameterKind::Choice;
}

template <typename List>
auto findNamed(List& parameters, std::string_view name) {
    const auto found = std::find_if(parameters.begin(), parameters.end(),
                                    [&](const Fx::EffectParameter& its) { return its.name() == name; });
    return found != parameters.end() ? &*found : nullptr;
}

} // namespace

constinit const Streamable::Form EffectInstance::kEffectForm{"EffectInstance", "fx"};

EffectInstance::EffectInstance(std::span<const Form* const> forms) : FXGraphNodeBase(forms) {}

EffectInstance::~EffectInstance() = default;

std::string_view EffectInstance::kindName() const {
    if (m_kind == nullptr) {
        return {};
    }
    if (!m_kind->isFamily) {
        return m_kind->name;
    }
    const std::string_view type = tagTypeId().id();
    return type.substr(std::min(type.size(), m_kind->typeId.size() + 1));
}

void EffectInstance::becomeKind(std::string_view typeId, const Fx::EffectKind& kind) {
    m_kind = &kind;
    setKind(TagTypeId(typeId), kind.numInputs, kind.numAutomaticInputs, kind.explicitInputs);
}

const Fx::EffectParameter* EffectInstance::findParameter(std::string_view name) const {
    return findNamed(m_parameters, name);
}

Fx::EffectParameter* EffectInstance::find(std::string_view name) {
    return findNamed(m_parameters, name);
}

const Fx::ParameterForm* EffectInstance::parameterForm(std::string_view name) const {
    return m_kind != nullptr ? m_kind->findParameter(name) : nullptr;
}

std::optional<Fx::Sample> EffectInstance::getParameterAt(std::string_view name, double time) const {
    if (const Fx::EffectParameter* const its = findParameter(name)) {
        return its->at(time);
    }
    const Fx::ParameterForm* const form = parameterForm(name);
    return form != nullptr ? std::optional(form->defaultSample()) : std::nullopt;
}

double EffectInstance::getNumberAt(std::string_view name, double time, double otherwise) const {
    const std::optional<Fx::Sample> its = getParameterAt(name, time);
    return its && isNumber(its->kind) ? its->number() : otherwise;
}

bool EffectInstance::accepts(std::string_view name, const Fx::ParameterValue& value) const {
    if (const Fx::ParameterForm* const form = parameterForm(name)) {
        const Fx::EffectParameter* const its = findParameter(name);
        return form->accepts(value) && (its == nullptr || its->kind() == value.kind());
    }
    if (m_kind != nullptr && !m_kind->isFamily) {
        return false;
    }
    if (const Fx::EffectParameter* const its = findParameter(name)) {
        return its->kind() == value.kind() && value.isUsable();
    }
    return !name.empty() && name.size() <= Fx::kLongestParameterName && Qx::isUtf8(name) &&
           value.isUsable() && m_parameters.size() < kMostParameters;
}

bool EffectInstance::setParameter(std::string_view name, const Fx::ParameterValue& value) {
    if (!accepts(name, value)) {
        return false;
    }
    if (Fx::EffectParameter* const its = find(name)) {
        its->setConstant(value);
    } else {
        m_parameters.emplace_back(String(name), value);
    }
    touch();
    return true;
}

bool EffectInstance::setKeyframe(std::string_view name, double time, const Fx::ParameterValue& value,
                                 Fx::Interpolation interpolation) {
    const Fx::Keyframe key{time, interpolation, value};
    if (!accepts(name, value)) {
        return false;
    }
    if (Fx::EffectParameter* const its = find(name)) {
        if (!its->setKeyframe(key)) {
            return false;
        }
    } else {
        Fx::EffectParameter made{String(name), value};
        if (!made.setKeyframe(key)) {
            return false;
        }
        m_parameters.push_back(std::move(made));
    }
    touch();
    return true;
}

bool EffectInstance::removeKeyframe(std::string_view name, double time) {
    Fx::EffectParameter* const its = find(name);
    if (its == nullptr || !its->removeKeyframe(time)) {
        return false;
    }
    touch();
    return true;
}

bool EffectInstance::resetParameter(std::string_view name) {
    const auto gone =
        std::erase_if(m_parameters, [&](const Fx::EffectParameter& its) { return its.name() == name; });
    if (gone > 0) {
        touch();
    }
    return gone > 0;
}

double EffectInstance::getProgressAt(double time, double length) const {
    const Fx::EffectParameter* const its = findParameter(kProgress);
    if (its != nullptr && its->kind() == Fx::ParameterKind::Number) {
        return std::clamp(its->at(time).number(), 0.0, 1.0);
    }
    const double part = length > 0 ? time / length : 0;
    return part > 0 ? std::min(part, 1.0) : 0;
}

double EffectInstance::getInputShareAt(unsigned input, double time, double length) const {
    if (input >= getNumTrackInputs()) {
        return 0;
    }
    if (!isTransition()) {
        return input == 0 ? getAlphaAt(time) : 1;
    }
    const double progress = getProgressAt(time, length);
    const double share = input == 0 ? 1 - progress : input == 1 ? progress : 0;
    if (m_kind->typeId == Fx::kDip) {
        return std::clamp(2 * share - 1, 0.0, 1.0);
    }
    return share;
}

double EffectInstance::getAlphaAt(double time) const {
    return std::clamp(getNumberAt(kOpacity, time, 1), 0.0, 1.0);
}

void EffectInstance::listFiles(Vector<String>& paths) const {
    std::set<std::string_view> seen;
    const auto add = [&](const Fx::Sample& sample) {
        if (!sample.text.empty() && seen.insert(sample.text).second) {
            paths.emplace_back(sample.text);
        }
    };
    for (const Fx::EffectParameter& its : m_parameters) {
        if (its.kind() != Fx::ParameterKind::File) {
            continue;
        }
        for (const Fx::Keyframe& key : its.keyframes()) {
            add(key.value.sample());
        }
        if (its.isConstant()) {
            add(its.at(0));
        }
    }
}

void EffectInstance::keepSpan(double from, double to, double length) {
    if (!(std::abs(from) <= Fx::EffectParameter::kGreatestTime) ||
        !(std::abs(to) <= Fx::EffectParameter::kGreatestTime)) {
        return;
    }
    const Fx::ParameterForm* const form = parameterForm(kProgress);
    const bool isWhole = from == 0 && to == length;
    if (form != nullptr && form->followsLength && findParameter(kProgress) == nullptr && length > 0 &&
        !isWhole) {
        // What came of the length by itself is told by keyframes from here on.
        static_cast<void>(setKeyframe(kProgress, 0, Fx::ParameterValue::ofNumber(0)));
        static_cast<void>(setKeyframe(kProgress, length, Fx::ParameterValue::ofNumber(1)));
    }
    for (Fx::EffectParameter& its : m_parameters) {
        its.keepSpan(from, to);
    }
    touch();
}

/// Lives in files: do not change it.
void EffectInstance::STRM_layerPack(size_t layer, PStream& stream) const {
    if (layer == 0) {
        FXGraphNodeBase::STRM_layerPack(layer, stream);
    } else if (layer == 1) {
        stream.setUnsignedLong(static_cast<uint32_t>(m_parameters.size()));
        for (const Fx::EffectParameter& its : m_parameters) {
            its.pack(stream);
        }
    }
}

void EffectInstance::STRM_layerUnpack(size_t layer, uint8_t major, uint8_t minor, PStream& stream) {
    if (layer == 0) {
        FXGraphNodeBase::STRM_layerUnpack(layer, major, minor, stream);
        m_kind = Fx::findKind(tagTypeId().id());
        return;
    }
    if (layer != 1) {
        return;
    }
    const uint32_t count = stream.getCount(kLeastParameter);
    if (count > kMostParameters) {
        stream.fail();
    }
    std::vector<Fx::EffectParameter> read;
    read.reserve(stream.good() ? count : 0);
    for (uint32_t i = 0; i < count && stream.good(); ++i) {
        Fx::EffectParameter its = Fx::EffectParameter::unpack(stream);
        if (findNamed(read, its.name()) != nullptr) {
            stream.fail();
        }
        read.push_back(std::move(its));
    }
    if (stream.good()) {
        m_parameters = std::move(read);
    }
}
