#include "platform/effects/special_effects.h"

namespace {

using Form = Streamable::Form;

constexpr std::string_view kPattern = "pattern";
constexpr std::string_view kReverse = "reverse";
constexpr std::string_view kFile = "file";

// The layers of the classes: none holds anything of its own, as what a class knows is in its parameters. The
// names live in files: do not change them.
constexpr Form kDissolveWipeForm{"DissolveWipeEffect", "dwipe"};
constexpr Form kTextureWipeForm{"TextureWipeEffect", "twipe"};
constexpr Form kTitleForm{"InscriberTitleEffect", "title"};
constexpr Form kPlugInForm{"PlugInEffect", "plugin"};
constexpr Form kExternalForm{"ExternalAppEffect", "extapp"};

constexpr const Form* kPlainForms[] = {&FXGraphNodeBase::kNodeForm, &EffectInstance::kEffectForm};
template <const Form& Own>
constexpr const Form* kForms[] = {&FXGraphNodeBase::kNodeForm, &EffectInstance::kEffectForm, &Own};

/// What follows a family's prefix and a backslash.
std::string_view memberName(std::string_view typeId, std::string_view family) {
    return typeId.substr(std::min(typeId.size(), family.size() + 1));
}

String fileOf(const EffectInstance& effect) {
    const std::optional<Fx::Sample> its = effect.getParameterAt(kFile, 0);
    return its ? String(its->text) : String();
}

} // namespace

/// Makes the nodes of each class.
struct EffectClasses {
    static std::unique_ptr<EffectInstance> make(Fx::EffectClass effectClass) {
        switch (effectClass) {
        case Fx::EffectClass::DissolveWipe:
            return std::unique_ptr<EffectInstance>(new DissolveWipeEffect);
        case Fx::EffectClass::TextureWipe:
            return std::unique_ptr<EffectInstance>(new TextureWipeEffect);
        case Fx::EffectClass::InscriberTitle:
            return std::unique_ptr<EffectInstance>(new InscriberTitleEffect);
        case Fx::EffectClass::PlugIn:
            return std::unique_ptr<EffectInstance>(new PlugInEffect);
        case Fx::EffectClass::External:
            return std::unique_ptr<EffectInstance>(new ExternalAppEffect);
        case Fx::EffectClass::Plain:
            break;
        }
        return std::unique_ptr<EffectInstance>(new EffectInstance(kPlainForms));
    }

    static std::unique_ptr<EffectInstance> make(std::string_view typeId, const Fx::EffectKind& kind) {
        std::unique_ptr<EffectInstance> effect = make(kind.effectClass);
        effect->becomeKind(typeId, kind);
        return effect;
    }

    template <Fx::EffectClass Class>
    static void know(const char* name) {
        Streamable::registerBuilder(name, []() -> std::unique_ptr<Streamable> { return make(Class); });
    }

    static bool knowAll() {
        know<Fx::EffectClass::Plain>(EffectInstance::kEffectForm.name);
        know<Fx::EffectClass::DissolveWipe>(kDissolveWipeForm.name);
        know<Fx::EffectClass::TextureWipe>(kTextureWipeForm.name);
        know<Fx::EffectClass::InscriberTitle>(kTitleForm.name);
        know<Fx::EffectClass::PlugIn>(kPlugInForm.name);
        know<Fx::EffectClass::External>(kExternalForm.name);
        return true;
    }
};

namespace {
const bool kRegistered = EffectClasses::knowAll();
}

std::unique_ptr<EffectInstance> Fx::makeEffect(std::string_view typeId) {
    const EffectKind* const kind = findKind(typeId);
    return kind != nullptr ? EffectClasses::make(typeId, *kind) : nullptr;
}

DissolveWipeEffect::DissolveWipeEffect() : EffectInstance(kForms<kDissolveWipeForm>) {}

WipePattern DissolveWipeEffect::getPattern() const {
    return WipePattern{static_cast<uint32_t>(getNumberAt(kPattern, 0, Wipe::Patterns::BarLeftToRight))};
}

void DissolveWipeEffect::setPattern(WipePattern pattern) {
    setParameter(kPattern, Fx::ParameterValue::ofChoice(static_cast<uint32_t>(pattern)));
}

TextureWipeEffect::TextureWipeEffect() : EffectInstance(kForms<kTextureWipeForm>) {}

uint32_t TextureWipeEffect::getPatternCode() const {
    return static_cast<uint32_t>(getNumberAt(kPattern, 0, Wipe::Patterns::BarLeftToRight));
}

Wipe::Patterns::Pattern TextureWipeEffect::getPattern() const {
    return Wipe::remapPattern(WipePattern{getPatternCode()});
}

Wipe_Direction TextureWipeEffect::getDirection() const {
    return getNumberAt(kReverse, 0) != 0 ? Wipe_Direction::Reverse : Wipe_Direction::Forward;
}

void TextureWipeEffect::setPattern(Wipe::Patterns::Pattern pattern, Wipe_Direction direction) {
    setPatternCode(pattern);
    setParameter(kReverse, Fx::ParameterValue::ofSwitch(direction == Wipe_Direction::Reverse));
}

void TextureWipeEffect::setPatternCode(uint32_t code) {
    setParameter(kPattern, Fx::ParameterValue::ofChoice(code));
}

InscriberTitleEffect::InscriberTitleEffect() : EffectInstance(kForms<kTitleForm>) {}

String InscriberTitleEffect::getICGFileName() const {
    return fileOf(*this);
}

bool InscriberTitleEffect::setICGFileName(std::string_view path) {
    return setParameter(kFile, Fx::ParameterValue::ofFile(String(path)));
}

PlugInEffect::PlugInEffect() : EffectInstance(kForms<kPlugInForm>) {}

std::string_view PlugInEffect::getPlugInId() const {
    return memberName(tagTypeId().id(), Fx::kPlugInPrefix);
}

ExternalAppEffect::ExternalAppEffect() : EffectInstance(kForms<kExternalForm>) {}

std::string_view ExternalAppEffect::getApplication() const {
    return memberName(tagTypeId().id(), Fx::kExternalPrefix);
}

String ExternalAppEffect::getProjectFile() const {
    return fileOf(*this);
}

bool ExternalAppEffect::setProjectFile(std::string_view path) {
    return setParameter(kFile, Fx::ParameterValue::ofFile(String(path)));
}

// ---- copies

std::unique_ptr<Streamable> EffectInstance::clone(BuilderType) const {
    return std::unique_ptr<Streamable>(new EffectInstance(*this));
}

std::unique_ptr<Streamable> DissolveWipeEffect::clone(BuilderType) const {
    return std::unique_ptr<Streamable>(new DissolveWipeEffect(*this));
}

std::unique_ptr<Streamable> TextureWipeEffect::clone(BuilderType) const {
    return std::unique_ptr<Streamable>(new TextureWipeEffect(*this));
}

std::unique_ptr<Streamable> InscriberTitleEffect::clone(BuilderType) const {
    return std::unique_ptr<Streamable>(new InscriberTitleEffect(*this));
}

std::unique_ptr<Streamable> PlugInEffect::clone(BuilderType) const {
    return std::unique_ptr<Streamable>(new PlugInEffect(*this));
}

std::unique_ptr<Streamable> ExternalAppEffect::clone(BuilderType) const {
    return std::unique_ptr<Streamable>(new ExternalAppEffect(*this));
}
