#pragma once

#include "platform/effects/effect_instance.h"
#include "platform/effects/wipe.h"

/// The effects that are more than a row of the table of kinds. Each keeps what it knows in its parameters, so
/// that they can be listed and set like those of any other effect.

/// The wipe of earlier releases. Its pattern is a code in an older numbering.
class QM_API DissolveWipeEffect : public EffectInstance {
public:
    [[nodiscard]] WipePattern getPattern() const;
    void setPattern(WipePattern pattern);
    [[nodiscard]] std::unique_ptr<Streamable> clone(BuilderType type = BuilderType::Copy) const override;

private:
    friend struct EffectClasses;
    DissolveWipeEffect();
};

/// The wipe: one picture gives way to another along an edge that moves in a pattern.
class QM_API TextureWipeEffect : public EffectInstance {
public:
    /// The pattern that is drawn: a plain wipe for a code that is not of the standard.
    [[nodiscard]] Wipe::Patterns::Pattern getPattern() const;
    /// The code as it was set or read.
    [[nodiscard]] uint32_t getPatternCode() const;
    [[nodiscard]] Wipe_Direction getDirection() const;
    void setPattern(Wipe::Patterns::Pattern pattern, Wipe_Direction direction = Wipe_Direction::Forward);
    /// A code as a list gives it, known or not.
    void setPatternCode(uint32_t code);
    [[nodiscard]] std::unique_ptr<Streamable> clone(BuilderType type = BuilderType::Copy) const override;

private:
    friend struct EffectClasses;
    TextureWipeEffect();
};

/// A title that is kept in a file of its own; also the roll, crawl and static titles of earlier releases.
class QM_API InscriberTitleEffect : public EffectInstance {
public:
    [[nodiscard]] String getICGFileName() const;
    /// False, changing nothing, for a path that no parameter can hold.
    bool setICGFileName(std::string_view path);
    [[nodiscard]] std::unique_ptr<Streamable> clone(BuilderType type = BuilderType::Copy) const override;

private:
    friend struct EffectClasses;
    InscriberTitleEffect();
};

/// An effect that a plug-in does. Its parameters are those that were set, whatever their names.
class QM_API PlugInEffect : public EffectInstance {
public:
    /// The identifier of the plug-in: what follows the family's prefix and a backslash.
    [[nodiscard]] std::string_view getPlugInId() const;
    [[nodiscard]] std::unique_ptr<Streamable> clone(BuilderType type = BuilderType::Copy) const override;

private:
    friend struct EffectClasses;
    PlugInEffect();
};

/// An effect that another application does, with a file that this application made for it.
class QM_API ExternalAppEffect : public EffectInstance {
public:
    /// The name of the application: what follows the family's prefix and a backslash.
    [[nodiscard]] std::string_view getApplication() const;
    /// The path of its project or composition; empty if there is none.
    [[nodiscard]] String getProjectFile() const;
    bool setProjectFile(std::string_view path);
    [[nodiscard]] std::unique_ptr<Streamable> clone(BuilderType type = BuilderType::Copy) const override;

private:
    friend struct EffectClasses;
    ExternalAppEffect();
};
