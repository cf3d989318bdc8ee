#pragma once

#include "platform/effects/effect_parameter.h"

#include <memory>
#include <span>

class EffectInstance;

/// The table of the kinds of effect. A kind that needs no behaviour of its own is a row of it and nothing else.
namespace Fx {

/// What an effect is for.
enum class EffectRole : uint8_t {
    Filter,     ///< changes what its input shows
    Transition, ///< leads from one event to the next
    Key,        ///< lays input 0 over input 1
    Title,      ///< lays a title over its input
    Sound       ///< a transition between sounds
};

/// The class that nodes of a kind have.
enum class EffectClass : uint8_t {
    Plain, ///< `EffectInstance`
    DissolveWipe,
    TextureWipe,
    InscriberTitle,
    PlugIn,
    External
};

/// A kind of effect.
struct EffectKind {
    /// What files know it by: do not change it. For a family of kinds (`isFamily`) what their identifiers
    /// begin with.
    std::string_view typeId;
    std::string_view name;     ///< as users read it
    std::string_view category; ///< what it is listed under
    EffectRole role = EffectRole::Filter;
    EffectClass effectClass = EffectClass::Plain;
    unsigned numInputs = 1;
    unsigned numAutomaticInputs = 0; ///< the first so many are wired by the program
    bool explicitInputs = true;      ///< false where unwired inputs are the neighbours on the channel
    std::span<const ParameterForm> parameters;
    bool isLegacy = false; ///< made by earlier releases only; another kind stands for it
    bool isFamily = false; ///< the rest of the identifier names one of many, each with parameters of its own

    [[nodiscard]] bool isTransition() const {
        return role == EffectRole::Transition || role == EffectRole::Sound;
    }
    /// The form of a parameter, those that all kinds have included; null when the kind has none of that name.
    [[nodiscard]] QM_API const ParameterForm* findParameter(std::string_view parameter) const;
};

/// The type identifiers of the kinds that programs make. They live in files: do not change them.
inline constexpr std::string_view kDissolve = "QxDissolve";
inline constexpr std::string_view kCrossFade = "QxCrossFade"; ///< between sounds
inline constexpr std::string_view kWipe = "QxWipe";           ///< `TextureWipeEffect`
inline constexpr std::string_view kDip = "QxDip";             ///< through a colour
inline constexpr std::string_view kKey = "QxKey";             ///< input 0 over input 1, by its opacity
inline constexpr std::string_view kDVE = "QxDVE";
inline constexpr std::string_view kColourCorrection = "QxColourCorrection";
inline constexpr std::string_view kTint = "QxTint";
inline constexpr std::string_view kMosaic = "QxMosaic";
inline constexpr std::string_view kPosterize = "QxPosterize";
inline constexpr std::string_view kChromaKey = "QxChromaKey";
inline constexpr std::string_view kLumaKey = "QxLumaKey";
inline constexpr std::string_view kTitle = "QxTitle"; ///< `InscriberTitleEffect`
/// What the identifiers of plug-ins and of effects of other applications begin with; a backslash and the name
/// follow.
inline constexpr std::string_view kPlugInPrefix = "\\ORV\\VIS\\FX\\PLUGINS";
inline constexpr std::string_view kExternalPrefix = "\\ORV\\VIS\\FX\\EXTAPP";

/// Every kind, in the order in which they are listed.
[[nodiscard]] QM_API std::span<const EffectKind> kinds();
/// The kind with a type identifier, which for a family need only begin as the kind's; null when there is none.
/// Allocates nothing.
[[nodiscard]] QM_API const EffectKind* findKind(std::string_view typeId);
/// The parameters that every kind has besides its own: "opacity", a number from 0 to 1, by default 1.
[[nodiscard]] QM_API std::span<const ParameterForm> commonParameters();

/// A node of a kind, with its defaults and nothing wired; null when there is no such kind. The caller owns it.
[[nodiscard]] QM_API std::unique_ptr<EffectInstance> makeEffect(std::string_view typeId);

} // namespace Fx
