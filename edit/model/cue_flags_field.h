#pragma once

#include "edit/model/data_field.h"

/// The flag word of a cue. Text form: eight lower-case hexadecimal digits and a line end; reading takes one
/// line of at most 1024 characters. Packed form: a signed 32-bit value. Both live in files: do not change
/// them.
class QM_API cue_flags_field : public data_field {
public:
    cue_flags_field() = default;
    explicit cue_flags_field(uint32_t flags) : m_flags(flags) {}

    [[nodiscard]] uint32_t get() const { return m_flags; }
    void set(uint32_t flags) { m_flags = flags; }
    /// True if every bit of `bits` is set.
    [[nodiscard]] bool has(uint32_t bits) const { return (m_flags & bits) == bits; }
    void set(uint32_t bits, bool on) { m_flags = on ? m_flags | bits : m_flags & ~bits; }

    [[nodiscard]] static constexpr uint8_t currentBuildRevision() { return 1; }

    bool read(std::ifstream* file) override;
    bool write(std::ofstream* file) const override;
    void pack(PStream& stream) const override;
    void unpack(PStream& stream, unsigned revision) override;

private:
    uint32_t m_flags = 0;
};
