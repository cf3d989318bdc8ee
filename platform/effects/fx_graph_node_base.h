#pragma once

#include "platform/store/streamable.h"
#include "platform/store/tag.h"

#include <span>

/// The input stamps that name a neighbour on the effect's own channel instead of a channel: the event before
/// and the event after it. They live in files: do not change them.
inline constexpr IdStamp previousInputId{uint32_t{IdStampMagic::Channel} << 30, 0, 1};
inline constexpr IdStamp nextInputId{uint32_t{IdStampMagic::Channel} << 30, 0, 2};

/// A node of an effect graph, an object bound to an edit or kept in a template under a stamp of magic type 0.
///
/// The node of an event is the head of its graph: its stamp is that of the event. A node has inputs; each names
/// where its picture or sound comes from:
///
///     a channel's stamp (magic type 2)  what that channel shows at the time
///     a node's stamp (magic type 0)     another node of the same graph, in the same bag
///     previousInputId, nextInputId      the neighbour on the event's own channel
///     null                              not wired; for a transition's two inputs: 0 the neighbour that goes
///                                       out, 1 the one that comes in
///
/// This base knows the kind's identifier, the name, the inputs and the members of a compound effect, and has a
/// layer of its own for them, so that they can be read of a node whose kind this program does not know. What
/// an effect does is the matter of `EffectInstance`. It knows nothing of events, edits or pictures.
///
/// One thread at a time. A change is noted for the bag (`Taggable::isTagChanged`); that the edit is changed is
/// for the caller to record.
class QM_API FXGraphNodeBase : public Streamable, public Taggable {
public:
    /// The most inputs and members that a node has.
    static constexpr unsigned kMostInputs = 64;
    static constexpr unsigned kMostMembers = 4096;

    ~FXGraphNodeBase() override;

    /// The identifier of the node's kind.
    [[nodiscard]] const TagTypeId& tagTypeId() const override { return m_type; }
    /// The name that the user gave the effect, else that of its kind, else the type identifier.
    [[nodiscard]] String getName() const;
    /// At most 1024 bytes of UTF-8 without control characters, else false; empty for the kind's own name.
    bool setName(std::string_view name);
    /// The name that the user gave; empty when the node goes by that of its kind.
    [[nodiscard]] const String& givenName() const { return m_name; }

    /// True for a node of which this program can read this base only: its bytes stay as they are.
    [[nodiscard]] virtual bool isOpaque() const { return false; }

    /// \name Inputs
    /// @{
    [[nodiscard]] unsigned getNumTrackInputs() const { return static_cast<unsigned>(m_inputs.size()); }
    /// What an input names; null for one that is not wired, or is none.
    [[nodiscard]] IdStamp getInputTrackId(unsigned input) const;
    /// Wires an input. `automatic` tells that the program chose the channel, so that it may choose another. False,
    /// changing nothing, for an input that the node has not, and for the node's own stamp.
    bool setInputTrackId(unsigned input, const IdStamp& track, bool automatic = false);
    [[nodiscard]] bool isInputAutomatic(unsigned input) const;
    /// How many inputs are wired automatically.
    [[nodiscard]] unsigned getNumAutomaticInputs() const;
    /// True for an effect whose inputs are what they name and nothing else; false for a transition, whose
    /// unwired inputs are its neighbours.
    [[nodiscard]] bool hasExplicitInputs() const { return m_explicitInputs; }
    /// @}

    /// \name Compound effects: a chain of nodes that were applied as one
    /// @{
    /// The other nodes of the compound effect that this node is the head of, in the order in which they lie
    /// behind it; empty for any other node.
    [[nodiscard]] std::span<const IdStamp> getCompoundMembers() const { return m_members; }
    [[nodiscard]] bool isCompoundEffectHead() const { return !m_members.empty(); }
    /// False, changing nothing, for more than `kMostMembers`, a null stamp, one that stands twice, or the node's
    /// own.
    bool setCompoundMembers(std::span<const IdStamp> members);
    /// @}

    /// The event becomes the part [from, to) of one that was `length` long, all in seconds from its start: what
    /// depends on time looks in that part as it did. Does nothing to an opaque node.
    virtual void keepSpan(double from, double to, double length);

    /// \name Streaming
    /// @{
    [[nodiscard]] const char* layerName() const override { return m_forms.back()->name; }
    [[nodiscard]] const char* shortLayerName() const override { return m_forms.back()->shortName; }
    [[nodiscard]] uint8_t revisionMajor() const override { return m_major; }
    [[nodiscard]] uint8_t revisionMinor() const override { return m_minor; }
    void revisionMajor(uint8_t major) override { m_major = major; }
    void revisionMinor(uint8_t minor) override { m_minor = minor; }
    [[nodiscard]] std::span<const Form* const> subLayers() const override {
        return m_forms.first(m_forms.size() - 1);
    }
    void pack(PStream& stream) const override;
    void unpack(PStream& stream) override;
    void STRM_layerPack(size_t layer, PStream& stream) const override;
    void STRM_layerUnpack(size_t layer, uint8_t major, uint8_t minor, PStream& stream) override;
    /// @}

    /// Stamps of inputs and members, reserved ones left out.
    void listReferences(Vector<IdStamp>& stamps) const override;
    void renameReferences(const StampMap& renamed) override;

    /// The layer of this class.
    static const Form kNodeForm;

protected:
    /// `forms` are those of the class's layers, base first, and live as long as the program.
    explicit FXGraphNodeBase(std::span<const Form* const> forms);
    FXGraphNodeBase(const FXGraphNodeBase&) = default;
    FXGraphNodeBase& operator=(const FXGraphNodeBase&) = delete;

    struct Input {
        IdStamp track;
        bool automatic = false;
        bool operator==(const Input&) const = default;
    };
    /// Makes the node one of a kind, with unwired inputs.
    void setKind(const TagTypeId& type, unsigned numInputs, unsigned numAutomatic, bool explicitInputs);
    /// Notes a change for the bag.
    void touch() { setTagChanged(true); }
    /// The name that the kind gives; empty for an unknown one.
    [[nodiscard]] virtual std::string_view kindName() const;

private:
    std::span<const Form* const> m_forms;
    TagTypeId m_type;
    String m_name;
    std::vector<Input> m_inputs;
    std::vector<IdStamp> m_members;
    bool m_explicitInputs = true;
    uint8_t m_major;
    uint8_t m_minor;
};

/// A tag of an effect node. It differs from `Tag` only in that `T` is one.
template <typename T>
class FxTag : public Tag<T> {
public:
    using Tag<T>::Tag;
    FxTag(const Tag<T>& other) : Tag<T>(other) {
        static_assert(std::derived_from<T, FXGraphNodeBase>, "tags of effects are of effect nodes");
    }
};
