#include "platform/effects/effect_kinds.h"

#include <algorithm>

namespace Fx {

namespace {

// The forms of parameters. Defaults, and the values of choices, live in files: do not change them.

constexpr double kManyPictures = 100;

constexpr ParameterForm number(std::string_view name, double byDefault, double least, double greatest,
                               std::string_view unit = {}) {
    return {name, ParameterKind::Number, {byDefault}, least, greatest, unit, {}, false};
}

/// A part of a whole, 0 to 1.
constexpr ParameterForm part(std::string_view name, double byDefault) {
    return number(name, byDefault, 0, 1);
}

constexpr ParameterForm onOff(std::string_view name, bool byDefault) {
    return {name, ParameterKind::Switch, {byDefault ? 1.0 : 0.0}, 0, 1, {}, {}, false};
}

constexpr ParameterForm colour(std::string_view name, double red, double green, double blue) {
    return {name, ParameterKind::Colour, {red, green, blue, 1}, 0, kManyPictures, {}, {}, false};
}

constexpr ParameterForm point(std::string_view name, double both, std::string_view unit, double reach) {
    return {name, ParameterKind::Point, {both, both}, -reach, reach, unit, {}, false};
}

constexpr ParameterForm choice(std::string_view name, uint32_t byDefault,
                               std::span<const std::string_view> choices) {
    return {name, ParameterKind::Choice, {double{1} * byDefault}, 0, double(choices.size()) - 1, {}, choices,
            false};
}

constexpr ParameterForm file(std::string_view name) {
    return {name, ParameterKind::File, {}, 0, 0, {}, {}, false};
}

constexpr ParameterForm kProgressForm{"progress", ParameterKind::Number, {0}, 0, 1, {}, {}, true};

constexpr ParameterForm kCommon[] = {part("opacity", 1)};

constexpr ParameterForm kDissolveForms[] = {kProgressForm};

constexpr std::string_view kCurves[] = {"linear", "constant power", "s curve", "logarithmic"};
constexpr ParameterForm kCrossFadeForms[] = {kProgressForm, choice("curve", 0, kCurves)};

constexpr ParameterForm kDipForms[] = {kProgressForm, colour("colour", 0, 0, 0)};

/// Any code: one that is not of the standard is kept as it was read.
constexpr ParameterForm kPatternForm{"pattern", ParameterKind::Choice, {1}, 0, UINT32_MAX, {}, {}, false};
constexpr ParameterForm kWipeForms[] = {kProgressForm,           kPatternForm,
                                        onOff("reverse", false), part("softness", 0),
                                        part("border width", 0), colour("border colour", 1, 1, 1)};
constexpr ParameterForm kLegacyWipeForms[] = {kProgressForm, kPatternForm};

constexpr ParameterForm kDVEForms[] = {point("position", 0, "frame", kManyPictures),
                                       point("scale", 1, {}, kManyPictures),
                                       number("rotation", 0, -36000, 36000, "degree"),
                                       number("crop left", 0, 0, 1, "frame"),
                                       number("crop top", 0, 0, 1, "frame"),
                                       number("crop right", 0, 0, 1, "frame"),
                                       number("crop bottom", 0, 0, 1, "frame"),
                                       part("border width", 0),
                                       colour("border colour", 1, 1, 1)};

constexpr ParameterForm kCorrectionForms[] = {
    number("hue", 0, -180, 180, "degree"), number("saturation", 1, 0, 10), number("contrast", 1, 0, 10),
    number("brightness", 0, -1, 1),        number("gamma", 1, 0.1, 10),    colour("gain", 1, 1, 1)};

constexpr ParameterForm kTintForms[] = {colour("colour", 0.75, 0.6, 0.4), part("amount", 1)};
constexpr ParameterForm kMosaicForms[] = {number("width", 0.02, 0.0001, 1, "frame"),
                                          number("height", 0.02, 0.0001, 1, "frame")};
constexpr ParameterForm kPosterizeForms[] = {number("levels", 8, 2, 256)};

constexpr ParameterForm kChromaKeyForms[] = {colour("colour", 0, 1, 0),
                                             number("tolerance", 30, 0, 180, "degree"),
                                             number("softness", 10, 0, 180, "degree"),
                                             part("saturation", 0.2),
                                             part("spill", 0.5),
                                             onOff("invert", false)};
constexpr ParameterForm kLumaKeyForms[] = {part("low", 0.1), part("high", 1), part("softness", 0.05),
                                           onOff("invert", false)};
constexpr ParameterForm kCombinedKeyForms[] = {colour("colour", 0, 1, 0),
                                               number("tolerance", 30, 0, 180, "degree"),
                                               number("softness", 10, 0, 180, "degree"),
                                               part("saturation", 0.2),
                                               part("spill", 0.5),
                                               part("low", 0),
                                               part("high", 1),
                                               onOff("invert", false)};

constexpr ParameterForm kTitleForms[] = {file("file"), point("position", 0, "frame", kManyPictures)};
constexpr ParameterForm kExternalForms[] = {file("file")};

constexpr EffectRole kFilter = EffectRole::Filter;
constexpr EffectRole kTransitionRole = EffectRole::Transition;
constexpr EffectRole kKeyRole = EffectRole::Key;
constexpr EffectRole kTitleRole = EffectRole::Title;

constexpr EffectKind transition(std::string_view typeId, std::string_view name,
                                std::span<const ParameterForm> forms,
                                EffectClass effectClass = EffectClass::Plain, bool isLegacy = false) {
    return {typeId, name, "Mixes", kTransitionRole, effectClass, 2, 0, false, forms, isLegacy, false};
}

constexpr EffectKind filter(std::string_view typeId, std::string_view name, std::string_view category,
                            std::span<const ParameterForm> forms, bool isLegacy = false) {
    return {typeId, name, category, kFilter, EffectClass::Plain, 1, 1, true, forms, isLegacy, false};
}

/// Something in front of a background, which the program wires.
constexpr EffectKind over(std::string_view typeId, std::string_view name, std::string_view category,
                          std::span<const ParameterForm> forms, bool isLegacy = false) {
    return {typeId, name, category, kKeyRole, EffectClass::Plain, 2, 2, true, forms, isLegacy, false};
}

constexpr EffectKind title(std::string_view typeId, std::string_view name, bool isLegacy) {
    return {typeId, name,        "Titles", kTitleRole, EffectClass::InscriberTitle, 1, 1,
            true,   kTitleForms, isLegacy, false};
}

constexpr EffectKind family(std::string_view typeId, std::string_view name, EffectClass effectClass,
                            std::span<const ParameterForm> forms) {
    return {typeId, name, name, kFilter, effectClass, 1, 1, true, forms, false, true};
}

/// The kinds. A new one is a row here; one that earlier releases made stays, as edits hold it.
constexpr EffectKind kTable[] = {
    transition(kDissolve, "Dissolve", kDissolveForms),
    {kCrossFade, "Cross-fade", "Audio", EffectRole::Sound, EffectClass::Plain, 2, 0, false, kCrossFadeForms,
     false, false},
    transition(kWipe, "Wipe", kWipeForms, EffectClass::TextureWipe),
    transition(kDip, "Dip to Colour", kDipForms),
    over(kKey, "Superimpose", "Keying", {}),
    over(kDVE, "DVE", "DVEs", kDVEForms),
    filter(kColourCorrection, "HSV Colour Correction", "Colour Effects", kCorrectionForms),
    filter(kTint, "Colour Tint", "Colour Effects", kTintForms),
    filter(kMosaic, "Mosaic", "Stylize", kMosaicForms),
    filter(kPosterize, "Posterize", "Stylize", kPosterizeForms),
    over(kChromaKey, "Chromakey", "Keying", kChromaKeyForms),
    over(kLumaKey, "Lumakey", "Keying", kLumaKeyForms),
    title(kTitle, "Title", false),
    family(kPlugInPrefix, "Plug-ins", EffectClass::PlugIn, {}),
    family(kExternalPrefix, "External Applications", EffectClass::External, kExternalForms),
    over("\\ORV\\VIS\\FX\\DVEBASE\\DVE", "DVE", "DVEs", kDVEForms, true),
    over("\\ORV\\VIS\\FX\\DVEBASE\\PIP", "Picture in Picture", "DVEs", kDVEForms, true),
    transition("\\ORV\\VIS\\FX\\MIX\\LDISSOLVE", "Dissolve", kDissolveForms, EffectClass::Plain, true),
    transition("\\ORV\\VIS\\FX\\MIX\\SDISSOLVE", "Dissolve", kDissolveForms, EffectClass::Plain, true),
    filter("PixShader:Colour Effects:CORRECT", "Colour Correction", "Colour Effects", kCorrectionForms, true),
    filter("PixShader:Colour Effects:TINT", "Tint", "Colour Effects", kTintForms, true),
    filter("PixShader:Stylize:MOSAIC", "Mosaic", "Stylize", kMosaicForms, true),
    filter("PixShader:Stylize:POSTER", "Posterize", "Stylize", kPosterizeForms, true),
    over("PixShader:Keying:COMBINED", "Combined Key", "Keying", kCombinedKeyForms, true),
    over("PixShader:Keying:CHROMA", "Chromakey", "Keying", kChromaKeyForms, true),
    over("PixShader:Keying:LUMA", "Lumakey", "Keying", kLumaKeyForms, true),
    title("\\ORV\\VIS\\FX\\GENKEY\\TITLE\\CRAWL", "Crawl", true),
    title("\\ORV\\VIS\\FX\\GENKEY\\TITLE\\ROLL", "Roll", true),
    title("\\ORV\\VIS\\FX\\GENKEY\\TITLE\\STATIC", "Static", true),
    transition("PixShader:Mixes:wipes.fx", "Wipe", kLegacyWipeForms, EffectClass::DissolveWipe, true),
};

const ParameterForm* findForm(std::span<const ParameterForm> forms, std::string_view name) {
    const auto found = std::find_if(forms.begin(), forms.end(),
                                    [&](const ParameterForm& form) { return form.name == name; });
    return found != forms.end() ? &*found : nullptr;
}

/// True for the member of a family: its prefix, a backslash and a name.
bool isOfFamily(std::string_view typeId, std::string_view family) {
    return typeId.size() > family.size() + 1 && typeId.starts_with(family) && typeId[family.size()] == '\\';
}

} // namespace

const ParameterForm* EffectKind::findParameter(std::string_view parameter) const {
    const ParameterForm* const own = findForm(parameters, parameter);
    return own != nullptr ? own : findForm(kCommon, parameter);
}

std::span<const EffectKind> kinds() {
    return kTable;
}

const EffectKind* findKind(std::string_view typeId) {
    const auto isIt = [&](const EffectKind& kind) {
        return kind.isFamily ? isOfFamily(typeId, kind.typeId) : typeId == kind.typeId;
    };
    const auto found = std::find_if(std::begin(kTable), std::end(kTable), isIt);
    return found != std::end(kTable) ? found : nullptr;
}

std::span<const ParameterForm> commonParameters() {
    return kCommon;
}

} // namespace Fx
