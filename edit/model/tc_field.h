#pragma once

#include "edit/model/data_field.h"

/// A time in seconds as a field of a record; always finite. Text form: a line with a decimal number that
/// reads back as the same bits, whatever the locale. Packed form: a double. Both live in files: do not
/// change them.
class QM_API tc_field : public data_field {
public:
    tc_field() = default;

    [[nodiscard]] double get() const { return m_time; }
    /// False, changing nothing, for a time that is not finite.
    bool set(double seconds);

    [[nodiscard]] static constexpr uint8_t currentBuildRevision() { return 1; }

    bool read(std::ifstream* file) override;
    bool write(std::ofstream* file) const override;
    void pack(PStream& stream) const override;
    void unpack(PStream& stream, unsigned revision) override;

private:
    double m_time = 0;
};
