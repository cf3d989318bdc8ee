#pragma once

#include "platform/effects/effect_kinds.h"
#include "platform/effects/effect_parameter.h"
#include "platform/effects/fx_graph_node_base.h"

#include <optional>

/// A node that does something: an effect of a kind, with parameters.
///
/// A parameter that was not set has the default of its kind and takes no memory. Nodes of a kind that this
/// program does not know have the parameters that are in the file, and keep them. Times are seconds from the
/// start of the effect's event.
///
/// Made by `Fx::makeEffect`, or opened from a bag.
class QM_API EffectInstance : public FXGraphNodeBase {
public:
    /// The most parameters that a node has.
    static constexpr size_t kMostParameters = 1024;

    ~EffectInstance() override;

    /// Null for a kind that is not known.
    [[nodiscard]] const Fx::EffectKind* kind() const { return m_kind; }
    [[nodiscard]] bool isTransition() const { return m_kind != nullptr && m_kind->isTransition(); }

    /// \name Parameters
    /// The setters answer false, changing nothing, for a parameter that the kind has not, a value of another
    /// kind or out of range, and a time that is no usable one. Nodes of an unknown kind, and of a family such as
    /// plug-ins, take any name of 1 to 256 bytes and any value; once set, its kind stays.
    /// @{
    /// Those that were set, in the order of the file.
    [[nodiscard]] std::span<const Fx::EffectParameter> parameters() const { return m_parameters; }
    /// One that was set; null otherwise. Good until the node's next change.
    [[nodiscard]] const Fx::EffectParameter* findParameter(std::string_view name) const;
    /// What the kind says of a parameter; null for an unknown kind or parameter.
    [[nodiscard]] const Fx::ParameterForm* parameterForm(std::string_view name) const;
    /// The value at a time; nothing for a parameter that is not set and that the kind has not. A transition's
    /// "progress" is found by `getProgressAt`. Allocates nothing.
    [[nodiscard]] std::optional<Fx::Sample> getParameterAt(std::string_view name, double time) const;
    /// The same as a number, or `otherwise` for what is not there or no number, switch or choice.
    [[nodiscard]] double getNumberAt(std::string_view name, double time, double otherwise = 0) const;
    /// One value for all time; keyframes go.
    bool setParameter(std::string_view name, const Fx::ParameterValue& value);
    bool setKeyframe(std::string_view name, double time, const Fx::ParameterValue& value,
                     Fx::Interpolation interpolation = Fx::Interpolation::Linear);
    bool removeKeyframe(std::string_view name, double time);
    /// Back to the default of the kind. False when it is that already.
    bool resetParameter(std::string_view name);
    /// @}

    /// How far a transition has come at a time, 0 (only what goes out) to 1 (only what comes in): what
    /// "progress" says if it was set, else a straight line over the event's `length`. 0 for a `length` that is
    /// not above 0.
    [[nodiscard]] double getProgressAt(double time, double length) const;
    /// How much of the input is seen at a time for a transition, 0 to 1: of a dissolve the complement of the
    /// progress for input 0 and the progress for input 1; of a dip each has its half; of a wipe the part of the
    /// picture's area is not worked out, its progress stands for it. For other kinds the opacity for input 0,
    /// and for a key 1 for input 1.
    [[nodiscard]] double getInputShareAt(unsigned input, double time, double length) const;
    /// The opacity of the effect, 0 to 1.
    [[nodiscard]] double getAlphaAt(double time) const;

    /// Appends the paths of the files that parameters of kind File name, those of keyframes too, each once.
    void listFiles(Vector<String>& paths) const;

    void keepSpan(double from, double to, double length) override;
    [[nodiscard]] std::unique_ptr<Streamable> clone(BuilderType type = BuilderType::Copy) const override;
    void STRM_layerPack(size_t layer, PStream& stream) const override;
    void STRM_layerUnpack(size_t layer, uint8_t major, uint8_t minor, PStream& stream) override;

    /// The layer of this class.
    static const Form kEffectForm;

protected:
    friend struct EffectClasses;
    explicit EffectInstance(std::span<const Form* const> forms);
    EffectInstance(const EffectInstance&) = default;

    [[nodiscard]] std::string_view kindName() const override;

private:
    void becomeKind(std::string_view typeId, const Fx::EffectKind& kind);
    /// True if a value may be set for a parameter.
    [[nodiscard]] bool accepts(std::string_view name, const Fx::ParameterValue& value) const;
    [[nodiscard]] Fx::EffectParameter* find(std::string_view name);

    const Fx::EffectKind* m_kind = nullptr;
    std::vector<Fx::EffectParameter> m_parameters;
};
