#pragma once

#include "edit/model/data_field.h"
#include "platform/base/qx_string.h"

/// A text as a field of a record. Text form: a line with the length in bytes, a blank and "0", then the text
/// and a line end; the text may hold line ends itself. Packed form: a string. Both live in files: do not
/// change them.
class QM_API strp_field : public data_field {
public:
    /// The longest text that is read, in bytes.
    static constexpr uint32_t kMaxLength = 1 << 20;

    strp_field() = default;
    explicit strp_field(String text) : m_text(std::move(text)) {}

    [[nodiscard]] const String& get() const { return m_text; }
    /// A text beyond `kMaxLength` is cut there, at the end of a character.
    void set(String text);

    [[nodiscard]] static constexpr uint8_t currentBuildRevision() { return 1; }

    bool read(std::ifstream* file) override;
    bool write(std::ofstream* file) const override;
    void pack(PStream& stream) const override;
    void unpack(PStream& stream, unsigned revision) override;

private:
    String m_text;
};
